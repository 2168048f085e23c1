// Files, models, the background and the lit renderer: reading and saving
// whole files, the fatal end of an unreadable one, and the pictures, shared
// programs and shader texts of the background and the lit renderer.
#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <stdlib.h>
#include <unistd.h>

#include <filesystem>
#include <fstream>
#include <iterator>
#include <memory>

#include "GlRecorder.h"
#include "Painters.h"
#include "Render/Background.h"
#include "Render/LightRenderer.h"
#include "Render/ModelObject.h"
#include "Tools/DirectoryAssetManager.h"
#include "Tools/FatalReport.h"
#include "Tools/File.h"

using vitest::GlRecorder;
using vitest::readPixel;
using Bytes = std::vector<char>;
using Floats = std::vector<float>;

namespace {

constexpr std::uint32_t kTexel = 0xC86432FF, kBlue = 0x0000FFFF;

// A fresh directory under /tmp as the asset and the external-storage
// directory, removed with everything in it at the end.
struct AssetDirectory {
    AssetDirectory() : manager(vi::DirectoryAssetManager::create(mkdtemp(path))) {
        vi::File::getAssetManager() = manager;
        vi::File::setExternalStorageDirectory(pathOf(""));
    }
    ~AssetDirectory() {
        vi::File::getAssetManager() = nullptr;
        vi::DirectoryAssetManager::destroy(manager);
        std::filesystem::remove_all(path);
    }
    std::string pathOf(const std::string& name) const { return std::string(path) + "/" + name; }
    void write(const std::string& name, const std::string& bytes) const {
        std::filesystem::create_directories(std::filesystem::path(pathOf(name)).parent_path());
        std::ofstream(pathOf(name), std::ios::binary) << bytes;
    }
    Bytes read(const std::string& name) const {
        std::ifstream in(pathOf(name), std::ios::binary);
        return Bytes(std::istreambuf_iterator<char>(in), std::istreambuf_iterator<char>());
    }

    char path[20] = "/tmp/vi-test-XXXXXX";
    AAssetManager* manager;
};

// A model file: the vertex and index counts, then positions, normals,
// texture coordinates and 16-bit indices.
std::string modelFile(const Floats& positions, const Floats& normals, const Floats& texCoords,
                      const std::vector<std::uint16_t>& indices) {
    const std::uint32_t counts[2] = {std::uint32_t(positions.size() / 3), std::uint32_t(indices.size())};
    std::string bytes(reinterpret_cast<const char*>(counts), 8);
    for (const Floats* array : {&positions, &normals, &texCoords})
        bytes.append(reinterpret_cast<const char*>(array->data()), array->size() * 4);
    return bytes.append(reinterpret_cast<const char*>(indices.data()), indices.size() * 2);
}

// A death test's child: the report is printed at exit, and stdout lands on
// stderr after it, so an exact match of stderr also proves stdout stayed silent.
void openAndWatchTheExit(const std::string& name, bool isAsset) {
    std::atexit([] { std::fputs(vi::FatalReport::msLastReport->c_str(), stderr); });
    dup2(STDERR_FILENO, STDOUT_FILENO);
    vi::File file(name, isAsset);
}

std::string invalidFileReport(const std::string& name, const char* function, int line) {
    return "\"Invalid file name: \"" + name + "\"\"\nIn file : \"" VI_RUNTIME_SOURCE_DIR "/Tools/File.cpp\"\n" +
           "In function : \"" + function + "\"\nIn line : " + std::to_string(line);
}

Bytes contentsOf(vi::File& file) { return Bytes(file.getBuffer(), file.getBuffer() + file.getLength()); }

class Framework : public testing::Test {
protected:
    std::uint32_t draw(vi::Renderer& renderer, int x = 32, int y = 32) {
        glClearColor(0.0f, 0.0f, 1.0f, 1.0f);
        glClear(GL_COLOR_BUFFER_BIT);
        renderer.render();
        return readPixel(x, y);
    }

    vitest::GlContext gl{64, 64};
    std::uint8_t texels[16] = {200, 100, 50, 255, 0, 255, 0, 255, 0, 0, 255, 255, 255, 255, 255, 255};
    vi::Texture plain{texels, 1, 1, true, false, false, false, false, 4, false};
};

}  // namespace

