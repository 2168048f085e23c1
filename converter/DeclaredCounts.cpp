#include "DeclaredCounts.h"

#include <cctype>
#include <fstream>
#include <limits>
#include <sstream>

namespace vi {

namespace {

constexpr std::uint64_t kMost = std::numeric_limits<std::uint64_t>::max();
// A header longer than this is left to the importer (and the memory ceiling).
constexpr std::size_t kHeadBytes = 65536;
// How many times its length a file must fall short of its counts to be refused.
constexpr std::uint64_t kShortBy = 2;
// In text every value is at least one digit and one separator.
constexpr std::uint64_t kTextValueBytes = 2;

// Counts past 64 bits saturate: they are impossible all the same.
std::uint64_t times(std::uint64_t a, std::uint64_t b) { return a != 0 && b > kMost / a ? kMost : a * b; }
std::uint64_t plus(std::uint64_t a, std::uint64_t b) { return b > kMost - a ? kMost : a + b; }

bool parseCount(const std::string& word, std::uint64_t& count) {
    if (word.empty()) return false;
    count = 0;
    for (char c : word) {
        if (!std::isdigit(static_cast<unsigned char>(c))) return false;
        count = plus(times(count, 10), std::uint64_t(c - '0'));
    }
    return true;
}

// The size of a PLY scalar type, 0 for an unknown one.
std::uint64_t plyTypeBytes(const std::string& type) {
    for (const char* name : {"char", "uchar", "int8", "uint8"})
        if (type == name) return 1;
    for (const char* name : {"short", "ushort", "int16", "uint16"})
        if (type == name) return 2;
    for (const char* name : {"int", "uint", "int32", "uint32", "float", "float32"})
        if (type == name) return 4;
    for (const char* name : {"double", "float64"})
        if (type == name) return 8;
    return 0;
}

}  // namespace

bool DeclaredCounts::fit(const std::string& path, std::string& error) {
    std::ifstream in(path, std::ios::binary | std::ios::ate);
    if (!in) return true;
    const std::uint64_t fileSize = std::uint64_t(in.tellg());
    in.seekg(0);
    std::string head(std::size_t(std::min<std::uint64_t>(fileSize, kHeadBytes)), '\0');
    in.read(&head[0], std::streamsize(head.size()));
    head.resize(std::size_t(in.gcount()));
    if (fit(head, fileSize, error)) return true;
    error = "'" + path + "' " + error;
    return false;
}

bool DeclaredCounts::fit(const std::string& head, std::uint64_t fileSize, std::string& error) {
    std::vector<Element> elements;
    std::uint64_t needed = 0;
    if (!readOff(head, elements) && !readPly(head, elements, needed)) return true;
    std::string declared;
    for (std::size_t i = 0; i < elements.size(); ++i) {
        const Element& element = elements[i];
        needed = plus(needed, times(element.count, element.minimumBytes));
        declared += (i == 0 ? "" : i + 1 == elements.size() ? " and " : ", ") + std::to_string(element.count) +
                    " " + element.name;
    }
    // A file a little short of its counts is left to the importer, which
    // reads what is there (scans whose last elements were cut off exist);
    // only counts far beyond the file cost memory that matters.
    if (needed / kShortBy <= fileSize) return true;
    error = "declares " + declared + " but holds " + std::to_string(fileSize) + " bytes, while they need " +
            (needed == kMost ? "more than 2^64" : std::to_string(needed)) + " at the least";
    return false;
}

// "[ST][C][N][4][n]OFF", the dimension after nOFF, then the vertex, face
// and edge counts; '#' starts a comment.
bool DeclaredCounts::readOff(const std::string& head, std::vector<Element>& elements) {
    std::istringstream lines(head);
    std::vector<std::string> words;
    std::string line, word;
    while (words.size() < 5 && std::getline(lines, line)) {
        std::istringstream text(line.substr(0, line.find('#')));
        while (text >> word) words.push_back(word);
    }
    const std::string keyword = words.empty() ? "" : words[0];
    if (keyword.size() < 3 || keyword.size() > 8 || keyword.compare(keyword.size() - 3, 3, "OFF") != 0) return false;
    std::uint64_t dimension = 3;
    std::size_t next = 1;
    if (keyword.size() > 3 && keyword[keyword.size() - 4] == 'n' &&
        (next >= words.size() || !parseCount(words[next++], dimension)))
        return false;
    if (keyword.find('4') != std::string::npos) ++dimension;
    std::uint64_t vertices = 0, faces = 0;
    if (next + 1 >= words.size() || !parseCount(words[next], vertices) || !parseCount(words[next + 1], faces))
        return false;
    // A face is at least its corner count.
    elements = {{"vertices", vertices, times(dimension, kTextValueBytes)}, {"faces", faces, kTextValueBytes}};
    return true;
}

// "ply", "format ascii|binary_little_endian|binary_big_endian 1.0", then
// "element NAME COUNT" lines, each followed by its "property TYPE NAME" and
// "property list COUNT_TYPE ITEM_TYPE NAME" lines, up to "end_header".
bool DeclaredCounts::readPly(const std::string& head, std::vector<Element>& elements, std::uint64_t& headerSize) {
    std::istringstream lines(head);
    std::string line;
    if (!std::getline(lines, line) || line.compare(0, 3, "ply") != 0) return false;
    bool text = true;
    while (std::getline(lines, line)) {
        std::istringstream words(line);
        std::string keyword, first, second;
        words >> keyword >> first >> second;
        if (keyword == "end_header") {
            headerSize = std::uint64_t(lines.tellg() < 0 ? head.size() : std::size_t(lines.tellg()));
            return !elements.empty();
        }
        if (keyword == "format") {
            text = first == "ascii";
        } else if (keyword == "element") {
            std::uint64_t count = 0;
            if (!parseCount(second, count)) return false;
            elements.push_back({first + (count == 1 ? " element" : " elements"), count, 0});
        } else if (keyword == "property" && !elements.empty()) {
            // A list is at least its item count.
            const std::uint64_t bytes = text ? kTextValueBytes : plyTypeBytes(first == "list" ? second : first);
            if (bytes == 0) return false;
            elements.back().minimumBytes += bytes;
        }
    }
    return false;  // no end of header within the head: the importer decides
}

}  // namespace vi
