// The converter run as effect authors run it: a separate process on mesh files
// written here, checked through the model files it leaves (or does not leave).

#include <algorithm>
#include <cmath>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include "ConverterFixture.h"

using testing::HasSubstr;
using testing::UnorderedElementsAre;
using vitest::DecodedModel;
using vitest::runTool;
using vitest::ScratchDirectory;
using vitest::ToolRun;

namespace {

// Converts `input` (written from `text`) to model.bin and decodes the result.
DecodedModel convert(const ScratchDirectory& scratch, const std::string& input, const std::string& text,
                     const std::vector<std::string>& options = {}) {
    scratch.write(input, text);
    std::vector<std::string> arguments = options;
    arguments.push_back(scratch.pathOf(input));
    arguments.push_back(scratch.pathOf("model.bin"));
    const ToolRun run = runTool(scratch, arguments);
    EXPECT_EQ(run.status, 0) << run.err;
    DecodedModel model;
    vitest::decode(scratch.read<std::uint8_t>("model.bin"), model);
    return model;
}

// Every triangle's corners, in file order, turn counter-clockwise around the
// normals they carry: front faces stay front faces for back-face culling.
void expectWindingAgreesWithNormals(const DecodedModel& model) {
    for (std::size_t i = 0; i + 2 < model.indices.size(); i += 3) {
        glm::vec3 a = model.positions[model.indices[i]];
        glm::vec3 b = model.positions[model.indices[i + 1]];
        glm::vec3 c = model.positions[model.indices[i + 2]];
        glm::vec3 faceNormal = glm::cross(b - a, c - a);
        for (int k = 0; k < 3; ++k)
            EXPECT_GT(glm::dot(faceNormal, model.normals[model.indices[i + k]]), 0.0f) << "triangle " << i / 3;
    }
}

TEST(ConverterTool, CubeWithUvGivesTwentyFourVerticesAndThirtySixIndicesFacingOut) {
    ScratchDirectory scratch;
    const DecodedModel model = convert(scratch, "cube.obj", vitest::cubeObj(true));
    // Four corners per face: the six faces share positions but not normals.
    ASSERT_EQ(model.vertexCount, 24u);
    EXPECT_EQ(model.indexCount, 36u);
    for (std::size_t v = 0; v < 24; ++v) {
        const glm::vec3& p = model.positions[v];
        EXPECT_FLOAT_EQ(std::fabs(p.x), 1.0f);
        EXPECT_FLOAT_EQ(glm::dot(p, model.normals[v]), 1.0f) << "the normal points out of vertex " << v;
        const glm::vec2& t = model.texCoords[v];
        EXPECT_TRUE((t.x == 0.0f || t.x == 1.0f) && (t.y == 0.0f || t.y == 1.0f)) << "vertex " << v;
    }
    for (std::uint16_t index : model.indices) EXPECT_LT(index, 24u);
    expectWindingAgreesWithNormals(model);
}

TEST(ConverterTool, ArraysLieAtTheOffsetsTheRuntimeReadsAndMissingNormalsAreComputed) {
    ScratchDirectory scratch;
    scratch.write("triangle.obj", "v 0 0 0\nv 2 0 0\nv 0 3 0\nvt 0.25 0.5\nvt 0.75 0.5\nvt 0.25 1\nf 1/1 2/2 3/3\n");
    ASSERT_EQ(runTool(scratch, {scratch.pathOf("triangle.obj"), scratch.pathOf("triangle.bin")}).status, 0);
    std::vector<std::uint8_t> bytes = scratch.read<std::uint8_t>("triangle.bin");
    ASSERT_EQ(bytes.size(), 110u);
    EXPECT_EQ(vitest::u32At(bytes, 0), 3u);
    EXPECT_EQ(vitest::u32At(bytes, 4), 3u);
    // Positions at 8, normals at 8 + 12 V = 44, uv at 8 + 24 V = 80, indices at 8 + 32 V = 104.
    const float expected[] = {0, 0, 0, 2, 0, 0, 0, 3, 0, 0, 0, 1, 0, 0, 1, 0, 0, 1,
                              0.25f, 0.5f, 0.75f, 0.5f, 0.25f, 1.0f};
    for (int i = 0; i < 24; ++i) EXPECT_FLOAT_EQ(vitest::floatAt(bytes, 8 + 4 * i), expected[i]) << i;
    const std::uint8_t indices[6] = {0, 0, 1, 0, 2, 0};
    EXPECT_TRUE(std::equal(indices, indices + 6, bytes.begin() + 104));
}

TEST(ConverterTool, MeshWithoutUvIsRefusedUnlessAskedThenProjectedSpherically) {
    ScratchDirectory scratch;
    scratch.write("bare.obj", vitest::cubeObj(false));
    const ToolRun run = runTool(scratch, {scratch.pathOf("bare.obj"), scratch.pathOf("model.bin")});
    EXPECT_EQ(run.status, 1);
    EXPECT_THAT(run.err, HasSubstr("no texture coordinates"));
    EXPECT_THAT(run.err, HasSubstr("--generate-uv"));
    EXPECT_THAT(scratch.entries(), UnorderedElementsAre("bare.obj"));

    const DecodedModel model = convert(scratch, "bare.obj", vitest::cubeObj(false), {"--generate-uv"});
    ASSERT_EQ(model.vertexCount, 24u);
    const float pi = 3.14159265f;
    for (std::size_t v = 0; v < 24; ++v) {
        const glm::vec3& p = model.positions[v];
        // Longitude from atan2(z, x), latitude with the top at t = 1.
        EXPECT_NEAR(model.texCoords[v].x, 0.5f + std::atan2(p.z, p.x) / (2 * pi), 1e-5f);
        EXPECT_NEAR(model.texCoords[v].y, 0.5f + std::asin(p.y / glm::length(p)) / pi, 1e-5f);
    }
}

TEST(ConverterTool, MoreThan65536VerticesAreRefusedAndAnOldOutputIsKept) {
    ScratchDirectory scratch;
    scratch.write("grid.obj", vitest::gridObj(257));
    scratch.write("grid.bin", "old");
    const ToolRun run = runTool(scratch, {scratch.pathOf("grid.obj"), scratch.pathOf("grid.bin")});
    EXPECT_EQ(run.status, 1);
    EXPECT_THAT(run.err, HasSubstr("66049 vertices"));
    EXPECT_THAT(run.err, HasSubstr("16-bit"));
    EXPECT_THAT(scratch.entries(), UnorderedElementsAre("grid.obj", "grid.bin"));
    EXPECT_EQ(scratch.read("grid.bin"), (std::vector<char>{'o', 'l', 'd'}));
}

// One triangle mesh (its buffer inline: positions, uv, indices) used by three
// nodes: translated, mirrored in x, and scaled inside a translated parent.
TEST(ConverterTool, NodeTransformsAreAppliedToEveryInstanceOfAMesh) {
    ScratchDirectory scratch;
    const DecodedModel model = convert(scratch, "instances.gltf", R"({"asset":{"version":"2.0"},"scene":0,
"scenes":[{"nodes":[0,1,2]}],
"nodes":[{"mesh":0,"translation":[10,0,0]},{"mesh":0,"scale":[-1,1,1]},
{"translation":[0,5,0],"children":[3]},{"mesh":0,"scale":[2,2,2]}],
"meshes":[{"primitives":[{"attributes":{"POSITION":0,"TEXCOORD_0":1},"indices":2}]}],
"buffers":[{"byteLength":68,"uri":"data:application/octet-stream;base64,)"
        R"(AAAAAAAAAAAAAAAAAACAPwAAAAAAAAAAAAAAAAAAgD8AAAAAAAAAAAAAAAAAAIA/AAAAAAAAAAAAAIA/AAABAAIAAAA="}],
"bufferViews":[{"buffer":0,"byteOffset":0,"byteLength":36},{"buffer":0,"byteOffset":36,"byteLength":24},
{"buffer":0,"byteOffset":60,"byteLength":6}],
"accessors":[{"bufferView":0,"componentType":5126,"count":3,"type":"VEC3","min":[0,0,0],"max":[1,1,0]},
{"bufferView":1,"componentType":5126,"count":3,"type":"VEC2"},
{"bufferView":2,"componentType":5123,"count":3,"type":"SCALAR"}]})");
    EXPECT_EQ(model.vertexCount, 9u);
    EXPECT_EQ(model.indexCount, 9u);
    for (glm::vec3 p : {glm::vec3(10, 0, 0), glm::vec3(11, 0, 0), glm::vec3(10, 1, 0), glm::vec3(-1, 0, 0),
                        glm::vec3(0, 5, 0), glm::vec3(2, 5, 0), glm::vec3(0, 7, 0)}) {
        const bool found = std::any_of(model.positions.begin(), model.positions.end(),
                                       [&](const glm::vec3& q) { return glm::length(p - q) < 1e-5f; });
        EXPECT_TRUE(found) << p.x << " " << p.y << " " << p.z;
    }
    // The mirrored instance still faces +z, like the others.
    for (const glm::vec3& n : model.normals) EXPECT_NEAR(n.z, 1.0f, 1e-5f);
    expectWindingAgreesWithNormals(model);
}

TEST(ConverterTool, InfoPrintsCountsAndBounds) {
    ScratchDirectory scratch;
    convert(scratch, "cube.obj", vitest::cubeObj(true));
    const ToolRun run = runTool(scratch, {"--info", scratch.pathOf("model.bin")});
    ASSERT_EQ(run.status, 0) << run.err;
    EXPECT_THAT(run.out, HasSubstr("vertices: 24\nindices: 36\ntriangles: 12\n"));
    EXPECT_THAT(run.out, HasSubstr("bounds: min (-1, -1, -1) max (1, 1, 1)\n"));
    EXPECT_THAT(run.out, HasSubstr("size: 848 bytes"));
}

}  // namespace
