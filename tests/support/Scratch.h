#pragma once

// A fresh directory under /tmp for the test's files, removed with everything
// in it at the end.

#include <stdlib.h>

#include <filesystem>
#include <fstream>
#include <iterator>
#include <string>
#include <vector>

namespace vitest {

class ScratchDirectory {
public:
    ScratchDirectory() {
        char pattern[] = "/tmp/vi-test-XXXXXX";
        mPath = mkdtemp(pattern);
    }
    ~ScratchDirectory() { std::filesystem::remove_all(mPath); }
    ScratchDirectory(const ScratchDirectory&) = delete;
    ScratchDirectory& operator=(const ScratchDirectory&) = delete;

    const std::string& path() const { return mPath; }
    std::string pathOf(const std::string& name) const { return mPath + "/" + name; }
    bool exists(const std::string& name) const { return std::filesystem::exists(pathOf(name)); }

    // Writes text or bytes, making the folders on the way.
    void write(const std::string& name, const std::string& bytes) const {
        std::filesystem::create_directories(std::filesystem::path(pathOf(name)).parent_path());
        std::ofstream(pathOf(name), std::ios::binary) << bytes;
    }
    template <class Byte>
    void write(const std::string& name, const std::vector<Byte>& bytes) const {
        write(name, std::string(bytes.begin(), bytes.end()));
    }

    template <class Byte = char>
    std::vector<Byte> read(const std::string& name) const {
        std::ifstream in(pathOf(name), std::ios::binary);
        return std::vector<Byte>(std::istreambuf_iterator<char>(in), std::istreambuf_iterator<char>());
    }

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

}  // namespace vitest
