#pragma once

// What the converter tests set up: a private directory for meshes and model
// files, the tool run as a separate process with its status and both output
// streams, and a decoder of model files that reads them as the runtime does
// (offsets computed from V and I, not from the tool's own code).

#include <sys/wait.h>

#include <cstdint>
#include <cstdlib>
#include <cstring>
#include <sstream>
#include <string>
#include <vector>

#include <glm/glm.hpp>
#include <gtest/gtest.h>

#include "Scratch.h"

namespace vitest {

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

// Runs the real executable; the scratch directory takes its two streams.
inline ToolRun runTool(const ScratchDirectory& scratch, const std::vector<std::string>& arguments) {
    std::string command = VI_MODELCONV_EMULATOR " " + quote(VI_MODELCONV_PATH);
    for (const std::string& argument : arguments) command += " " + quote(argument);
    command += " >" + quote(scratch.pathOf(".stdout")) + " 2>" + quote(scratch.pathOf(".stderr"));
    ToolRun run;
    int raw = std::system(command.c_str());
    run.status = WIFEXITED(raw) ? WEXITSTATUS(raw) : -1;
    const std::vector<char> out = scratch.read(".stdout"), err = scratch.read(".stderr");
    run.out.assign(out.begin(), out.end());
    run.err.assign(err.begin(), err.end());
    std::filesystem::remove(scratch.pathOf(".stdout"));
    std::filesystem::remove(scratch.pathOf(".stderr"));
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
