#include "UnboundNameWarnings.h"

#include <GLES2/gl2.h>
#include <GLES2/gl2ext.h>

#include <algorithm>
#include <set>
#include <vector>

#include "CrashPlace.h"
#include "Render/ShaderProgram.h"

namespace {

using Kind = vi::UnboundNames::Kind;

JavaVM* gJavaVm = nullptr;
jclass gMisspellings = nullptr;
jmethodID gUnbound = nullptr;
// Kind, name and the program's two sources: a program is the same one when
// its scene is made again, so a restart does not tell its names twice.
std::set<std::string> gTold;

const char* kindName(Kind kind) {
    switch (kind) {
        case Kind::Attribute: return "attribute";
        case Kind::Uniform: return "uniform";
        case Kind::Sampler: return "sampler";
    }
    return "";
}

bool isSampler(GLenum type) {
    return type == GL_SAMPLER_2D || type == GL_SAMPLER_CUBE || type == GL_SAMPLER_EXTERNAL_OES;
}

// The program's active names of the kind, sorted. The compiler removes what
// the shaders declare and never use, so those are not among them. An array
// is listed under the name an effect binds it by, without its "[0]".
std::vector<std::string> activeNames(GLuint program, Kind kind) {
    const bool attributes = kind == Kind::Attribute;
    GLint count = 0;
    GLint longest = 0;
    glGetProgramiv(program, attributes ? GL_ACTIVE_ATTRIBUTES : GL_ACTIVE_UNIFORMS, &count);
    glGetProgramiv(program, attributes ? GL_ACTIVE_ATTRIBUTE_MAX_LENGTH : GL_ACTIVE_UNIFORM_MAX_LENGTH, &longest);
    std::vector<char> buffer(std::size_t(longest) + 1);
    std::vector<std::string> names;
    for (GLint index = 0; index < count; ++index) {
        GLsizei length = 0;
        GLint size = 0;
        GLenum type = 0;
        if (attributes) {
            glGetActiveAttrib(program, GLuint(index), GLsizei(buffer.size()), &length, &size, &type, buffer.data());
        } else {
            glGetActiveUniform(program, GLuint(index), GLsizei(buffer.size()), &length, &size, &type, buffer.data());
            if (isSampler(type) != (kind == Kind::Sampler)) continue;
        }
        std::string name(buffer.data(), std::size_t(length));
        if (name.size() > 3 && name.compare(name.size() - 3, 3, "[0]") == 0) name.resize(name.size() - 3);
        names.push_back(name);
    }
    std::sort(names.begin(), names.end());
    return names;
}

}  // namespace

// Without the class or its method (a jar of another version) nothing is told;
// the exception is left for the caller to see.
void UnboundNameWarnings::listen(JNIEnv* env) {
    jclass misspellings = env->FindClass("com/tarq/vi/player/Misspellings");
    if (!misspellings) return;
    gUnbound = env->GetStaticMethodID(misspellings, "unbound",
                                      "(Ljava/lang/String;Ljava/lang/String;Ljava/lang/String;[Ljava/lang/String;)V");
    if (!gUnbound) return;
    env->GetJavaVM(&gJavaVm);
    gMisspellings = static_cast<jclass>(env->NewGlobalRef(misspellings));
    vi::UnboundNames::listen(onUnbound);
}

void UnboundNameWarnings::forget() { gTold.clear(); }

void UnboundNameWarnings::onUnbound(const vi::ShaderProgram& program, Kind kind, const std::string& name) {
    JNIEnv* env = nullptr;
    if (gJavaVm->GetEnv(reinterpret_cast<void**>(&env), JNI_VERSION_1_6) != JNI_OK || env->ExceptionCheck()) return;
    // A program of a lost context, not yet rebuilt (an initialisation right
    // after the context changed binds its stale name): nothing is found in
    // it, and that says nothing of the names.
    if (!glIsProgram(program.program)) return;
    const std::string told =
        std::string(kindName(kind)) + '\n' + name + '\n' + program.vertexSource + '\n' + program.fragmentSource;
    if (!gTold.insert(told).second) return;
    // Where the effect added the name: its first frame on the stack in the author's sources.
    CrashPlace::Detail place;
    if (!CrashPlace::describe(uintptr_t(__builtin_return_address(0)), 0, place)) place.clear();

    const std::vector<std::string> active = activeNames(program.program, kind);
    if (env->PushLocalFrame(jint(active.size()) + 8) != 0) return;
    jobjectArray names = env->NewObjectArray(jsize(active.size()), env->FindClass("java/lang/String"), nullptr);
    for (std::size_t index = 0; index < active.size(); ++index)
        env->SetObjectArrayElement(names, jsize(index), env->NewStringUTF(active[index].c_str()));
    env->CallStaticVoidMethod(gMisspellings, gUnbound, env->NewStringUTF(kindName(kind)),
                              env->NewStringUTF(name.c_str()), env->NewStringUTF(place.data), names);
    // A warning that could not be printed is no reason to disturb the effect.
    env->ExceptionClear();
    env->PopLocalFrame(nullptr);
}
