// The converter run as effect authors run it: a separate process on mesh files
// written here, checked through the model files it leaves (or does not leave).

#include <algorithm>
#include <cmath>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include "ConverterFixture.h"

using testing::HasSubstr;
using vitest::ConverterScratch;
using vitest::DecodedModel;
using vitest::runTool;

namespace {

bool near(const glm::vec3& a, const glm::vec3& b) { return glm::length(a - b) < 1e-5f; }

bool containsPosition(const DecodedModel& model, const glm::vec3& p) {
    return std::any_of(model.positions.begin(), model.positions.end(),
                       [&](const glm::vec3& q) { return near(p, q); });
}

// Every triangle's corners, in file order, turn counter-clockwise around the
// normals they carry: front faces stay front faces for back-face culling.
void expectWindingAgreesWithNormals(const DecodedModel& model) {
    for (std::size_t i = 0; i + 2 < model.indices.size(); i += 3) {
        glm::vec3 a = model.positions[model.indices[i]], b = model.positions[model.indices[i + 1]],
                  c = model.positions[model.indices[i + 2]];
        glm::vec3 faceNormal = glm::cross(b - a, c - a);
        for (int k = 0; k < 3; ++k)
            EXPECT_GT(glm::dot(faceNormal, model.normals[model.indices[i + k]]), 0.0f) << "triangle " << i / 3;
    }
}

std::string base64(const std::vector<std::uint8_t>& bytes) {
    static const char* digits = "ABCDEFGHIJKLMNOPQRSTUVWXYZabcdefghijklmnopqrstuvwxyz0123456789+/";
    std::string text;
    for (std::size_t i = 0; i < bytes.size(); i += 3) {
        std::uint32_t chunk = std::uint32_t(bytes[i]) << 16;
        if (i + 1 < bytes.size()) chunk |= std::uint32_t(bytes[i + 1]) << 8;
        if (i + 2 < bytes.size()) chunk |= bytes[i + 2];
        text += digits[(chunk >> 18) & 63];
        text += digits[(chunk >> 12) & 63];
        text += i + 1 < bytes.size() ? digits[(chunk >> 6) & 63] : '=';
        text += i + 2 < bytes.size() ? digits[chunk & 63] : '=';
    }
    return text;
}

void appendFloat(std::vector<std::uint8_t>& bytes, float value) {
    std::uint8_t raw[4];
    std::memcpy(raw, &value, 4);
    bytes.insert(bytes.end(), raw, raw + 4);
}

// One triangle mesh used by three nodes: translated, mirrored in x, and
// scaled inside a translated parent.
std::string instancedTriangleGltf() {
    std::vector<std::uint8_t> buffer;
    for (float f : {0.0f, 0.0f, 0.0f, 1.0f, 0.0f, 0.0f, 0.0f, 1.0f, 0.0f}) appendFloat(buffer, f);
    for (float f : {0.0f, 0.0f, 1.0f, 0.0f, 0.0f, 1.0f}) appendFloat(buffer, f);
    for (std::uint8_t b : {0, 0, 1, 0, 2, 0, 0, 0}) buffer.push_back(b);
    return R"({"asset":{"version":"2.0"},"scene":0,"scenes":[{"nodes":[0,1,2]}],
"nodes":[{"mesh":0,"translation":[10,0,0]},{"mesh":0,"scale":[-1,1,1]},
{"translation":[0,5,0],"children":[3]},{"mesh":0,"scale":[2,2,2]}],
"meshes":[{"primitives":[{"attributes":{"POSITION":0,"TEXCOORD_0":1},"indices":2}]}],
"buffers":[{"byteLength":)" +
           std::to_string(buffer.size()) + R"(,"uri":"data:application/octet-stream;base64,)" + base64(buffer) +
           R"("}],
"bufferViews":[{"buffer":0,"byteOffset":0,"byteLength":36},{"buffer":0,"byteOffset":36,"byteLength":24},
{"buffer":0,"byteOffset":60,"byteLength":6}],
"accessors":[{"bufferView":0,"componentType":5126,"count":3,"type":"VEC3","min":[0,0,0],"max":[1,1,0]},
{"bufferView":1,"componentType":5126,"count":3,"type":"VEC2"},
{"bufferView":2,"componentType":5123,"count":3,"type":"SCALAR"}]})";
}