TEST(FileDeathTest, MissingAssetExits71AndMissingFileExits45WithOnlyTheReport) {
    AssetDirectory assets;
    EXPECT_EXIT(openAndWatchTheExit("missing.bin", true), testing::ExitedWithCode(71),
                testing::StrEq(invalidFileReport("missing.bin", "load", 71)));
    EXPECT_EXIT(openAndWatchTheExit(assets.pathOf("x.raw"), false), testing::ExitedWithCode(45),
                testing::StrEq(invalidFileReport(assets.pathOf("x.raw"), "File", 45)));
}

TEST(File, LoadTakesTheWholeFileAndWritesCollectUntilAFlushThatAlwaysEmptiesTheBuffer) {
    AssetDirectory assets;
    assets.write("data/bytes.bin", std::string("\0a\xFF\nz", 5));
    assets.write("empty.bin", "");
    vi::File file;
    file.write("12345678", 8);
    file.load("data/bytes.bin");
    EXPECT_EQ(contentsOf(file), assets.read("data/bytes.bin"));
    vi::File byPath(assets.pathOf("data/bytes.bin"), false);
    EXPECT_EQ(contentsOf(byPath), assets.read("data/bytes.bin"));
    file.load("empty.bin");
    EXPECT_EQ(file.getLength(), 0u);

    file.write("abc", 3);
    file.write("12345", 5);
    file.flush("a.raw", false);
    EXPECT_EQ(assets.read("a.raw"), (Bytes{'a', 'b', 'c', '1', '2', '3', '4', '5'}));
    file.write("Z", 1);
    file.flush("a.raw", true);  // truncates
    EXPECT_EQ(assets.read("a.raw"), Bytes{'Z'});
    file.write("abc", 3);
    file.flush("no/such/directory/a.raw", false);
    EXPECT_FALSE(std::filesystem::exists(assets.pathOf("no")));
    EXPECT_EQ(file.getLength(), 0u);
}

TEST(File, AnAssetNameNeverLeavesTheAssetFolder) {
    AssetDirectory assets;
    assets.write("in/a.bin", "a");
    assets.write("in/sub/b.bin", "b");
    assets.write("secret", "s");       // beside the asset folder
    assets.write("in2/c.bin", "c");    // next door, its name starting as the folder's
    std::filesystem::create_symlink("../secret", assets.pathOf("in/out-link"));
    std::filesystem::create_symlink("../in2/c.bin", assets.pathOf("in/next-door"));
    std::filesystem::create_symlink("sub/b.bin", assets.pathOf("in/in-link"));
    using Lookup = vi::DirectoryAssetManager::Lookup;
    const std::pair<std::string, Lookup> rows[] = {
        {"a.bin", Lookup::Found},         {"sub/../a.bin", Lookup::Found},      {"./sub//b.bin", Lookup::Found},
        {"in-link", Lookup::Found},       {"../secret", Lookup::Outside},       {"sub/../../secret", Lookup::Outside},
        {"out-link", Lookup::Outside},    {assets.pathOf("in/a.bin"), Lookup::Outside}, {"../in/a.bin", Lookup::Outside},
        {"next-door", Lookup::Outside},   {"./../ghost.bin", Lookup::Outside},  {".x/../ghost.bin", Lookup::Missing},
        {"ghost.bin", Lookup::Missing},   {"sub", Lookup::NotAFile}};
    for (const auto& [name, expected] : rows) {
        std::string path;
        EXPECT_EQ(vi::DirectoryAssetManager::find(assets.pathOf("in"), name.c_str(), path), expected) << name;
    }
    EXPECT_EQ(AAssetManager_open(nullptr, "a.bin", 0), nullptr);  // no asset folder: no asset
    AAssetManager* manager = vi::DirectoryAssetManager::create(assets.pathOf("in"));
    EXPECT_EQ(AAssetManager_open(manager, "out-link", 0), nullptr);
    AAsset* linked = AAssetManager_open(manager, "in-link", 0);
    ASSERT_NE(linked, nullptr);
    EXPECT_EQ(AAsset_getLength(linked), 1);
    AAsset_close(linked);
    vi::DirectoryAssetManager::destroy(manager);
}

