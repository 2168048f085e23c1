// vi-modelconv run as effect authors run it: a separate process on files
// written here, judged by its status, its messages and the model file it
// leaves, read where the runtime reads it: V and I, then positions at 8,
// normals at 8 + 12 V, uv at 8 + 24 V, 16-bit indices at 8 + 32 V.
#include <sys/wait.h>
#include <unistd.h>

#include <algorithm>
#include <cstring>
#include <filesystem>
#include <fstream>
#include <functional>
#include <iterator>

#include <glm/glm.hpp>
#include <gmock/gmock.h>

namespace {
namespace fs = std::filesystem;
const fs::path kDir = fs::temp_directory_path() / ("vi-modelconv-test-" + std::to_string(getpid()));

std::string slurp(const fs::path& path) {
    std::ifstream in(path, std::ios::binary);
    return std::string(std::istreambuf_iterator<char>(in), {});
}

#if defined(VI_SANITIZED)
constexpr bool kSanitized = true;  // whose allocator reserves address space beyond any limit
#else
constexpr bool kSanitized = false;
#endif
#if defined(VI_EMULATED)
constexpr bool kEmulated = true;  // whose emulator keeps address-space limits to itself
#else
constexpr bool kEmulated = false;
#endif

// The tool's status and both its streams; under a memory limit when `limited`, so that a tool
// that believes impossible sizes fails the test instead of taking the machine's memory.
std::pair<int, std::string> run(const std::vector<std::string>& arguments, bool limited) {
    std::string command = std::string(limited ? "prlimit --as=3000000000 " : "") + VI_MODELCONV;
    for (const std::string& argument : arguments) command += " '" + argument + "'";
    const int raw = std::system((command + " >" + kDir.string() + ".log 2>&1").c_str());
    return {WIFEXITED(raw) ? WEXITSTATUS(raw) : -1, slurp(kDir.string() + ".log")};
}

struct Model {
    std::vector<glm::vec3> positions, normals;
    std::vector<glm::vec2> uvs;
    std::vector<std::uint16_t> indices;
};

// Little-endian, as on the phone.
template <class T> std::vector<T> array(const std::string& bytes, std::size_t offset, std::size_t count) {
    std::vector<T> values(count);
    std::memcpy(values.data(), bytes.data() + offset, count * sizeof(T));
    return values;
}

Model decode(const std::string& b) {
    const std::vector<std::uint32_t> counts = array<std::uint32_t>(b + std::string(8, '\0'), 0, 2);
    const std::size_t v = counts[0], i = counts[1];
    if (b.size() != 8 + 32 * v + 2 * i) {
        ADD_FAILURE() << "a model file of " << b.size() << " bytes does not match its counts";
        return Model();
    }
    return {array<glm::vec3>(b, 8, v), array<glm::vec3>(b, 8 + 12 * v, v), array<glm::vec2>(b, 8 + 24 * v, v),
            array<std::uint16_t>(b, 8 + 32 * v, i)};
}

// Every triangle turns counter-clockwise around its normals: culling keeps the front.
void expectFacingOut(const Model& m) {
    for (std::size_t k = 0; k + 2 < m.indices.size(); k += 3) {
        for (int c = 0; c < 3; ++c) ASSERT_LT(m.indices[k + c], m.positions.size());
        const glm::vec3 a = m.positions[m.indices[k]], b = m.positions[m.indices[k + 1]];
        const glm::vec3 face = glm::cross(b - a, m.positions[m.indices[k + 2]] - a);
        for (int c = 0; c < 3; ++c) EXPECT_GT(glm::dot(face, m.normals[m.indices[k + c]]), 0.0f) << k / 3;
    }
}

// A mesh kept in meshes/: cubes of side 2 around the origin with outward normals, with and without
// uv; a triangle without normals; one triangle mesh used by three glTF nodes: moved by (10, 0, 0),
// mirrored in x, and scaled by 2 inside a parent moved by (0, 5, 0).
std::string mesh(const std::string& name) { return slurp(fs::path(VI_CONVERTER_MESHES) / name); }

struct Case {
    const char* name;
    const char* extension;
    std::string input;
    std::vector<std::string> options;       // before the input; "--info" and "--check" take no output
    int status;
    const char* message;                    // in its output
    std::function<void(const Model&)> check;  // on out.bin after a success
    bool impossible = false;                // sizes that cannot be real: run under a memory limit
};

// Files whose headers declare 400 million elements in a few hundred bytes.
const std::string kTriangleOff = "OFF\n3 1 0\n0 0 0\n1 0 0\n0 1 0\n3 0 1 2\n";
const std::string kHugeOff = "OFF\n3 400000000 0\n0 0 0\n1 0 0\n0 1 0\n3 0 1 2\n";
const std::string kHugeBinaryPly = "ply\nformat binary_little_endian 1.0\nelement vertex 400000000\n"
                                   "comment not a property\nproperty float x\nproperty float y\nproperty float z\nelement face 1\n"
                                   "property list uchar int vertex_indices\nend_header\n" + std::string(52, '\0');
const std::string kHugeX = "xof 0303txt 0032\nMesh m {\n 400000000;\n 0.0;0.0;0.0;,\n 1.0;0.0;0.0;,\n"
                           " 0.0;1.0;0.0;;\n 1;\n 3;0,1,2;;\n}\n";


const Case kCases[] = {
    {"CubeWithUvGivesFourCornersAFace", ".obj", mesh("cube.obj"), {}, 0, "24 vertices", [](const Model& m) {
         ASSERT_EQ(m.positions.size(), 24u);
         EXPECT_EQ(m.indices.size(), 36u);
         for (std::size_t k = 0; k < 24; ++k) {
             EXPECT_FLOAT_EQ(glm::dot(m.positions[k], m.normals[k]), 1.0f) << "outward at " << k;
             EXPECT_TRUE(m.uvs[k] == glm::round(m.uvs[k])) << "a corner of the uv square at " << k;
         }
         expectFacingOut(m);
     }},
    {"ATriangleGetsItsMissingNormal", ".obj", mesh("triangle-without-normals.obj"), {}, 0, "", [](const Model& m) {
         EXPECT_EQ(m.positions, (std::vector<glm::vec3>{{0, 0, 0}, {2, 0, 0}, {0, 3, 0}}));
         EXPECT_EQ(m.normals, std::vector<glm::vec3>(3, glm::vec3(0, 0, 1)));
         EXPECT_EQ(m.uvs, (std::vector<glm::vec2>{{.25f, .5f}, {.75f, .5f}, {.25f, 1}}));
         EXPECT_EQ(m.indices, (std::vector<std::uint16_t>{0, 1, 2}));
     }},
    {"AMeshWithoutUvIsRefused", ".obj", mesh("cube-without-uv.obj"), {}, 1, "no texture coordinates in", nullptr},
    {"NodeTransformsApplyToEveryInstance", ".gltf", mesh("instances.gltf"), {}, 0, "", [](const Model& m) {
         EXPECT_EQ(m.indices.size(), 9u);
         for (glm::vec3 p : {glm::vec3(10, 0, 0), glm::vec3(11, 0, 0), glm::vec3(10, 1, 0), glm::vec3(-1, 0, 0),
                             glm::vec3(0, 5, 0), glm::vec3(2, 5, 0), glm::vec3(0, 7, 0)})
             EXPECT_NE(std::find(m.positions.begin(), m.positions.end(), p), m.positions.end()) << p.x << " " << p.y;
         EXPECT_EQ(m.normals, std::vector<glm::vec3>(9, glm::vec3(0, 0, 1)));  // the mirrored one too
         expectFacingOut(m);
     }},
    {"InfoRefusesHugeCountsInAShortFile", ".bin", std::string(8, '\xff') + "abc", {"--info"}, 1,
     "truncated: 11 bytes, but V = 4294967295 and I = 4294967295 need 146028888038", nullptr},
    {"CheckNamesABrokenModel", ".bin", std::string("\xe8\x03\0\0\x03\0\0\0", 8), {"--check"}, 1,
     "in.bin' cannot be a model file: the file is truncated: 8 bytes, but V = 1000 and I = 3 need 32014", nullptr},
    {"CheckFindsAnIndexPastTheLastVertex", ".bin",
     std::string("\3\0\0\0\3\0\0\0", 8) + std::string(96, '\0') + std::string("\0\0\1\0\3\0", 6), {"--check"}, 1,
     "in.bin' cannot be a model file: index 2 is 3, past the last vertex 3 - 1", nullptr},
    {"ARealOffFileFitsItsCounts", ".off", kTriangleOff, {"--generate-uv"}, 0, "3 vertices", [](const Model& m) {
         EXPECT_EQ(m.positions, (std::vector<glm::vec3>{{0, 0, 0}, {1, 0, 0}, {0, 1, 0}}));
     }},
    {"OffCountsBeyondTheFileAreRefused", ".off", kHugeOff, {}, 1,
     "in.off' declares 3 vertices and 400000000 faces but holds 44 bytes, while they need 800000018", nullptr, true},
    {"PlyCountsBeyondTheFileAreRefused", ".ply", kHugeBinaryPly, {}, 1,
     "in.ply' declares 400000000 vertex elements and 1 face element but holds 252 bytes", nullptr, true},
    {"OtherSizesThatCannotBeRealMeetTheCeiling", ".x", kHugeX, {}, 1,
     kEmulated ? "in.x' ran out of memory (" : "in.x' ran out of memory (2.1 GB allowed)", nullptr, true},
};

void PrintTo(const Case& row, std::ostream* out) { *out << row.name; }

class Converter : public testing::TestWithParam<Case> {
protected:
    void SetUp() override { fs::create_directories(kDir); }
    void TearDown() override { fs::remove_all(kDir); }
};

TEST_P(Converter, Converts) {
    const Case& row = GetParam();
    if (row.impossible && kSanitized) GTEST_SKIP() << "a memory limit stops the sanitizer's allocator itself";
    const fs::path input = kDir / (std::string("in") + row.extension), out = kDir / "out.bin";
    std::ofstream(input, std::ios::binary) << row.input;
    std::ofstream(out) << "old";
    std::vector<std::string> arguments = row.options;
    arguments.push_back(input.string());
    if (row.options.empty() || (row.options[0] != "--info" && row.options[0] != "--check"))
        arguments.push_back(out.string());
    const auto [status, output] = run(arguments, row.impossible);
    ASSERT_EQ(status, row.status) << output;
    EXPECT_THAT(output, testing::HasSubstr(row.message));
    // No temporary file left behind; a refusal leaves an earlier output as it was.
    EXPECT_EQ(std::distance(fs::directory_iterator(kDir), fs::directory_iterator()), 2);
    if (row.check) return row.check(decode(slurp(out)));
    EXPECT_EQ(slurp(out), "old");
}

INSTANTIATE_TEST_SUITE_P(Table, Converter, testing::ValuesIn(kCases),
                         [](const testing::TestParamInfo<Case>& info) { return std::string(info.param.name); });
}  // namespace