TEST(ConverterTool, CubeWithUvGivesTwentyFourVerticesAndThirtySixIndices) {
    ConverterScratch scratch;
    scratch.write("cube.obj", vitest::cubeObj(true));
    vitest::ToolRun run = runTool(scratch, {scratch.pathOf("cube.obj"), scratch.pathOf("cube.bin")});
    ASSERT_EQ(run.status, 0) << run.err;
    std::vector<std::uint8_t> bytes = scratch.read("cube.bin");
    // Four corners per face: the six faces share positions but not normals.
    ASSERT_EQ(bytes.size(), 8u + 32u * 24u + 2u * 36u);
    DecodedModel model;
    ASSERT_TRUE(vitest::decode(bytes, model));
    EXPECT_EQ(model.vertexCount, 24u);
    EXPECT_EQ(model.indexCount, 36u);
    for (std::size_t v = 0; v < 24; ++v) {
        const glm::vec3& p = model.positions[v];
        const glm::vec3& n = model.normals[v];
        EXPECT_FLOAT_EQ(std::fabs(p.x), 1.0f);
        EXPECT_FLOAT_EQ(glm::length(n), 1.0f);
        // The normal points out of the face the vertex lies on.
        EXPECT_FLOAT_EQ(glm::dot(p, n), 1.0f) << "vertex " << v;
        const glm::vec2& t = model.texCoords[v];
        EXPECT_TRUE((t.x == 0.0f || t.x == 1.0f) && (t.y == 0.0f || t.y == 1.0f)) << "vertex " << v;
    }
    for (std::uint16_t index : model.indices) EXPECT_LT(index, 24u);
    expectWindingAgreesWithNormals(model);
}

TEST(ConverterTool, ArraysLieAtTheOffsetsTheRuntimeReads) {
    ConverterScratch scratch;
    scratch.write("triangle.obj",
                  "v 0 0 0\nv 2 0 0\nv 0 3 0\nvt 0.25 0.5\nvt 0.75 0.5\nvt 0.25 1\nvn 0 0 1\n"
                  "f 1/1/1 2/2/1 3/3/1\n");
    ASSERT_EQ(runTool(scratch, {scratch.pathOf("triangle.obj"), scratch.pathOf("triangle.bin")}).status, 0);
    std::vector<std::uint8_t> bytes = scratch.read("triangle.bin");
    ASSERT_EQ(bytes.size(), 110u);
    EXPECT_EQ(vitest::u32At(bytes, 0), 3u);
    EXPECT_EQ(vitest::u32At(bytes, 4), 3u);
    // Positions at 8, normals at 8 + 12 V = 44, uv at 8 + 24 V = 80, indices at 8 + 32 V = 104.
    const float positions[9] = {0, 0, 0, 2, 0, 0, 0, 3, 0};
    for (int i = 0; i < 9; ++i) EXPECT_FLOAT_EQ(vitest::floatAt(bytes, 8 + 4 * i), positions[i]) << i;
    for (int v = 0; v < 3; ++v) {
        EXPECT_FLOAT_EQ(vitest::floatAt(bytes, 44 + 12 * v + 8), 1.0f) << v;
        EXPECT_FLOAT_EQ(vitest::floatAt(bytes, 44 + 12 * v), 0.0f) << v;
    }
    const float uv[6] = {0.25f, 0.5f, 0.75f, 0.5f, 0.25f, 1.0f};
    for (int i = 0; i < 6; ++i) EXPECT_FLOAT_EQ(vitest::floatAt(bytes, 80 + 4 * i), uv[i]) << i;
    const std::uint8_t indices[6] = {0, 0, 1, 0, 2, 0};
    EXPECT_TRUE(std::equal(indices, indices + 6, bytes.begin() + 104));
}

TEST(ConverterTool, MeshWithoutUvIsRefusedAndNothingWritten) {
    ConverterScratch scratch;
    scratch.write("bare.obj", vitest::cubeObj(false));
    vitest::ToolRun run = runTool(scratch, {scratch.pathOf("bare.obj"), scratch.pathOf("bare.bin")});
    EXPECT_EQ(run.status, 1);
    EXPECT_THAT(run.err, HasSubstr("no texture coordinates"));
    EXPECT_THAT(run.err, HasSubstr("--generate-uv"));
    EXPECT_THAT(scratch.entries(), testing::UnorderedElementsAre("bare.obj"));
}

TEST(ConverterTool, GenerateUvProjectsSphericallyAroundTheCentre) {
    ConverterScratch scratch;
    scratch.write("bare.obj", vitest::cubeObj(false));
    vitest::ToolRun run =
        runTool(scratch, {"--generate-uv", scratch.pathOf("bare.obj"), scratch.pathOf("bare.bin")});
    ASSERT_EQ(run.status, 0) << run.err;
    DecodedModel model;
    ASSERT_TRUE(vitest::decode(scratch.read("bare.bin"), model));
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
    ConverterScratch scratch;
    scratch.write("grid.obj", vitest::gridObj(257));
    scratch.write("grid.bin", "old");
    vitest::ToolRun run = runTool(scratch, {scratch.pathOf("grid.obj"), scratch.pathOf("grid.bin")});
    EXPECT_EQ(run.status, 1);
    EXPECT_THAT(run.err, HasSubstr("66049 vertices"));
    EXPECT_THAT(run.err, HasSubstr("16-bit"));
    EXPECT_THAT(scratch.entries(), testing::UnorderedElementsAre("grid.obj", "grid.bin"));
    std::vector<std::uint8_t> kept = scratch.read("grid.bin");
    EXPECT_EQ(std::string(kept.begin(), kept.end()), "old");
}

