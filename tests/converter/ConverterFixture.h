#pragma once

// What the converter tests set up: a private directory for meshes and model
// files, the tool run as a separate process with its status and both output
// streams, and a decoder of model files that reads them as the runtime does
// (offsets computed from V and I, not from the tool's own code).

#include <sys/wait.h>

#include <cstdint>
#include <cstdlib>
#include <cstring>
#include <filesystem>
#include <fstream>
#include <iterator>
#include <sstream>
#include <string>
#include <vector>

#include <glm/glm.hpp>
#include <gtest/gtest.h>

namespace vitest {

class ConverterScratch {
public:
    ConverterScratch() {
        char pattern[] = "/tmp/vi-modelconv-XXXXXX";
        mPath = mkdtemp(pattern);
    }
    ~ConverterScratch() { std::filesystem::remove_all(mPath); }

    ConverterScratch(const ConverterScratch&) = delete;
    ConverterScratch& operator=(const ConverterScratch&) = delete;

    std::string pathOf(const std::string& name) const { return mPath + "/" + name; }

    void write(const std::string& name, const std::string& text) const {
        std::ofstream out(pathOf(name), std::ios::binary);
        out << text;
    }
    void writeBytes(const std::string& name, const std::vector<std::uint8_t>& bytes) const {
        std::ofstream out(pathOf(name), std::ios::binary);
        out.write(reinterpret_cast<const char*>(bytes.data()), std::streamsize(bytes.size()));
    }
    std::vector<std::uint8_t> read(const std::string& name) const {
        std::ifstream in(pathOf(name), std::ios::binary);
        return std::vector<std::uint8_t>(std::istreambuf_iterator<char>(in), std::istreambuf_iterator<char>());
    }
    bool exists(const std::string& name) const { return std::filesystem::exists(pathOf(name)); }

