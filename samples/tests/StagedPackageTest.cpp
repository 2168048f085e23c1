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

TEST(StagedPackage, HoldsTheRuntimeLibraryItsFindPackageConfigAndTheModelConverter) {
    EXPECT_TRUE(exists(VI_STAGE_LIBDIR "/libtarqvevyncommon.so"));
    const std::string dir = VI_STAGE_LIBDIR "/cmake/tarqvevyn/";
    for (const char* file : {"tarqvevynConfig.cmake", "tarqvevynConfigVersion.cmake", "tarqvevynTargets.cmake"})
        EXPECT_TRUE(exists(dir + file)) << file;
    const std::string converter = kStage + "/bin/vi-modelconv";
    EXPECT_EQ(access(converter.c_str(), X_OK), 0) << converter;
}

}  // namespace
