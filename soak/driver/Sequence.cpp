#include "Sequence.h"

#include <random>

namespace visoak {

namespace {

// In CallKind order: the name, how many of a, b, c, d it uses, and how often
// it comes (frames and input dominate, as with a real host; lifecycle changes
// and context trouble are common enough to meet each other).
struct KindInfo {
    const char* name;
    int arguments;
    int weight;
};

const KindInfo kKinds[CallKindCount] = {
    {"start", 3, 4},         {"initEffect", 0, 12},     {"restart", 0, 3},     {"stop", 0, 1},
    {"pause", 0, 1},         {"recycleTextures", 0, 2}, {"draw", 0, 30},       {"touch", 3, 10},
    {"menu", 0, 1},          {"volumeUp", 0, 1},        {"volumeDown", 0, 1},  {"key", 1, 2},
    {"param", 2, 4},         {"clearEffect", 0, 2},     {"affordance", 0, 2},  {"unlock", 0, 2},
    {"setOrientation", 1, 3}, {"loadModel", 0, 1},      {"loadTexture", 4, 8}, {"windowRectangle", 4, 2},
    {"contextSwitch", 0, 3}, {"contextLoss", 0, 3},     {"contextNone", 0, 2},
};

std::uint64_t mix(std::uint64_t seed, std::uint64_t stream) {
    std::uint64_t z = seed + 0x9E3779B97F4A7C15ull * (stream + 1);
    z = (z ^ (z >> 30)) * 0xBF58476D1CE4E5B9ull;
    z = (z ^ (z >> 27)) * 0x94D049BB133111EBull;
    return z ^ (z >> 31);
}

}  // namespace

std::vector<Call> makeSequence(std::uint64_t seed, int index) {
    std::mt19937_64 random(mix(seed, std::uint64_t(index)));
    auto below = [&random](int n) { return int(random() % std::uint64_t(n)); };
    auto between = [&](int low, int high) { return low + below(high - low + 1); };
    int total = 0;
    for (const KindInfo& kind : kKinds) total += kind.weight;

    std::vector<Call> calls;
    const int length = between(20, 160);
    while (int(calls.size()) < length) {
        Call call = {CallDraw, 0, 0, 0, 0};
        for (int pick = below(total), k = 0; k < CallKindCount; pick -= kKinds[k++].weight)
            if (pick < kKinds[k].weight) {
                call.kind = CallKind(k);
                break;
            }
        switch (call.kind) {
            case CallStart:
                call = {CallStart, below(20), below(10) ? between(1, 1200) : between(-4, 0),
                        below(10) ? between(1, 2000) : between(-4, 0), 0};
                break;
            case CallTouch:
                call = {CallTouch, between(-100, 1200), between(-100, 2000), below(12) ? below(3) : between(-5, 9), 0};
                break;
            case CallKey:
                // 67 ('C') blocks its caller for good, by design; 84 ('T') is the self-test.
                call.a = below(4) == 0 ? 65 : below(3) == 0 ? 85 : below(1100);
                if (call.a == 67 || call.a == 84) ++call.a;
                break;
            case CallParam:
                call = {CallParam, between(-1000, 1000), between(-1000, 1000), 0, 0};
                break;
            case CallSetOrientation:
                call.a = below(8) ? below(2) : int(std::uint32_t(random()));
                break;
            case CallLoadTexture:
                call = {CallLoadTexture, below(10), below(4), below(40), below(6) == 0};
                break;
            case CallWindow:
                call = {CallWindow, between(-50, 500), between(-50, 500), between(-3, 1200), between(-3, 2000)};
                break;
            default:
                break;
        }
        calls.push_back(call);
        // Mostly a frame right after a context change: the frame checked against the one before it.
        if (call.kind >= CallContextSwitch && below(4)) calls.push_back(Call{CallDraw, 0, 0, 0, 0});
    }
    return calls;
}

std::string describe(const Call& call) {
    const int values[4] = {call.a, call.b, call.c, call.d};
    std::string text = std::string(kKinds[call.kind].name) + "(";
    for (int i = 0; i < kKinds[call.kind].arguments; ++i) text += (i ? ", " : "") + std::to_string(values[i]);
    return text + ")";
}

}  // namespace visoak
