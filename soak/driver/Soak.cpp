// The soak: random sequences of host calls into the runtime built with the
// sanitizers, each played in a child process of its own. It keeps no model of
// the runtime's rules: a fault is a crash, a sanitizer report, a hang, or a
// frame drawn right after a context change that differs from the frame drawn
// right before it (the test scene shows the host's picture, which nothing in
// the change touches). A failing sequence is shrunk to a short reproduction.
// With --cycles, the start and stop cycles of the sample effect instead.
// See soak/README.md.
//
//   vi_soak [--seed N] [--minutes M] [--sequences N] [--replay SEQUENCE:i,j,k]
//   vi_soak --cycles N --sample PLUGIN
#include <signal.h>
#include <sys/wait.h>
#include <unistd.h>

#include <algorithm>
#include <cstdio>
#include <ctime>
#include <map>
#include <numeric>
#include <random>
#include <utility>

#include "Application/AnimationManager.h"
#include "Application/ApplicationVar.h"
#include "FakeJni.h"
#include "GlContext.h"
#include "Render/Renderer.h"
#include "Render/Texture.h"
#include "TestSceneRecord.h"

namespace {

const int kCanvas = 64, kDrawn = 7;  // the pbuffer drawn into; what the test scene's frames return
const unsigned kHangSeconds = 30, kShrinkSeconds = 300;  // a child still playing then ends with SIGALRM

enum Kind { Start, Recycle, Draw, Touch, Param, Orientation, Image, Switch, Loss, NoContext, Plain, Restart };
// Each kind of call: its name, how often it comes in a hundred calls (frames
// and input most, as with a real host), the entry point of those that take no
// argument, and the range of each argument of the others.
struct KindInfo {
    const char* name;
    int weight;
    jint (*entry)(JNIEnv*, jobject);
    std::vector<std::pair<int, int>> ranges;
};
const KindInfo kKinds[] = {
    {"start", 4, nullptr, {{-40, 1200}, {-40, 2000}}}, {"recycleTextures", 2, nullptr, {}},
    {"draw", 33, nullptr, {}}, {"touch", 10, nullptr, {{-100, 1200}, {-100, 2000}, {-1, 3}}},
    {"param", 4, nullptr, {{-1000, 1000}, {-1000, 1000}}}, {"setOrientation", 3, nullptr, {{-1, 2}}},
    {"loadTexture", 10, nullptr, {{0, 9}, {0, 3}, {0, 39}}}, {"contextSwitch", 3, nullptr, {}},
    {"contextLoss", 3, nullptr, {}}, {"contextNone", 2, nullptr, {}},
    {"initEffect", 12, VI_NATIVE(prehandleInitEffect), {}}, {"restart", 3, VI_NATIVE(prehandleRestart), {}},
    {"stop", 2, VI_NATIVE(prehandleStop), {}}, {"menu", 1, VI_NATIVE(prehandleMenuPressed), {}},
    {"volumeUp", 1, VI_NATIVE(prehandleVolumeUpPressed), {}}, {"unlock", 2, VI_NATIVE(prehandleUnlock), {}},
    {"volumeDown", 1, VI_NATIVE(prehandleVolumeDownPressed), {}}, {"affordance", 2, VI_NATIVE(prehandleAffordance), {}},
    {"clearEffect", 2, VI_NATIVE(prehandleClearEffect), {}}};

struct Call {
    int kind, v[4];
};

// Sequence `index` of `seed`, made in full from the two numbers.
std::vector<Call> sequence(std::uint64_t seed, int index) {
    std::mt19937_64 random(seed * 1000003 + std::uint64_t(index));
    auto between = [&random](int low, int high) { return low + int(random() % std::uint64_t(high - low + 1)); };
    std::vector<Call> calls(std::size_t(between(20, 160)));
    for (std::size_t i = 0; i < calls.size(); ++i) {
        Call& call = calls[i];
        for (int pick = between(0, 99); pick >= kKinds[call.kind].weight;) pick -= kKinds[call.kind++].weight;
        // Mostly a frame right after a context change: the one compared with the frame before it.
        if (i && calls[i - 1].kind >= Switch && calls[i - 1].kind < Plain && between(0, 3)) call.kind = Draw;
        int* value = call.v;
        for (const std::pair<int, int>& range : kKinds[call.kind].ranges) *value++ = between(range.first, range.second);
        if (call.kind == Orientation && between(0, 7) == 0) call.v[0] = int(std::uint32_t(random()));  // any int
    }
    return calls;
}

// Plays the calls `only` of sequence `index` (all when empty) as the host's
// Java side would: through the JNI entry points, on the thread that owns the
// GL context. It knows only what a host knows of its own calls, to skip those
// a host does not make: a restart before a start, images with no context
// current. So any part of a
// sequence is one a host may play, which shrinking relies on. The exit status.
int play(std::uint64_t seed, int index, const std::vector<int>& only, bool verbose) {
    const std::vector<Call> calls = sequence(seed, index);
    alarm(kHangSeconds);
    vitest::GlContext gl(kCanvas, kCanvas);
    vitest::FakeJni jni;
    JNIEnv* const env = jni.env();
    gTestScene.names = {"picture"};  // the scene shows the image filed under its first name
    gTestScene.drawResult = kDrawn;
    gTestScene.picture = true;  // over a cleared frame: every frame it draws is defined
    enum { First, Second, None } context = First;
    bool started = false;
    std::vector<std::uint8_t> atChange;  // the frame drawn in the last call, when it changed the context
    auto frame = [&] {  // read back; nothing when the scene drew none or no context is current
        const bool drawn = VI_NATIVE(prehandleDraw)(env, nullptr) == kDrawn && context != None;
        return drawn ? vitest::readPixels(0, 0, kCanvas, kCanvas) : std::vector<std::uint8_t>();
    };
    for (std::size_t k = 0; k < (only.empty() ? calls.size() : only.size()); ++k) {
        const int i = only.empty() ? int(k) : only[k];
        const Call& c = calls.at(std::size_t(i));
        const int w = c.v[2] == 39 ? 1080 : c.v[2] % 13 * 5, h = c.v[2] == 39 ? 1920 : c.v[2] % 9 * 7;
        const std::string image = c.v[0] < 6 ? "picture" : "image";
        if ((c.kind == Restart && !started) || (c.kind == Image && context == None))
            continue;
        if (verbose) std::printf("  %3d: %s %d %d %d %d\n", i, kKinds[c.kind].name, c.v[0], c.v[1], c.v[2], c.v[3]);
        jni.reset();
        std::vector<std::uint8_t> before = std::exchange(atChange, {}), after;
        if (c.kind >= Plain) kKinds[c.kind].entry(env, nullptr);
        if (c.kind == Start) VI_NATIVE(prehandleStart)(env, nullptr, jni.string(VI_SOAK_SCENE), c.v[0], c.v[1]);
        started |= c.kind == Start;
        if (c.kind == Recycle) VI_NATIVE(prehandleRecycleTextures)(env, nullptr);
        if (c.kind == Draw) after = frame();
        if (c.kind == Touch) VI_NATIVE(prehandleTouch)(env, nullptr, c.v[0], c.v[1], c.v[2]);
        if (c.kind == Param) VI_NATIVE(prehandleParam)(env, nullptr, c.v[0], c.v[1]);
        if (c.kind == Orientation) VI_NATIVE(prehandleSetOrientation)(env, nullptr, c.v[0]);
        if (c.kind == Image) {
            std::vector<jint> pixels(std::size_t(w * h));
            std::iota(pixels.begin(), pixels.end(), jint(0xFF102030u - (unsigned(c.v[1]) << 20)));
            VI_NATIVE(loadTexture)(env, nullptr, jni.string(image), jni.intArray(pixels), w, h);
        }
        if (c.kind >= Switch && c.kind < Plain) after = atChange = frame();
        if (c.kind == NoContext) vitest::GlContext::releaseCurrent();
        if (c.kind == Loss) gl.recreate();
        if (c.kind == Switch) context == First ? gl.makeSecondCurrent() : gl.makeCurrent();
        if (c.kind >= Switch && c.kind < Plain)
            context = c.kind == NoContext ? None : c.kind == Switch && context == First ? Second : First;
        if (!before.empty() && !after.empty() && before != after) {
            std::printf("soak: call %d: the frame after a context change differs from the one before\n", i);
            return 3;
        }
    }
    if (context == None) gl.makeCurrent();
    VI_NATIVE(prehandleStop)(env, nullptr);  // as a host leaves, so that the leak checker sees what the scene left
    return 0;
}

// Plays in a fresh child; its exit status, or 128 + the signal that ended it.
int inChild(std::uint64_t seed, int index, const std::vector<int>& only, bool quiet) {
    const pid_t pid = fork();
    if (pid == 0 && quiet && !(std::freopen("/dev/null", "w", stdout) && std::freopen("/dev/null", "w", stderr)))
        _exit(2);
    if (pid == 0) std::exit(play(seed, index, only, false));  // not _exit: the leak checker looks at what is left
    int status = 0;
    waitpid(pid, &status, 0);
    return WIFSIGNALED(status) ? 128 + WTERMSIG(status) : WEXITSTATUS(status);
}

// Drops chunks of calls while what is left still
// fails the same way, halving the chunks when none can go.
void shrink(std::uint64_t seed, int index, int status) {
    std::vector<int> calls(sequence(seed, index).size());
    std::iota(calls.begin(), calls.end(), 0);
    const std::time_t deadline = std::time(nullptr) + kShrinkSeconds;
    int replays = 0;
    for (int chunk = int(calls.size()) / 2; chunk >= 1; chunk /= 2)
        for (int start = 0; start < int(calls.size()) && std::time(nullptr) < deadline; start += chunk) {
            std::vector<int> rest = calls;
            rest.erase(rest.begin() + start, rest.begin() + std::min(start + chunk, int(calls.size())));
            if (rest.empty()) continue;
            ++replays;
            if (inChild(seed, index, rest, true) != status) continue;
            calls = rest;
            start -= chunk;
        }
    std::string list;
    for (const int i : calls) list += (list.empty() ? "" : ",") + std::to_string(i);
    std::printf("soak: shrunk to %zu calls in %d replays; replay with: scripts/soak soak --seed %llu --replay %d:%s\n",
                calls.size(), replays, (unsigned long long)seed, index, list.c_str());
}

// Start and stop cycles of the sample effect, as the host makes them when the
// lock screen comes and goes: start, initialise, a frame, stop or pause; every
// 50th a new wallpaper first (replacing the last), every 70th textures
// recycled, every 90th a lost context and another frame. What the runtime
// keeps across cycles (registries, maps, animations, JNI strings and arrays
// held) must not grow after the first; LeakSanitizer reports at exit
// whatever else was left, beyond the leaks soak/lsan.supp names.
int cycles(int count, const char* sample) {
    vitest::GlContext gl(kCanvas, kCanvas);
    vitest::FakeJni jni;
    JNIEnv* const env = jni.env();
    std::vector<std::size_t> first, last;
    for (int cycle = 0; cycle < count; ++cycle) {
        if (!VI_NATIVE(prehandleStart)(env, nullptr, jni.string(sample), 540, 960)) {
            std::printf("cycles: FAULT: cycle %d: the sample did not start\n", cycle);
            return 1;
        }
        // The sample's first name: the image it draws under the water.
        const std::vector<jint> wallpaper(std::size_t(40 + cycle % 7) * 72, -cycle);
        if (cycle % 50 == 0)
            VI_NATIVE(loadTexture)(env, nullptr, jni.string("wallpaper"), jni.intArray(wallpaper), 40 + cycle % 7, 72);
        VI_NATIVE(prehandleInitEffect)(env, nullptr);
        VI_NATIVE(prehandleDraw)(env, nullptr);
        if (cycle % 70 == 69) VI_NATIVE(prehandleRecycleTextures)(env, nullptr);
        if (cycle % 90 == 89) {
            gl.recreate();
            VI_NATIVE(prehandleDraw)(env, nullptr);
        }
        (cycle % 2 ? VI_NATIVE(prehandlePause) : VI_NATIVE(prehandleStop))(env, nullptr);
        jni.reset();
        (cycle ? last : first) = {vi::Renderer::mAllRenderers.size(), vi::Texture::mAllTextures.size(),
                                  vi::ApplicationVar::msTexturesMap.size(), vi::ApplicationVar::msModelsMap.size(),
                                  vi::AnimationManager::mStorage.size(), std::size_t(jni.outstanding())};
    }
    std::printf("cycles: %d start and stop cycles; what is kept, after the first and the last:", count);
    for (std::size_t k = 0; k < first.size(); ++k) std::printf(" %zu/%zu", first[k], last[k]);
    std::printf("; %s\n", first == last ? "nothing grew" : "FAULT: it grew");
    return first == last ? 0 : 1;
}

}  // namespace