TEST_F(Framework, ModelsFillDrawablesInPlaceAndALitModelShowsTheFactorsWhereItsVerticesAreScaledOrNot) {
    AssetDirectory assets;
    assets.write("triangle.bin", modelFile({0, 0, 0, 1, 0, 0, 0, 1, 0}, Floats(9, 0.5f), Floats(6, 0), {}));
    vi::ModelObject triangle("triangle");
    vi::Drawable drawable;  // a fresh record sends every array at every draw
    EXPECT_FALSE(drawable.positionsStatic || drawable.normalsStatic || drawable.texCoordsStatic);
    drawable.indices = reinterpret_cast<const unsigned short*>(triangle.getBuffer());
    drawable.opacity = 0.25f;
    drawable.positionsStatic = true;
    triangle.fillDrawable(drawable);
    EXPECT_EQ(std::vector<unsigned>({drawable.mode, drawable.vertexCount, drawable.elementCount}),
              (std::vector<unsigned>{GL_TRIANGLES, 3, 3}));
    EXPECT_EQ(drawable.indices, nullptr);  // an unindexed file draws a plain list
    EXPECT_EQ(reinterpret_cast<const char*>(drawable.texCoords), triangle.getBuffer() + 8 + 72);
    EXPECT_EQ(drawable.opacity, 0.25f);
    // Positions and normals go up at every draw, so that scale() shows; texture coordinates once.
    EXPECT_EQ(std::vector<bool>({drawable.positionsStatic, drawable.normalsStatic, drawable.texCoordsStatic}),
              (std::vector<bool>{false, false, true}));

    // "half" opens half.bin: the right half of the viewport, two indexed triangles.
    assets.write("half", "not this one");
    assets.write("half.bin", modelFile({0, -1, 0, 1, -1, 0, 0, 1, 0, 1, 1, 0}, {0, 0, 1, 0, 0, 1, 0, 0, 1, 0, 0, 1},
                                       Floats(8, 0), {0, 1, 2, 2, 1, 3}));
    vi::ModelObject model("half");
    drawable.texture = &plain;
    model.fillDrawable(drawable);
    vi::LightRenderer renderer(drawable);
    // Light and eye straight above the centre, far enough for the
    // interpolated directions to be straight up there.
    float ambient = 0, diffuse = 0, specular = 0, shininess = 1;
    glm::vec3 light{0, 0, 100}, eye{0, 0, 100};
    renderer.addUniform("uAmbient", &ambient, vi::Uniform::Float, 1);
    renderer.addUniform("uDiffuse", &diffuse, vi::Uniform::Float, 1);
    renderer.addUniform("uSpecular", &specular, vi::Uniform::Float, 1);
    renderer.addUniform("uShininess", &shininess, vi::Uniform::Float, 1);
    renderer.addUniform("uLightPosition", &light[0], vi::Uniform::Float3, 1);
    renderer.addUniform("uEyePosition", &eye[0], vi::Uniform::Float3, 1);
    // Ambient, diffuse, specular, the light's height and the opacity. Specular
    // light is added uncoloured: 0.4 adds 102 to every channel.
    const float rows[][5] = {{0.5f, 0, 0, 100, 1}, {1, 0, 0, 100, 0.5f},    {0, 1, 0, 100, 1},
                             {0, 1, 0, -100, 1},   {0.5f, 0, 0.4f, 100, 1}, {1, 0, 0, 100, 1}};
    const std::uint32_t expected[] = {0x643219FF, 0xC8643280, kTexel, 0x000000FF, 0xCA987FFF, kTexel};
    for (int row = 0; row < 6; ++row) {
        ambient = rows[row][0];
        diffuse = rows[row][1];
        specular = rows[row][2];
        light.z = rows[row][3];
        drawable.opacity = rows[row][4];
        EXPECT_TRUE(vitest::near(draw(renderer, 48, 32), expected[row], 3)) << std::hex << readPixel(48, 32) << row;
    }
    EXPECT_EQ(std::vector<std::uint32_t>({readPixel(62, 62), readPixel(16, 32)}),
              (std::vector<std::uint32_t>{readPixel(48, 32), kBlue}));
    model.scale(0.5f);
    EXPECT_TRUE(vitest::near(draw(renderer, 40, 40), kTexel, 2));
    EXPECT_EQ(readPixel(62, 62), kBlue);
}

