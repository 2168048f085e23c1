#include "Render/ModelObject.h"

#include <cassert>
#include <cstdint>
#include <cstring>

#include "Render/GL.h"

namespace vi {

// Drawables point straight into the file's bytes as float and unsigned short
// arrays, so the buffer must be at least 4-byte aligned. It is: std::vector<char>
// takes its storage from the global operator new, whose result is aligned to
// __STDCPP_DEFAULT_NEW_ALIGNMENT__, and every array in the format starts at a
// multiple of 4 bytes from the start (the indices at a multiple of 2).
static_assert(__STDCPP_DEFAULT_NEW_ALIGNMENT__ >= alignof(float), "model buffers are used in place as float arrays");

namespace {

const unsigned int kHeaderSize = 8;

// The header's two little-endian words, read without assuming anything of the
// buffer beyond its bytes.
unsigned int headerWord(const char* buffer, unsigned int index) {
    std::uint32_t word;
    std::memcpy(&word, buffer + 4 * index, sizeof(word));
    return word;
}

}  // namespace

ModelObject::ModelObject() {}

ModelObject::ModelObject(const std::string& name) { load(name); }

void ModelObject::load(const std::string& name) { File::load(name + ".bin"); }

bool ModelObject::fillDrawable(Drawable& drawable) {
    const char* buffer = getBuffer();
    assert(reinterpret_cast<std::uintptr_t>(buffer) % alignof(float) == 0);
    // The counts are trusted: a file shorter than they say is read past its end.
    unsigned int vertexCount = headerWord(buffer, 0);
    unsigned int indexCount = headerWord(buffer, 1);

    drawable.vertexCount = vertexCount;
    drawable.positions = reinterpret_cast<const float*>(buffer + kHeaderSize);
    drawable.normals = reinterpret_cast<const float*>(buffer + kHeaderSize + 12 * vertexCount);
    drawable.texCoords = reinterpret_cast<const float*>(buffer + kHeaderSize + 24 * vertexCount);
    if (indexCount != 0) {
        drawable.indices = reinterpret_cast<const unsigned short*>(buffer + kHeaderSize + 32 * vertexCount);
        drawable.elementCount = indexCount;
    } else {
        // No index array: the vertices are drawn as a plain triangle list.
        drawable.indices = nullptr;
        drawable.elementCount = vertexCount;
    }
    drawable.mode = GL_TRIANGLES;
    // Positions and normals are uploaded at every draw so that a later scale()
    // shows at once; texture coordinates never change, so they go up once.
    drawable.positionsStatic = false;
    drawable.normalsStatic = false;
    drawable.texCoordsStatic = true;
    return true;
}

void ModelObject::scale(float factor) {
    if (mData.size() < kHeaderSize) return;
    char* buffer = getBuffer();
    unsigned int vertexCount = headerWord(buffer, 0);
    float* positions = reinterpret_cast<float*>(buffer + kHeaderSize);
    for (unsigned int i = 0; i < 3 * vertexCount; ++i) positions[i] *= factor;
}

}  // namespace vi
