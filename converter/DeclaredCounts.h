#pragma once

// Some mesh formats declare their element counts in a text header (OFF and
// PLY), and the importer reserves room for that many before it reads one
// element: a file of a few hundred bytes that declares trillions costs the
// machine's memory before the importer finds it short. Every element takes
// bytes in the file (in text at least a digit and a separator for each of
// its values; in binary its values' sizes), so a file far shorter than its
// declared elements need cannot be real, and is refused before the import.

#include <cstdint>
#include <string>
#include <vector>

namespace vi {

class DeclaredCounts {
public:
    // False, with a message saying what the file declares and holds, when the
    // file at path is OFF or PLY and far too short for its counts. True for a file
    // that fits them, a file of another format, or one that cannot be read
    // (the importer says why).
    static bool fit(const std::string& path, std::string& error);

private:
    // The same for a file's first bytes (up to its end of header) and its length.
    static bool fit(const std::string& head, std::uint64_t fileSize, std::string& error);

    struct Element {
        std::string name;
        std::uint64_t count;
        std::uint64_t minimumBytes;  // one element's smallest size in the file
    };

    static bool readOff(const std::string& head, std::vector<Element>& elements);
    static bool readPly(const std::string& head, std::vector<Element>& elements, std::uint64_t& headerSize);
};

}  // namespace vi
