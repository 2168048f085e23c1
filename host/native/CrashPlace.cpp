#include "CrashPlace.h"

#include <dlfcn.h>
#include <execinfo.h>
#include <fcntl.h>
#include <link.h>
#include <unistd.h>

#include <climits>
#include <cstring>
#include <utility>

#include "HelperProgram.h"

namespace {

// How deep the stack is searched for the effect's frames.
constexpr int kMostFrames = 64;
// The plug-ins whose frames are the effect's: the one running and the one
// before, which the live window starts again when a new build does not load.
constexpr int kEffects = 2;
// The effect's frames named, from the fault out, to find the first in the
// author's own sources.
constexpr int kMostNamed = 16;
// The lines read from addr2line: for each frame its address, and a pair of
// lines for the frame's function and for each function inlined into it.
constexpr int kMostLines = 512;

struct Effect {
    char path[PATH_MAX] = {};
    int file = -1;
};

Effect gEffects[kEffects];
void* gFrames[kMostFrames];
FixedText<32768> gAnswer;
FixedText<24> gOffsets[kMostNamed];
FixedText<32> gEffectFile;
const char* gArguments[kMostNamed + 8];

const Effect* effectAt(const char* path) {
    for (const Effect& effect : gEffects) {
        if (effect.file >= 0 && std::strcmp(effect.path, path) == 0) return &effect;
    }
    return nullptr;
}

// "??" for a function or a place addr2line cannot name; "Fx.cpp:?" for a
// place whose file the symbol table knows and whose line only debug information would.
bool isUnknown(const char* place) {
    const std::size_t length = std::strlen(place);
    return std::strncmp(place, "??", 2) == 0 || (length >= 2 && std::strcmp(place + length - 2, ":?") == 0);
}

bool isSystemHeader(const char* place) {
    return std::strncmp(place, "/usr/include/", 13) == 0 || std::strncmp(place, "/usr/lib/", 9) == 0;
}

// The kit's code compiled into the plug-in (its helpers' library, the inline
// code of its installed headers) is not the author's to change: the author's
// own call into it is the place to name.
bool isKitSource(const char* place) {
    return std::strstr(place, "/helpers/Helpers/") || std::strstr(place, "/include/tarqvevyn/");
}

const char* baseName(const char* path) {
    const char* slash = std::strrchr(path, '/');
    return slash ? slash + 1 : path;
}

// Splits a text into its lines, in place.
int splitLines(char* text, char* lines[], int most) {
    int count = 0;
    for (char* line = text; *line && count < most;) {
        lines[count++] = line;
        char* end = std::strchr(line, '\n');
        if (!end) break;
        *end = '\0';
        line = end + 1;
    }
    return count;
}

// The compiler's notes on how it built the code mean nothing to the author.
void dropCompilerNotes(char* function, char* place) {
    char* clone = std::strstr(function, " [clone ");
    if (clone) *clone = '\0';
    char* discriminator = place ? std::strstr(place, " (discriminator") : nullptr;
    if (discriminator) *discriminator = '\0';
}

// addr2line's answer holds, for each address (a line "0x..."), pairs of
// lines, function then file:line in it, from the innermost function inlined
// there out to the frame's own. The place told is the first in the author's
// own sources (neither a system header nor the kit's), with its function; the fault's own place when there is none.
// Without debug information there is no place, and the symbol table may
// still name the fault's function: false, with that name in `function`.
bool describePlace(char* answer, char*& function, CrashPlace::Detail& detail) {
    char* lines[kMostLines];
    const int count = splitLines(answer, lines, kMostLines);
    char* place = nullptr;
    function = count > 1 && !isUnknown(lines[1]) ? lines[1] : nullptr;
    int frame = -1;
    for (int line = 0; line < count; ++line) {
        if (std::strncmp(lines[line], "0x", 2) == 0) {
            frame = line + 1;
        } else if (frame >= 0 && (line - frame) % 2 == 1 && !isUnknown(lines[line])) {
            const bool own = !isSystemHeader(lines[line]) && !isKitSource(lines[line]);
            if (!place || own) {
                function = lines[line - 1];
                place = lines[line];
            }
            if (own) break;
        }
    }
    if (function) dropCompilerNotes(function, place);
    if (!place) return false;
    detail << "  in " << function << " at " << place;
    return true;
}

// Names the first `count` of gOffsets in the library `file`; `keep` is the
// library's open file when `file` names it by its descriptor.
void describeFrames(const char* file, int count, int keep, const char* library, bool inEffect,
                    CrashPlace::Detail& detail) {
    std::size_t argument = 0;
    for (const char* word : {"addr2line", "-a", "-f", "-C", "-i", "-e", file}) gArguments[argument++] = word;
    for (int offset = 0; offset < count; ++offset) gArguments[argument++] = gOffsets[offset].data;
    gArguments[argument] = nullptr;
    gAnswer.clear();
    const int status = HelperProgram::run(gArguments, keep, gAnswer.data, sizeof(gAnswer.data));
    char* function = nullptr;
    if (status == 0 && describePlace(gAnswer.data, function, detail)) {
        if (!inEffect) detail << " (" << library << ")";
        detail << "\n";
        return;
    }
    if (function) {
        detail << "  in " << function << " at ";
    } else {
        detail << "  at ";
    }
    detail << library << "+" << gOffsets[0].data;
    if (status == HelperProgram::kNotFound) {
        detail << ": addr2line (binutils) is not installed to name the function and line\n";
    } else {
        detail << ": the library has no debug information; build it with -g to see the file and line\n";
    }
}

}  // namespace

