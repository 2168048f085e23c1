#include "FatalExit.h"

#include <GLES2/gl2.h>
#include <dlfcn.h>
#include <ftw.h>
#include <unistd.h>

#include <cctype>
#include <cstdio>
#include <cstdlib>
#include <sstream>
#include <vector>

#include "Tools/DirectoryAssetManager.h"
#include "Tools/FatalReport.h"

namespace {

std::string gProgram;
std::string gAssetDirectory;
std::vector<std::string> gRemoveOnExit;

// The report's parts: the detail between its first quote and the location block.
const char kFileMark[] = "\"\nIn file : \"";
const char kFunctionMark[] = "In function : \"";
const char kLineMark[] = "\"\nIn line : ";
const char kFileNameMark[] = "Invalid file name: \"";

// The line of the shader a driver's log line names ("0:5(33): error: ..." from
// Mesa, "ERROR: 0:5: ..." from others), or 0.
int namedShaderLine(const std::string& logLine) {
    std::size_t at = 0;
    while (at < logLine.size() && std::isalpha(static_cast<unsigned char>(logLine[at]))) ++at;
    at = at > 0 && logLine.compare(at, 2, ": ") == 0 ? at + 2 : 0;
    int source = 0;
    int line = 0;
    char after = 0;
    if (std::sscanf(logLine.c_str() + at, "%d:%d%c", &source, &line, &after) == 3 && (after == '(' || after == ':')) {
        return line;
    }
    return 0;
}

std::vector<std::string> lines(const std::string& text) {
    std::vector<std::string> result;
    std::istringstream stream(text);
    for (std::string line; std::getline(stream, line);) result.push_back(line);
    return result;
}

// Each line of a text that has any, two spaces in.
std::string indented(const std::string& text) {
    std::string result;
    for (const std::string& line : lines(text)) {
        if (!line.empty()) result += "  " + line + "\n";
    }
    return result;
}

// The first line of every message: what happened, and the runtime's status.
std::string headline(const std::string& what, int status) {
    return gProgram + ": error: " + what + " (the effect ended with status " + std::to_string(status) + ")\n";
}

int removeOne(const char* path, const struct stat*, int, struct FTW*) {
    std::remove(path);
    return 0;
}

}  // namespace

void FatalExit::watch(const std::string& program) {
    if (gProgram.empty()) std::atexit(onExit);
    gProgram = program;
}

void FatalExit::setAssetDirectory(const std::string& directory) { gAssetDirectory = directory; }

void FatalExit::removeOnFatalExit(const std::string& path) { gRemoveOnExit.push_back(path); }

const std::vector<std::string>& FatalExit::pathsToRemove() { return gRemoveOnExit; }

// Runs on the thread that called exit(): for a report, the GL thread, still
// inside the failing function, whose frame (and the report in it) exit() never leaves.
void FatalExit::onExit() {
    const std::string* report = vi::FatalReport::msLastReport;
    if (!report) return;
    const std::size_t fileMark = report->rfind(kFileMark);
    const std::size_t functionMark = report->rfind(kFunctionMark);
    const std::size_t lineMark = report->rfind(kLineMark);
    if (fileMark == std::string::npos || functionMark == std::string::npos || lineMark < functionMark) return;
    const std::string detail = report->substr(1, fileMark - 1);
    const std::size_t functionStart = functionMark + sizeof(kFunctionMark) - 1;
    const std::string function = report->substr(functionStart, lineMark - functionStart);
    const int status = std::atoi(report->c_str() + lineMark + sizeof(kLineMark) - 1);
    std::fputs(explain(detail, function, status).c_str(), stderr);
    // Deepest first, links not followed: only what the host itself was writing goes.
    for (const std::string& path : gRemoveOnExit) nftw(path.c_str(), removeOne, 16, FTW_DEPTH | FTW_PHYS);
}

std::string FatalExit::explain(const std::string& detail, const std::string& function, int status) {
    if (function == "compileShader") return explainShader(detail, status);
    if (function == "init") return headline("the shader program does not link", status) + indented(detail);
    const bool isAsset = function == "load";
    if ((isAsset || function == "File") && detail.compare(0, sizeof(kFileNameMark) - 1, kFileNameMark) == 0) {
        const std::size_t start = sizeof(kFileNameMark) - 1;
        return explainFile(detail.substr(start, detail.size() - start - 1), isAsset, status);
    }
    return headline("the effect ended", status) + indented(detail);
}

// The driver's log as it is; after each line that names a line of the shader, that line.
std::string FatalExit::explainShader(const std::string& log, int status) {
    using SourceFunction = const char* (*)(GLenum*);
    auto lastSource = reinterpret_cast<SourceFunction>(dlsym(RTLD_DEFAULT, "vi_shader_sources_last"));
    GLenum type = 0;
    const char* source = lastSource ? lastSource(&type) : nullptr;
    const char* which = type == GL_VERTEX_SHADER ? "the vertex shader" : type == GL_FRAGMENT_SHADER
        ? "the fragment shader" : "a shader";
    std::string message = headline(std::string(which) + " does not compile", status);
    const std::vector<std::string> sourceLines = lines(source ? source : "");
    for (const std::string& line : lines(log)) {
        message += indented(line);
        const int named = namedShaderLine(line);
        if (named > 0 && std::size_t(named) <= sourceLines.size()) {
            message += "  shader line " + std::to_string(named) + ": " + sourceLines[std::size_t(named) - 1] + "\n";
        }
    }
    return message;
}

// The name, the folder searched, and why nothing was found there.
std::string FatalExit::explainFile(const std::string& name, bool isAsset, int status) {
    if (!isAsset) {
        char directory[4096];
        const bool relative = name.empty() || name[0] != '/';
        std::string message = headline("the effect could not open a file", status) + "  " + name;
        if (relative && getcwd(directory, sizeof(directory))) message += std::string(", searched in ") + directory;
        return message + "\n";
    }
    if (gAssetDirectory.empty()) {
        return headline("the effect asked for an asset, and it has no asset folder", status) + "  " + name +
            ": give the folder with --assets DIR, or put assets/ beside the plug-in\n";
    }
    std::string path;
    switch (vi::DirectoryAssetManager::find(gAssetDirectory, name.c_str(), path)) {
        case vi::DirectoryAssetManager::Lookup::Outside:
            return headline("the effect asked for an asset outside its asset folder", status) + "  " + name +
                " leads out of " + gAssetDirectory + "; an asset is named relative to that folder, and never leaves it\n";
        case vi::DirectoryAssetManager::Lookup::NotAFile:
            return headline("the effect asked for an asset that is not a file", status) + "  " + name +
                " is a folder or a device in " + gAssetDirectory + "\n";
        case vi::DirectoryAssetManager::Lookup::Missing:
        case vi::DirectoryAssetManager::Lookup::Found:
            break;
    }
    return headline("the effect asked for an asset that does not exist", status) + "  " + name + ", searched in " +
        gAssetDirectory + "\n";
}
