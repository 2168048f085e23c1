#pragma once

// A ceiling on the converter's memory in proportion to its input. A file
// whose declared sizes cannot be real, in a format the header check does not
// know, makes the importer allocate for them; under the ceiling that ends at
// once in a failed allocation, which the importer turns into an error,
// instead of in the machine's memory. Set by the tool's main only: the
// tests' own processes keep their limits.

#include <cstdint>
#include <string>

namespace vi {

class MemoryCeiling {
public:
    // Room for the importer's work on any model the runtime can draw (at most
    // 65536 vertices, from files of a few tens of megabytes), plus room for
    // what a large file carries besides its mesh (embedded images, animations).
    static constexpr std::uint64_t kBaseBytes = std::uint64_t(2) << 30;
    static constexpr std::uint64_t kBytesPerInputByte = 16;

    static std::uint64_t forInput(std::uint64_t inputBytes);

    // Lowers the process's address-space limit to forInput() of the file's
    // size; keeps a lower limit already set. Does nothing in a sanitizer
    // build, whose run time reserves terabytes of address space up front.
    static void apply(const std::string& inputPath);

    // The address-space limit in force; 0 when there is none.
    static std::uint64_t current();
};

}  // namespace vi