void CrashPlace::watchEffect(const std::string& path) {
    if (path.size() >= sizeof(gEffects[0].path) || path == gEffects[0].path) return;
    if (path == gEffects[1].path) {
        std::swap(gEffects[0], gEffects[1]);
        return;
    }
    if (gEffects[1].file >= 0) close(gEffects[1].file);
    gEffects[1] = gEffects[0];
    std::strcpy(gEffects[0].path, path.c_str());
    gEffects[0].file = open(path.c_str(), O_RDONLY | O_CLOEXEC);
}

void CrashPlace::prepare() { backtrace(gFrames, 1); }

bool CrashPlace::describe(uintptr_t faulting, uintptr_t caller, Detail& detail) {
    // The faulting frame is found on the stack by its address, past the handlers' frames.
    int count = backtrace(gFrames, kMostFrames);
    int first = 0;
    while (first < count && uintptr_t(gFrames[first]) != faulting) ++first;
    if (first == count || first + 1 == kMostFrames) {
        // The unwinder did not get past the handlers: the faulting frame alone.
        gFrames[0] = reinterpret_cast<void*>(faulting);
        first = 0;
        count = 1;
    }
    if (caller) {
        // No unwinder gets past a frame with no code: its caller is the last frame.
        gFrames[first + 1] = reinterpret_cast<void*>(caller);
        count = first + 2;
    }
    const Effect* effect = nullptr;
    const char* outside = nullptr;
    int named = 0;
    for (int frame = first; frame < count && named < kMostNamed; ++frame) {
        // A caller's frame holds the address after its call: one back is the call.
        const uintptr_t address = uintptr_t(gFrames[frame]) - (frame == first ? 0 : 1);
        Dl_info info;
        link_map* library = nullptr;
        if (!dladdr1(reinterpret_cast<void*>(address), &info, reinterpret_cast<void**>(&library), RTLD_DL_LINKMAP) ||
            !info.dli_fname || !library) {
            continue;
        }
        const Effect* in = effectAt(info.dli_fname);
        if (in && (!effect || in == effect)) {
            // The effect's frames take the place of the innermost one outside it.
            if (!effect) named = 0;
            effect = in;
        } else if (in || effect || outside) {
            continue;
        } else {
            outside = info.dli_fname;
        }
        gOffsets[named].clear();
        gOffsets[named++].number(address - library->l_addr, 16);
    }
    if (effect) {
        gEffectFile.clear();
        gEffectFile << "/proc/self/fd/";
        gEffectFile.number(unsigned(effect->file), 10);
        describeFrames(gEffectFile.data, named, effect->file, baseName(effect->path), true, detail);
    } else if (outside) {
        describeFrames(outside, 1, -1, baseName(outside), false, detail);
    }
    return effect != nullptr;
}
