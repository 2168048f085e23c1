#pragma once

// The model file the runtime reads in place (its layout: Render/ModelLayout.h).
// encode() and inspect() are exact inverses for well-formed files; inspect()
// also finds what the runtime would not: a size that does not match the
// counts, an index count that is not a multiple of three, an index past V.

#include <cstdint>
#include <string>
#include <vector>

#include <glm/glm.hpp>

#include "MeshData.h"
#include "Render/ModelLayout.h"

namespace vi {

class ModelFile {
public:
    struct Info {
        std::uint32_t vertexCount = 0;
        std::uint32_t indexCount = 0;
        std::uint64_t fileSize = 0;
        std::uint64_t expectedSize = 0;
        glm::vec3 boundsMin = glm::vec3(0.0f);
        glm::vec3 boundsMax = glm::vec3(0.0f);
        // Triangles the runtime draws: I / 3, or V / 3 for a file without indices.
        std::uint32_t triangleCount() const { return indexCount != 0 ? indexCount / 3 : vertexCount / 3; }
    };

    // The file's bytes. The mesh must already fit 16-bit indices.
    static std::vector<std::uint8_t> encode(const MeshData& mesh);

    // Reads the counts and bounds and checks the file against them. Returns
    // false with a message naming the first problem found.
    static bool inspect(const std::vector<std::uint8_t>& bytes, Info& info, std::string& error);

    enum Verdict {
        Valid,
        Invalid,     // error: what is wrong with it, without its name
        Unreadable,  // error: why it cannot be read, with its name
    };
    // inspect() for a file on disk, which is read whole only when its length
    // matches its counts: one implementation for the converter's checks and
    // the desktop hosts' look at an effect's assets.
    static Verdict check(const std::string& path, Info& info, std::string& error);

    // Writes to a temporary file beside `path` and renames it over `path` only
    // once every byte is written, so a failure leaves no partial model behind.
    static bool writeAtomically(const std::string& path, const std::vector<std::uint8_t>& bytes,
                                std::string& error);

    static bool readWhole(const std::string& path, std::vector<std::uint8_t>& bytes, std::string& error);

private:
    // The two halves of inspect(): the 8-byte header's counts against the
    // file's length, then the indices and positions of a file of that length.
    static bool checkCounts(const std::uint8_t* header, std::uint64_t fileSize, Info& info, std::string& error);
    static bool checkContents(const std::vector<std::uint8_t>& bytes, Info& info, std::string& error);
};

}  // namespace vi