TEST(ConverterTool, Exactly65536VerticesFitSixteenBitIndices) {
    ConverterScratch scratch;
    scratch.write("grid.obj", vitest::gridObj(256));
    vitest::ToolRun run = runTool(scratch, {scratch.pathOf("grid.obj"), scratch.pathOf("grid.bin")});
    ASSERT_EQ(run.status, 0) << run.err;
    DecodedModel model;
    ASSERT_TRUE(vitest::decode(scratch.read("grid.bin"), model));
    EXPECT_EQ(model.vertexCount, 65536u);
    EXPECT_EQ(model.indexCount, 255u * 255u * 6u);
    EXPECT_EQ(*std::max_element(model.indices.begin(), model.indices.end()), 65535);
}

TEST(ConverterTool, NodeTransformsAreAppliedToEveryInstanceOfAMesh) {
    ConverterScratch scratch;
    scratch.write("instances.gltf", instancedTriangleGltf());
    vitest::ToolRun run = runTool(scratch, {scratch.pathOf("instances.gltf"), scratch.pathOf("instances.bin")});
    ASSERT_EQ(run.status, 0) << run.err;
    DecodedModel model;
    ASSERT_TRUE(vitest::decode(scratch.read("instances.bin"), model));
    EXPECT_EQ(model.vertexCount, 9u);
    EXPECT_EQ(model.indexCount, 9u);
    for (glm::vec3 p : {glm::vec3(10, 0, 0), glm::vec3(11, 0, 0), glm::vec3(10, 1, 0), glm::vec3(-1, 0, 0),
                        glm::vec3(0, 5, 0), glm::vec3(2, 5, 0), glm::vec3(0, 7, 0)})
        EXPECT_TRUE(containsPosition(model, p)) << p.x << " " << p.y << " " << p.z;
    // The mirrored instance still faces +z, like the others.
    for (const glm::vec3& n : model.normals) EXPECT_NEAR(n.z, 1.0f, 1e-5f);
    expectWindingAgreesWithNormals(model);
}

TEST(ConverterTool, MissingNormalsAreComputedFacingOutward) {
    ConverterScratch scratch;
    scratch.write("tri.obj", "v 0 0 0\nv 1 0 0\nv 0 1 0\nvt 0 0\nvt 1 0\nvt 0 1\nf 1/1 2/2 3/3\n");
    ASSERT_EQ(runTool(scratch, {scratch.pathOf("tri.obj"), scratch.pathOf("tri.bin")}).status, 0);
    DecodedModel model;
    ASSERT_TRUE(vitest::decode(scratch.read("tri.bin"), model));
    for (const glm::vec3& n : model.normals) EXPECT_TRUE(near(n, glm::vec3(0, 0, 1)));
}

TEST(ConverterTool, UnreadableInputIsRefusedWithItsName) {
    ConverterScratch scratch;
    vitest::ToolRun run = runTool(scratch, {scratch.pathOf("missing.obj"), scratch.pathOf("out.bin")});
    EXPECT_EQ(run.status, 1);
    EXPECT_THAT(run.err, HasSubstr("missing.obj"));
    EXPECT_FALSE(scratch.exists("out.bin"));
}

TEST(ConverterTool, InfoPrintsCountsAndBounds) {
    ConverterScratch scratch;
    scratch.write("cube.obj", vitest::cubeObj(true));
    ASSERT_EQ(runTool(scratch, {scratch.pathOf("cube.obj"), scratch.pathOf("cube.bin")}).status, 0);
    vitest::ToolRun run = runTool(scratch, {"--info", scratch.pathOf("cube.bin")});
    ASSERT_EQ(run.status, 0) << run.err;
    EXPECT_THAT(run.out, HasSubstr("vertices: 24\n"));
    EXPECT_THAT(run.out, HasSubstr("indices: 36\n"));
    EXPECT_THAT(run.out, HasSubstr("triangles: 12\n"));
    EXPECT_THAT(run.out, HasSubstr("bounds: min (-1, -1, -1) max (1, 1, 1)\n"));
    EXPECT_THAT(run.out, HasSubstr("size: 848 bytes"));
}

}  // namespace