TEST_F(Framework, RenderersShareOneProgramEachWithTheRuntimesShaderTextsUntilTheLastUserIsGone) {
    vitest::GlRecording recording;
    vi::Drawable face;
    face.texture = &plain;
    auto lit = std::make_unique<vi::LightRenderer>(face), secondLit = std::make_unique<vi::LightRenderer>(face);
    auto background = std::make_unique<vi::Background>(plain), second = std::make_unique<vi::Background>(plain);
    EXPECT_EQ(GlRecorder::count("glCreateProgram"), 2);
    // The texts keep their shared lines, and the lit one the two blanks after "specular =".
    const std::vector<vitest::GlCall> sources = GlRecorder::callsNamed("glShaderSource");
    ASSERT_EQ(sources.size(), 4u);
    EXPECT_THAT(sources[1].text, testing::HasSubstr("\nuniform float uOpacity;uniform float uAmbient;\n"));
    EXPECT_THAT(sources[1].text, testing::HasSubstr("\n    float specular =  uSpecular * pow("));
    EXPECT_THAT(sources[3].text, testing::HasSubstr("\nuniform float uOpacity;varying vec2 vTextureCoord;\nvoid main()\n"));
    std::vector<std::string> attributes;
    for (vi::Attribute* a : lit->attributes) attributes.push_back(a->name);
    EXPECT_EQ(attributes, (std::vector<std::string>{"aPosition", "aNormal", "aTextureCoord"}));
    const GLuint litProgram = lit->program->program, backgroundProgram = second->renderer->program->program;
    lit.reset();
    background.reset();
    EXPECT_TRUE(glIsProgram(litProgram) && glIsProgram(backgroundProgram));
    // An outside request for the background's program counts as a user too.
    vi::ShaderProgram* outside = vi::BackgroundRenderer::getShaderProgram();
    secondLit.reset();
    second.reset();
    EXPECT_FALSE(glIsProgram(litProgram));
    EXPECT_EQ(vi::LightRenderer::msShaderProgram, nullptr);
    EXPECT_EQ(vi::BackgroundRenderer::msShaderProgram, outside);
    vi::ShaderProgram::releaseShared(vi::BackgroundRenderer::msShaderProgram, vi::BackgroundRenderer::msUseCount);
    EXPECT_FALSE(glIsProgram(backgroundProgram));
}

TEST_F(Framework, BackgroundShowsTheFirstRowAtTheTopStretchedWhateverTheOpacity) {
    // First row red, green; second row blue, white.
    std::uint8_t quadrants[16] = {255, 0, 0, 255, 0, 255, 0, 255, 0, 0, 255, 255, 255, 255, 255, 255};
    vi::Texture texture(quadrants, 2, 2, true, false, false, false, false, 4, false);
    vi::Background background(texture);
    const vi::Drawable& d = background.drawable;  // what a plug-in reads: the tag, positions sent once
    EXPECT_EQ(std::vector<unsigned>({d.userTag, d.positionsStatic, d.normalsStatic, d.texCoordsStatic}),
              (std::vector<unsigned>{3, 1, 0, 0}));
    vi::Renderer::setBlending(true);
    background.drawable.opacity = 0.25f;
    glViewport(0, 0, 64, 32);  // as wide as the surface and half as high: the picture follows
    EXPECT_EQ(draw(*background.renderer, 1, 30), 0xFF0000FFu);
    vi::Renderer::setBlending(false);
    EXPECT_EQ(std::vector<std::uint32_t>({readPixel(32, 16), readPixel(31, 15), readPixel(62, 1), readPixel(8, 40)}),
              (std::vector<std::uint32_t>{0x00FF00FF, 0x0000FFFF, 0xFFFFFFFF, kBlue}));
}
