#pragma once

// A fresh directory under /tmp for the test's files, removed with everything
// in it at the end.

#include <stdlib.h>

#include <cstdint>
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

    void write(const std::string& name, const std::string& text) const { writeRaw(name, text.data(), text.size()); }
    void write(const std::string& name, const std::vector<char>& bytes) const {
        writeRaw(name, bytes.data(), bytes.size());
    }
    void write(const std::string& name, const std::vector<std::uint8_t>& bytes) const {
        writeRaw(name, bytes.data(), bytes.size());
    }

    template <class Byte = char>
    std::vector<Byte> read(const std::string& name) const {
        std::ifstream in(pathOf(name), std::ios::binary);
        return std::vector<Byte>(std::istreambuf_iterator<char>(in), std::istreambuf_iterator<char>());
    }

    bool exists(const std::string& name) const { return std::filesystem::exists(pathOf(name)); }

    // Every entry of the directory, so a test can see that nothing was left behind.
    std::vector<std::string> entries() const {
        std::vector<std::string> names;
        for (const auto& entry : std::filesystem::directory_iterator(mPath))
            names.push_back(entry.path().filename().string());
        return names;
    }

private:
    void writeRaw(const std::string& name, const void* data, std::size_t size) const {
        std::filesystem::create_directories(std::filesystem::path(pathOf(name)).parent_path());
        std::ofstream out(pathOf(name), std::ios::binary);
        out.write(static_cast<const char*>(data), std::streamsize(size));
    }

    std::string mPath;
};

}  // namespace vitest
