#include "Render/ModelObject.h"

#include <cassert>
#include <cstdint>
#include <cstring>

#include "Render/GL.h"
#include "Render/ModelLayout.h"

namespace vi {

// Drawables point straight into the file's bytes as float and unsigned short
// arrays, so the buffer must be at least 4-byte aligned. It is: std::vector<char>
// takes its storage from the global operator new, whose result is aligned to
// __STDCPP_DEFAULT_NEW_ALIGNMENT__, and every array in the format starts at a
// multiple of 4 bytes from the start (the indices at a multiple of 2).
static_assert(__STDCPP_DEFAULT_NEW_ALIGNMENT__ >= alignof(float), "model buffers are used in place as float arrays");

namespace {

// A header count, read without assuming anything of the buffer beyond its bytes.
unsigned int headerWord(const char* buffer, std::uint64_t offset) {
    std::uint32_t word;
    std::memcpy(&word, buffer + offset, sizeof(word));
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
    unsigned int vertexCount = headerWord(buffer, ModelLayout::kVertexCountOffset);
    unsigned int indexCount = headerWord(buffer, ModelLayout::kIndexCountOffset);

    drawable.vertexCount = vertexCount;
    drawable.positions = reinterpret_cast<const float*>(buffer + ModelLayout::positionsOffset(vertexCount));
    drawable.normals = reinterpret_cast<const float*>(buffer + ModelLayout::normalsOffset(vertexCount));
    drawable.texCoords = reinterpret_cast<const float*>(buffer + ModelLayout::texCoordsOffset(vertexCount));
    if (indexCount != 0) {
        drawable.indices = reinterpret_cast<const unsigned short*>(buffer + ModelLayout::indicesOffset(vertexCount));
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
    if (mData.size() < ModelLayout::kHeaderSize) return;
    char* buffer = getBuffer();
    unsigned int vertexCount = headerWord(buffer, ModelLayout::kVertexCountOffset);
    float* positions = reinterpret_cast<float*>(buffer + ModelLayout::positionsOffset(vertexCount));
    for (unsigned int i = 0; i < 3 * vertexCount; ++i) positions[i] *= factor;
}

}  // namespace vi
