#include "ModelFile.h"

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <cmath>
#include <cstdio>
#include <algorithm>
#include <cstring>
#include <limits>

namespace vi {

namespace {

// Byte order is spelled out rather than taken from the host, so a file made
// on any machine is what the little-endian devices read.
void putU32(std::vector<std::uint8_t>& out, std::uint32_t value) {
    out.push_back(std::uint8_t(value));
    out.push_back(std::uint8_t(value >> 8));
    out.push_back(std::uint8_t(value >> 16));
    out.push_back(std::uint8_t(value >> 24));
}

void putU16(std::vector<std::uint8_t>& out, std::uint16_t value) {
    out.push_back(std::uint8_t(value));
    out.push_back(std::uint8_t(value >> 8));
}

void putFloat(std::vector<std::uint8_t>& out, float value) {
    std::uint32_t bits;
    std::memcpy(&bits, &value, sizeof bits);
    putU32(out, bits);
}

std::uint32_t getU32(const std::uint8_t* p) {
    return std::uint32_t(p[0]) | (std::uint32_t(p[1]) << 8) | (std::uint32_t(p[2]) << 16) |
           (std::uint32_t(p[3]) << 24);
}

std::uint16_t getU16(const std::uint8_t* p) { return std::uint16_t(p[0] | (p[1] << 8)); }

float getFloat(const std::uint8_t* p) {
    std::uint32_t bits = getU32(p);
    float value;
    std::memcpy(&value, &bits, sizeof value);
    return value;
}

std::string describeErrno() { return std::strerror(errno); }

}  // namespace

std::vector<std::uint8_t> ModelFile::encode(const MeshData& mesh) {
    const std::size_t vertexCount = mesh.positions.size();
    std::vector<std::uint8_t> out;
    out.reserve(std::size_t(ModelLayout::fileSize(vertexCount, mesh.indices.size())));
    putU32(out, std::uint32_t(vertexCount));
    putU32(out, std::uint32_t(mesh.indices.size()));
    for (const glm::vec3& p : mesh.positions) {
        putFloat(out, p.x);
        putFloat(out, p.y);
        putFloat(out, p.z);
    }
    for (const glm::vec3& n : mesh.normals) {
        putFloat(out, n.x);
        putFloat(out, n.y);
        putFloat(out, n.z);
    }
    for (const glm::vec2& t : mesh.texCoords) {
        putFloat(out, t.x);
        putFloat(out, t.y);
    }
    for (std::uint32_t index : mesh.indices) putU16(out, std::uint16_t(index));
    return out;
}

bool ModelFile::inspect(const std::vector<std::uint8_t>& bytes, Info& info, std::string& error) {
    return checkCounts(bytes.data(), bytes.size(), info, error) && checkContents(bytes, info, error);
}

bool ModelFile::checkCounts(const std::uint8_t* header, std::uint64_t fileSize, Info& info, std::string& error) {
    info = Info();
    info.fileSize = fileSize;
    if (fileSize < ModelLayout::kHeaderSize) {
        error = "the file has " + std::to_string(fileSize) + " bytes, too short for the 8-byte header";
        return false;
    }
    info.vertexCount = getU32(header + ModelLayout::kVertexCountOffset);
    info.indexCount = getU32(header + ModelLayout::kIndexCountOffset);
    info.expectedSize = ModelLayout::fileSize(info.vertexCount, info.indexCount);
    const std::string counts =
        "V = " + std::to_string(info.vertexCount) + " and I = " + std::to_string(info.indexCount);
    if (info.fileSize < info.expectedSize) {
        error = "the file is truncated: " + std::to_string(info.fileSize) + " bytes, but " + counts + " need " +
                std::to_string(info.expectedSize);
        return false;
    }
    if (info.fileSize > info.expectedSize) {
        error = "the file has " + std::to_string(info.fileSize - info.expectedSize) + " bytes more than the " +
                std::to_string(info.expectedSize) + " that " + counts + " need";
        return false;
    }
    if (info.indexCount % 3 != 0) {
        error = "the index count " + std::to_string(info.indexCount) + " is not a multiple of 3";
        return false;
    }
    if (info.indexCount == 0 && info.vertexCount % 3 != 0) {
        error = "without indices the vertex count " + std::to_string(info.vertexCount) +
                " must be a multiple of 3";
        return false;
    }
    return true;
}

bool ModelFile::checkContents(const std::vector<std::uint8_t>& bytes, Info& info, std::string& error) {
    const std::uint8_t* indices = bytes.data() + ModelLayout::indicesOffset(info.vertexCount);
    for (std::uint32_t i = 0; i < info.indexCount; ++i) {
        std::uint16_t index = getU16(indices + 2 * i);
        if (index >= info.vertexCount) {
            error = "index " + std::to_string(i) + " is " + std::to_string(index) + ", past the last vertex " +
                    std::to_string(info.vertexCount) + " - 1";
            return false;
        }
    }
    if (info.vertexCount > 0) {
        info.boundsMin = glm::vec3(std::numeric_limits<float>::max());
        info.boundsMax = glm::vec3(-std::numeric_limits<float>::max());
        const std::uint8_t* positions = bytes.data() + ModelLayout::positionsOffset(info.vertexCount);
        for (std::uint32_t v = 0; v < info.vertexCount; ++v) {
            glm::vec3 p(getFloat(positions + 12 * v), getFloat(positions + 12 * v + 4),
                        getFloat(positions + 12 * v + 8));
            if (!std::isfinite(p.x) || !std::isfinite(p.y) || !std::isfinite(p.z)) {
                error = "vertex " + std::to_string(v) + " has a position that is not a finite number";
                return false;
            }
            info.boundsMin = glm::min(info.boundsMin, p);
            info.boundsMax = glm::max(info.boundsMax, p);
        }
    }
    return true;
}

ModelFile::Verdict ModelFile::check(const std::string& path, Info& info, std::string& error) {
    // The counts are checked against the file's length before its contents
    // are read, so that a large file of other data costs one small read.
    std::FILE* file = std::fopen(path.c_str(), "rb");
    if (!file) {
        error = "cannot open '" + path + "': " + describeErrno();
        return Unreadable;
    }
    struct stat status;
    std::uint8_t header[ModelLayout::kHeaderSize];
    const bool statted = ::fstat(fileno(file), &status) == 0;
    const std::size_t headerRead = std::fread(header, 1, sizeof header, file);
    std::fclose(file);
    if (!statted || !S_ISREG(status.st_mode)) {
        error = "'" + path + "' is not a file";
        return Unreadable;
    }
    const std::uint64_t size = std::uint64_t(status.st_size);
    if (headerRead < std::min<std::uint64_t>(size, sizeof header)) {
        error = "cannot read '" + path + "'";
        return Unreadable;
    }
    if (!checkCounts(header, size, info, error)) return Invalid;
    std::vector<std::uint8_t> bytes;
    if (!readWhole(path, bytes, error)) return Unreadable;
    if (bytes.size() != size) {
        error = "'" + path + "' changed while it was read";
        return Unreadable;
    }
    return checkContents(bytes, info, error) ? Valid : Invalid;
}

bool ModelFile::writeAtomically(const std::string& path, const std::vector<std::uint8_t>& bytes,
                                std::string& error) {
    // The temporary lives in the target's directory so that rename() never
    // crosses a file system and the switch is all or nothing.
    std::string pattern = path + ".partial-XXXXXX";
    std::vector<char> name(pattern.begin(), pattern.end());
    name.push_back('\0');
    int fd = mkstemp(name.data());
    if (fd < 0) {
        error = "cannot create a file beside '" + path + "': " + describeErrno();
        return false;
    }
    std::size_t done = 0;
    while (done < bytes.size()) {
        ssize_t n = ::write(fd, bytes.data() + done, bytes.size() - done);
        if (n < 0 && errno == EINTR) continue;
        if (n <= 0) {
            error = "cannot write '" + std::string(name.data()) + "': " + describeErrno();
            ::close(fd);
            ::unlink(name.data());
            return false;
        }
        done += std::size_t(n);
    }
    // mkstemp makes the file private; a model is an ordinary data file.
    mode_t mask = ::umask(0);
    ::umask(mask);
    ::fchmod(fd, 0666 & ~mask);
    if (::close(fd) != 0) {
        error = "cannot write '" + std::string(name.data()) + "': " + describeErrno();
        ::unlink(name.data());
        return false;
    }
    if (std::rename(name.data(), path.c_str()) != 0) {
        error = "cannot rename the finished file to '" + path + "': " + describeErrno();
        ::unlink(name.data());
        return false;
    }
    return true;
}

bool ModelFile::readWhole(const std::string& path, std::vector<std::uint8_t>& bytes, std::string& error) {
    std::FILE* file = std::fopen(path.c_str(), "rb");
    if (!file) {
        error = "cannot open '" + path + "': " + describeErrno();
        return false;
    }
    bytes.clear();
    std::uint8_t chunk[65536];
    std::size_t n;
    while ((n = std::fread(chunk, 1, sizeof chunk, file)) > 0) bytes.insert(bytes.end(), chunk, chunk + n);
    bool failed = std::ferror(file) != 0;
    std::fclose(file);
    if (failed) {
        error = "cannot read '" + path + "'";
        return false;
    }
    return true;
}

}  // namespace vi