int main(int argc, char** argv) {
    std::map<std::string, std::string> options = {{"--seed", std::to_string(std::random_device()() % 1000000)},
        {"--minutes", "3"}, {"--sequences", "1e9"}, {"--replay", ""}, {"--cycles", "0"}, {"--sample", ""}};
    for (int i = 1; i < argc; i += 2) {
        if (i + 1 == argc || !options.count(argv[i]) || !*argv[i + 1]) {
            std::fprintf(stderr, "usage: see the top of soak/driver/Soak.cpp\n");
            return 2;
        }
        options[argv[i]] = argv[i + 1];
    }
    setvbuf(stdout, nullptr, _IOLBF, 0);
    if (std::stoi(options["--cycles"]) > 0) return cycles(std::stoi(options["--cycles"]), options["--sample"].c_str());
    const std::uint64_t seed = std::stoull(options["--seed"]);
    const std::string replay = options["--replay"];
    std::vector<int> only;  // SEQUENCE:i,j,k
    for (std::size_t at = replay.find(':'); at != std::string::npos; at = replay.find(',', at + 1))
        only.push_back(std::atoi(replay.c_str() + at + 1));
    if (!replay.empty())
        return play(seed, std::atoi(replay.c_str()), only, true);  // in this process
    const double end = double(std::time(nullptr)) + std::stod(options["--minutes"]) * 60;
    long played = 0, callCount = 0, losses = 0, status = 0;
    for (; !status && played < std::stod(options["--sequences"]) && std::time(nullptr) < end; ++played) {
        const std::vector<Call> calls = sequence(seed, int(played));
        callCount += long(calls.size());
        losses += std::count_if(calls.begin(), calls.end(), [](const Call& c) { return c.kind == Loss; });
        status = inChild(seed, int(played), {}, false);
        if (!status) continue;
        std::printf("soak: FAULT with seed %llu in sequence %ld: status %ld%s\n", (unsigned long long)seed, played,
                    status, status == 128 + SIGALRM ? " (a hang)" : ", see above");
        shrink(seed, int(played), int(status));
    }
    std::printf("soak: seed %llu, %ld sequences, %ld calls, %ld context losses, %d faults\n", (unsigned long long)seed,
                played, callCount, losses, status ? 1 : 0);
    return status ? 1 : 0;
}
