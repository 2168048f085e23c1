// Whole-file buffers: reading from the asset directory and the file system,
// collecting and saving under the external-storage directory, and the fatal
// end of an unreadable file.
#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <unistd.h>

#include <cstdio>
#include <string>
#include <vector>

#include "FatalReportCapture.h"
#include "AssetFiles.h"
#include "Tools/File.h"

using vitest::AssetDirectory;
using vitest::ScratchDirectory;

namespace {

std::vector<char> contentsOf(vi::File& file) {
    return std::vector<char>(file.getBuffer(), file.getBuffer() + file.getLength());
}

// The whole text a fatal report leaves behind for an unreadable file.
std::string invalidFileReport(const std::string& name, const char* function, int line) {
    return "\"Invalid file name: \"" + name + "\"\"\nIn file : \"" VI_RUNTIME_SOURCE_DIR "/Tools/File.cpp\"\n" +
           "In function : \"" + function + "\"\nIn line : " + std::to_string(line);
}

// In a death test's child: anything the runtime prints on stdout lands on
// stderr too (after the report, since stdio is flushed after the exit
// handlers), so an exact match of stderr also proves stdout stayed silent.
void captureReportAndStdout() {
    vitest::printFatalReportAtExit();
    dup2(STDERR_FILENO, STDOUT_FILENO);
}

}  // namespace

TEST(FileDeathTest, MissingAssetEndsTheProcessWithStatus71AndOnlyTheReport) {
    AssetDirectory assets;
    EXPECT_EXIT(
        {
            captureReportAndStdout();
            vi::File file("missing.bin", true);
        },
        testing::ExitedWithCode(71), testing::StrEq(invalidFileReport("missing.bin", "load", 71)));
}

TEST(FileDeathTest, MissingFileEndsTheProcessWithStatus45AndOnlyTheReport) {
    ScratchDirectory directory;
    std::string path = directory.pathOf("missing.raw");
    EXPECT_EXIT(
        {
            captureReportAndStdout();
            vi::File file(path, false);
        },
        testing::ExitedWithCode(45), testing::StrEq(invalidFileReport(path, "File", 45)));
}

TEST(File, LoadOverALongerBufferLeavesExactlyTheAssetsLength) {
    AssetDirectory assets;
    const std::vector<char> bytes = {'\0', 'a', char(0xFF), '\n', 'z'};
    assets.write("data/bytes.bin", bytes);
    vi::File file;
    std::vector<char> longer(100, 'x');
    file.write(longer.data(), unsigned(longer.size()));

    file.load("data/bytes.bin");
    EXPECT_EQ(contentsOf(file), bytes);

    vi::File byPath(assets.pathOf("data/bytes.bin"), false);
    EXPECT_EQ(contentsOf(byPath), bytes);
}

TEST(File, TwoWritesThenFlushMakeOneFileInWriteOrderAndEmptyTheBuffer) {
    AssetDirectory storage;
    vi::File file;
    file.write("abc", 3);
    file.write("12345", 5);
    EXPECT_EQ(file.getLength(), 8u);

    file.flush("a.raw", false);

    EXPECT_EQ(storage.read("a.raw"), (std::vector<char>{'a', 'b', 'c', '1', '2', '3', '4', '5'}));
    EXPECT_EQ(file.getLength(), 0u);
    EXPECT_GE(file.mData.capacity(), 8u);

    // The same object collects the next file; flush truncates an existing one.
    file.write("Z", 1);
    file.flush("a.raw", true);
    EXPECT_EQ(storage.read("a.raw"), std::vector<char>{'Z'});
}

TEST(File, FlushToAPathThatCannotBeCreatedWritesNothingAndStillEmptiesTheBuffer) {
    AssetDirectory storage;
    vi::File file;
    file.write("abc", 3);

    file.flush("no/such/directory/a.raw", false);

    EXPECT_FALSE(storage.exists("no"));
    EXPECT_EQ(file.getLength(), 0u);
    EXPECT_GE(file.mData.capacity(), 3u);
}

TEST(File, EmptyFileAndEmptyAssetHaveLengthZero) {
    AssetDirectory assets;
    assets.write("empty.bin", "");
    vi::File asset("empty.bin", true);
    EXPECT_EQ(asset.getLength(), 0u);
    vi::File file(assets.pathOf("empty.bin"), false);
    EXPECT_EQ(file.getLength(), 0u);

    // A load replaces earlier contents even when the asset is empty.
    vi::File reused;
    reused.write("abc", 3);
    reused.load("empty.bin");
    EXPECT_EQ(reused.getLength(), 0u);
}