    // Every entry of the directory, so a test can see that nothing was left behind.
    std::vector<std::string> entries() const {
        std::vector<std::string> names;
        for (const auto& entry : std::filesystem::directory_iterator(mPath))
            names.push_back(entry.path().filename().string());
        return names;
    }

private:
    std::string mPath;
};

struct ToolRun {
    int status = -1;
    std::string out;
    std::string err;
};

inline std::string quote(const std::string& text) {
    std::string quoted = "'";
    for (char c : text) quoted += c == '\'' ? std::string("'\\''") : std::string(1, c);
    return quoted + "'";
}

inline std::string slurp(const std::string& path) {
    std::ifstream in(path);
    return std::string(std::istreambuf_iterator<char>(in), std::istreambuf_iterator<char>());
}

// Runs the real executable; the scratch directory takes its two streams.
inline ToolRun runTool(const ConverterScratch& scratch, const std::vector<std::string>& arguments) {
    std::string command = quote(VI_MODELCONV_PATH);
    for (const std::string& argument : arguments) command += " " + quote(argument);
    const std::string outPath = scratch.pathOf(".stdout"), errPath = scratch.pathOf(".stderr");
    command += " >" + quote(outPath) + " 2>" + quote(errPath);
    ToolRun run;
    int raw = std::system(command.c_str());
    run.status = WIFEXITED(raw) ? WEXITSTATUS(raw) : -1;
    run.out = slurp(outPath);
    run.err = slurp(errPath);
    std::filesystem::remove(outPath);
    std::filesystem::remove(errPath);
    return run;
}

// A model file read the way the runtime reads it.
struct DecodedModel {
    std::uint32_t vertexCount = 0;
    std::uint32_t indexCount = 0;
    std::vector<glm::vec3> positions;
    std::vector<glm::vec3> normals;
    std::vector<glm::vec2> texCoords;
    std::vector<std::uint16_t> indices;
};

inline std::uint32_t u32At(const std::vector<std::uint8_t>& bytes, std::size_t offset) {
    return std::uint32_t(bytes[offset]) | std::uint32_t(bytes[offset + 1]) << 8 |
           std::uint32_t(bytes[offset + 2]) << 16 | std::uint32_t(bytes[offset + 3]) << 24;
}

inline float floatAt(const std::vector<std::uint8_t>& bytes, std::size_t offset) {
    std::uint32_t bits = u32At(bytes, offset);
    float value;
    std::memcpy(&value, &bits, 4);
    return value;
}

// Fails the test (and returns false) when the size does not match 8 + 32 V + 2 I.
inline bool decode(const std::vector<std::uint8_t>& bytes, DecodedModel& model) {
    if (bytes.size() < 8) {
        ADD_FAILURE() << "model file of " << bytes.size() << " bytes";
        return false;
    }
    model.vertexCount = u32At(bytes, 0);
    model.indexCount = u32At(bytes, 4);
    const std::size_t v = model.vertexCount;
    if (bytes.size() != 8 + 32 * v + 2 * std::size_t(model.indexCount)) {
        ADD_FAILURE() << "size " << bytes.size() << " for V " << v << " I " << model.indexCount;
        return false;
    }
    for (std::size_t i = 0; i < v; ++i) {
        model.positions.emplace_back(floatAt(bytes, 8 + 12 * i), floatAt(bytes, 12 + 12 * i),
                                     floatAt(bytes, 16 + 12 * i));
        model.normals.emplace_back(floatAt(bytes, 8 + 12 * v + 12 * i), floatAt(bytes, 12 + 12 * v + 12 * i),
                                   floatAt(bytes, 16 + 12 * v + 12 * i));
        model.texCoords.emplace_back(floatAt(bytes, 8 + 24 * v + 8 * i), floatAt(bytes, 12 + 24 * v + 8 * i));
    }
    for (std::size_t i = 0; i < model.indexCount; ++i)
        model.indices.push_back(std::uint16_t(bytes[8 + 32 * v + 2 * i] | bytes[9 + 32 * v + 2 * i] << 8));
    return true;
}

// A cube of side 2 around the origin with one uv square per face and outward normals.
inline std::string cubeObj(bool withUv) {
    std::ostringstream obj;
    obj << "o cube\n"
           "v -1 -1 -1\nv 1 -1 -1\nv 1 1 -1\nv -1 1 -1\nv -1 -1 1\nv 1 -1 1\nv 1 1 1\nv -1 1 1\n";
    if (withUv) obj << "vt 0 0\nvt 1 0\nvt 1 1\nvt 0 1\n";
    obj << "vn 0 0 -1\nvn 0 0 1\nvn -1 0 0\nvn 1 0 0\nvn 0 -1 0\nvn 0 1 0\n";
    const int faces[6][4] = {{1, 4, 3, 2}, {5, 6, 7, 8}, {1, 5, 8, 4}, {2, 3, 7, 6}, {1, 2, 6, 5}, {4, 8, 7, 3}};
    const int uv[4] = {1, 2, 3, 4};
    for (int f = 0; f < 6; ++f) {
        obj << "f";
        for (int c = 0; c < 4; ++c) {
            obj << " " << faces[f][c] << "/";
            if (withUv) obj << uv[c];
            obj << "/" << f + 1;
        }
        obj << "\n";
    }
    return obj.str();
}

// An n x n grid of distinct vertices (each with its own uv) in the plane z = 0.
inline std::string gridObj(int n) {
    std::ostringstream obj;
    for (int y = 0; y < n; ++y)
        for (int x = 0; x < n; ++x) obj << "v " << x << " " << y << " 0\n";
    for (int y = 0; y < n; ++y)
        for (int x = 0; x < n; ++x) obj << "vt " << float(x) / float(n - 1) << " " << float(y) / float(n - 1) << "\n";
    obj << "vn 0 0 1\n";
    for (int y = 0; y + 1 < n; ++y)
        for (int x = 0; x + 1 < n; ++x) {
            int a = y * n + x + 1, b = a + 1, c = a + n, d = c + 1;
            obj << "f " << a << "/" << a << "/1 " << b << "/" << b << "/1 " << d << "/" << d << "/1\n";
            obj << "f " << a << "/" << a << "/1 " << d << "/" << d << "/1 " << c << "/" << c << "/1\n";
        }
    return obj.str();
}

}  // namespace vitest
