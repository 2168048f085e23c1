// An effect that makes one author's mistake as it starts, chosen at build
// time: MISTAKE_SHADER (a fragment shader that does not compile),
// MISTAKE_LINK (a varying the vertex shader never writes), MISTAKE_ASSET or
// MISTAKE_FILE (the name of an asset or a file to read), MISTAKE_NAMES (an
// attribute, a uniform and a sampler misspelt, by three renderers, two of
// them of one program, beside names a renderer binds by itself); or as it draws its
// first frame: MISTAKE_NULL_WRITE (a write through a null member, in a
// function of the standard library), MISTAKE_NULL_CALL (a call through one),
// MISTAKE_RECURSION (one that does not end) or MISTAKE_ABORT. Without one it draws a colour, for as long as the host lets it.
#include <GLES2/gl2.h>

#include <algorithm>
#include <cstdlib>
#include <string>

#include "Application/Scene.h"
#include "Render/Renderer.h"
#include "Render/ShaderProgram.h"
#include "Render/Texture.h"
#include "Tools/File.h"

namespace {

// Each variant uses some of these, none all.
[[maybe_unused]] const char* const kVertex = "attribute vec4 aPosition;\nvoid main() {\n    gl_Position = aPosition;\n}\n";
[[maybe_unused]] const char* const kFragment =
#if defined(MISTAKE_SHADER)
    "precision mediump float;\nvoid main() {\n    gl_FragColor = vec4(0.2, 0.3, 0.4 1.0);\n}\n";
#else
    "precision mediump float;\nvarying vec2 vGlow;\nvoid main() {\n    gl_FragColor = vec4(vGlow, 0.4, 1.0);\n}\n";
#endif

#if defined(MISTAKE_NAMES)
const char* const kNamesVertex =
    "attribute vec4 aPosition;\nuniform float uTime;\nvoid main() {\n    gl_Position = aPosition * uTime;\n}\n";
const char* const kNamesFragment =
    "precision mediump float;\nuniform vec3 uGlow;\nuniform sampler2D uPicture;\n"
    "void main() {\n    gl_FragColor = vec4(uGlow, 1.0) * texture2D(uPicture, vec2(0.5));\n}\n";

void bindMisspelt(vi::Renderer& renderer, vi::Texture& picture, const float* values) {
    renderer.addAttribute("aPositon", values, 3, true);  // the misspelt attribute
    renderer.addUniform("uGlw", values, vi::Uniform::Float3, 1);  // the misspelt uniform
    renderer.addTexture("uPictur", &picture);  // the misspelt sampler
    renderer.addUniform("uOpacity", values, vi::Uniform::Float, 1);
    renderer.addTexture("uPicture", &picture);
}
#endif

#if defined(MISTAKE_RECURSION)
int deeper(int depth) {
    volatile char frame[256] = {char(depth)};
    return depth < 0 ? 0 : deeper(depth + 1) + frame[0];
}
#endif

class Mistake : public vi::Scene {
public:
    explicit Mistake(const int* size) : vi::Scene(size) {
#if defined(MISTAKE_SHADER) || defined(MISTAKE_LINK)
        new vi::ShaderProgram(kVertex, kFragment);
#elif defined(MISTAKE_ASSET)
        vi::File(MISTAKE_ASSET, true);
#elif defined(MISTAKE_FILE)
        vi::File(MISTAKE_FILE, false);
#elif defined(MISTAKE_NAMES)
        auto* first = new vi::ShaderProgram(kNamesVertex, kNamesFragment);
        auto* second = new vi::ShaderProgram(kNamesVertex, std::string(kNamesFragment) + "// another program\n");
        auto* picture = new vi::Texture(mPixels, 1, 1, true, false, false, false, false, 4, false);
        for (vi::ShaderProgram* program : {first, first, second})
            bindMisspelt(*new vi::Renderer(*program, *new vi::Drawable), *picture, mValues);
#endif
    }

    int draw() override {
#if defined(MISTAKE_NULL_WRITE)
        std::fill_n(mCounts, 4, 1);  // the null write
#elif defined(MISTAKE_NULL_CALL)
        mPrepare();  // the null call
#elif defined(MISTAKE_RECURSION)
        deeper(0);
#elif defined(MISTAKE_ABORT)
        std::abort();  // the abort
#endif
        glClearColor(0.2f, 0.3f, 0.4f, 1.0f);
        glClear(GL_COLOR_BUFFER_BIT);
        return 0;
    }

private:
    [[maybe_unused]] int* mCounts = nullptr;
    [[maybe_unused]] void (*mPrepare)() = nullptr;
    [[maybe_unused]] unsigned char mPixels[4] = {};
    [[maybe_unused]] float mValues[3] = {};
};

}  // namespace

extern "C" __attribute__((visibility("default"))) vi::Scene* createScene(int* size, vi::ModelsMap*, vi::TexturesMap*) {
    return new Mistake(size);
}
