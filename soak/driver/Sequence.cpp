#include <random>

#include "Player.h"

namespace visoak {

namespace {

// In CallKind order: the name, how often it comes (frames and input dominate,
// as with a real host; lifecycle changes and context trouble are common
// enough to meet each other), and the range of each argument it takes.
struct KindInfo {
    const char* name;
    int weight;
    int arguments = 0;
    int ranges[4][2] = {};
};

const KindInfo kKinds[CallKindCount] = {
    {"start", 4, 3, {{0, 19}, {-40, 1200}, {-40, 2000}}}, {"initEffect", 12}, {"restart", 3}, {"stop", 1},
    {"pause", 1}, {"recycleTextures", 2}, {"draw", 30}, {"touch", 10, 3, {{-100, 1200}, {-100, 2000}, {-1, 3}}},
    {"menu", 1}, {"volumeUp", 1}, {"volumeDown", 1}, {"key", 2, 1, {{60, 90}}},
    {"param", 4, 2, {{-1000, 1000}, {-1000, 1000}}}, {"clearEffect", 2}, {"affordance", 2}, {"unlock", 2},
    {"setOrientation", 3, 1, {{-1, 2}}}, {"loadModel", 1}, {"loadTexture", 8, 4, {{0, 9}, {0, 3}, {0, 39}, {0, 5}}},
    {"windowRectangle", 2, 4, {{-50, 500}, {-50, 500}, {-3, 1200}, {-3, 2000}}},
    {"contextSwitch", 3}, {"contextLoss", 3}, {"contextNone", 2},
};

}  // namespace

std::vector<Call> makeSequence(std::uint64_t seed, int index) {
    std::seed_seq seeds{std::uint32_t(seed), std::uint32_t(seed >> 32), std::uint32_t(index)};
    std::mt19937_64 random(seeds);
    auto between = [&random](int low, int high) { return low + int(random() % std::uint64_t(high - low + 1)); };
    int total = 0;
    for (const KindInfo& kind : kKinds) total += kind.weight;

    std::vector<Call> calls;
    for (int length = between(20, 160); int(calls.size()) < length;) {
        int kind = 0;
        for (int pick = between(0, total - 1); pick >= kKinds[kind].weight; pick -= kKinds[kind++].weight) {
        }
        int values[4] = {0, 0, 0, 0};
        for (int i = 0; i < kKinds[kind].arguments; ++i) values[i] = between(kKinds[kind].ranges[i][0], kKinds[kind].ranges[i][1]);
        // 67 ('C') blocks its caller for good, by design; 84 ('T') runs the self-test.
        if (kind == CallKey && (values[0] == 67 || values[0] == 84)) ++values[0];
        if (kind == CallSetOrientation && between(0, 7) == 0) values[0] = int(std::uint32_t(random()));
        calls.push_back(Call{CallKind(kind), values[0], values[1], values[2], values[3]});
        // Mostly a frame right after a context change: the frame compared with the one before it.
        if (kind >= CallContextSwitch && between(0, 3)) calls.push_back(Call{CallDraw, 0, 0, 0, 0});
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
