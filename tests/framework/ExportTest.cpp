// Plug-ins link against the shared runtime: the asset functions must be
// exported under their NDK names, so this binary links only the shared library.
#include <gtest/gtest.h>

#include <dlfcn.h>

#include <string>
#include <utility>

#include <android/asset_manager.h>

TEST(SharedRuntime, ExportsTheAssetFunctionsUnderTheirNdkNames) {
    // Linking at all proves the names are exported; dladdr proves by whom.
    const std::pair<const char*, void*> functions[] = {
        {"AAssetManager_open", reinterpret_cast<void*>(&AAssetManager_open)},
        {"AAsset_getLength", reinterpret_cast<void*>(&AAsset_getLength)},
        {"AAsset_read", reinterpret_cast<void*>(&AAsset_read)},
        {"AAsset_close", reinterpret_cast<void*>(&AAsset_close)}};
    for (const auto& [name, address] : functions) {
        Dl_info info;
        ASSERT_NE(dladdr(address, &info), 0) << name;
        EXPECT_NE(std::string(info.dli_fname).find("libtarqvevyncommon.so"), std::string::npos) << info.dli_fname;
        EXPECT_STREQ(info.dli_sname, name);
    }
}
