#pragma once

// The model file, read in place by ModelObject and written by the converter:
// little-endian, no magic, no version, no padding.
//   u32 V, u32 I, V x 3 float positions, V x 3 float normals,
//   V x 2 float texture coordinates, I x u16 indices (I = 0: none).
// Every array starts 4-byte aligned from the start of the file.

#include <cstdint>

namespace vi {

namespace ModelLayout {

constexpr std::uint64_t kHeaderSize = 8;  // the two counts
constexpr std::uint64_t kVertexCountOffset = 0;
constexpr std::uint64_t kIndexCountOffset = 4;

constexpr std::uint64_t positionsOffset(std::uint64_t /*vertexCount*/) { return kHeaderSize; }
constexpr std::uint64_t normalsOffset(std::uint64_t vertexCount) { return kHeaderSize + 12 * vertexCount; }
constexpr std::uint64_t texCoordsOffset(std::uint64_t vertexCount) { return kHeaderSize + 24 * vertexCount; }
constexpr std::uint64_t indicesOffset(std::uint64_t vertexCount) { return kHeaderSize + 32 * vertexCount; }
constexpr std::uint64_t fileSize(std::uint64_t vertexCount, std::uint64_t indexCount) {
    return indicesOffset(vertexCount) + 2 * indexCount;
}

}  // namespace ModelLayout

}  // namespace vi
