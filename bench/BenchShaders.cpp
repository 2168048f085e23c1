#include "BenchShaders.h"

namespace vibench {

const char* const kQuadVertex =
    "attribute vec2 aPosition;\n"
    "attribute vec2 aTexCoord;\n"
    "uniform vec2 uOffset;\n"
    "varying vec2 vTexCoord;\n"
    "void main() {\n"
    "    vTexCoord = aTexCoord;\n"
    "    gl_Position = vec4(aPosition + uOffset, 0.0, 1.0);\n"
    "}\n";

const char* const kQuadFragment =
    "precision mediump float;\n"
    "uniform sampler2D uTexture;\n"
    "varying vec2 vTexCoord;\n"
    "void main() { gl_FragColor = texture2D(uTexture, vTexCoord); }\n";

// Small weights keep every uniform active without changing the picture much;
// a multiplication by zero would let the compiler drop the uniform.
const char* const kMeshVertex =
    "attribute vec3 aPosition;\n"
    "attribute vec3 aNormal;\n"
    "attribute vec2 aTexCoord;\n"
    "uniform mat4 uModelMatrix;\n"
    "uniform mat4 uViewMatrix;\n"
    "uniform mat3 uNormalMatrix;\n"
    "uniform mat4 uProjectionMatrix;\n"
    "uniform mat4 uModelViewProjectionMatrix;\n"
    "uniform float uTime;\n"
    "varying vec2 vTexCoord;\n"
    "varying vec3 vNormal;\n"
    "varying float vDepth;\n"
    "void main() {\n"
    "    vec4 eye = uViewMatrix * uModelMatrix * vec4(aPosition, 1.0);\n"
    "    vDepth = (uProjectionMatrix * eye).w * 0.01;\n"
    "    vNormal = uNormalMatrix * aNormal;\n"
    "    vTexCoord = aTexCoord + vec2(uTime * 0.01, 0.0);\n"
    "    gl_Position = uModelViewProjectionMatrix * vec4(aPosition, 1.0);\n"
    "}\n";

const char* const kMeshFragment =
    "precision mediump float;\n"
    "uniform sampler2D uTexture;\n"
    "uniform float uOpacity;\n"
    "uniform vec4 uTint;\n"
    "varying vec2 vTexCoord;\n"
    "varying vec3 vNormal;\n"
    "varying float vDepth;\n"
    "void main() {\n"
    "    float light = 0.5 + 0.5 * normalize(vNormal).z;\n"
    "    vec4 colour = texture2D(uTexture, vTexCoord) * uTint;\n"
    "    gl_FragColor = vec4(colour.rgb * light + vec3(vDepth), colour.a * uOpacity);\n"
    "}\n";

}  // namespace vibench
