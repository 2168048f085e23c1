// The runtime package as `cmake --install` lays it out, seen in the copy the
// build stages for the samples: what an effect author's find_package(tarqvevyn) finds.

#include <sys/stat.h>
#include <unistd.h>

#include <filesystem>
#include <string>

#include <gtest/gtest.h>

namespace {

const std::string kStage = VI_STAGE_DIR;

bool exists(const std::string& relative) { return std::filesystem::exists(kStage + "/" + relative); }

TEST(StagedPackage, HoldsTheRuntimeLibrary) {
    EXPECT_TRUE(exists(VI_STAGE_LIBDIR "/libtarqvevyncommon.so"));
}

TEST(StagedPackage, HoldsThePluginHeadersUnderTheirOwnIncludeRoot) {
    for (const char* header : {"Application/Scene.h", "Application/Animation.h", "Application/AnimationManager.h",
                               "Render/Texture.h", "Render/RenderableTexture.h", "Render/LightRenderer.h",
                               "Render/Curves.h", "Tools/File.h", "Tools/Export.h", "Tools/DirectoryAssetManager.h"})
        EXPECT_TRUE(exists(std::string("include/tarqvevyn/") + header)) << header;
}

TEST(StagedPackage, InstallsNoSourcesOrBuildFiles) {
    for (const auto& entry : std::filesystem::recursive_directory_iterator(kStage + "/include")) {
        if (entry.is_regular_file()) {
            EXPECT_EQ(entry.path().extension(), ".h") << entry.path();
        }
    }
}

TEST(StagedPackage, HoldsAFindPackageConfigWithItsVersion) {
    const std::string dir = VI_STAGE_LIBDIR "/cmake/tarqvevyn/";
    EXPECT_TRUE(exists(dir + "tarqvevynConfig.cmake"));
    EXPECT_TRUE(exists(dir + "tarqvevynConfigVersion.cmake"));
    EXPECT_TRUE(exists(dir + "tarqvevynTargets.cmake"));
}

TEST(StagedPackage, HoldsTheModelConverterAsAnExecutable) {
    const std::string converter = kStage + "/bin/vi-modelconv";
    EXPECT_EQ(access(converter.c_str(), X_OK), 0) << converter;
}

}  // namespace
