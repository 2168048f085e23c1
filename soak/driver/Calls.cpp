#include "Calls.h"

#include <cstdio>
#include <random>

namespace visoak {

namespace {

// Relative frequencies: frames and input dominate, as with a real host;
// lifecycle changes and context trouble are common enough to meet each other.
struct Weight {
    CallKind kind;
    int weight;
};

const Weight kWeights[] = {
    {CallStart, 4},      {CallInitEffect, 12},     {CallRestart, 3},       {CallStop, 1},
    {CallPause, 1},      {CallRecycleTextures, 2}, {CallDraw, 30},         {CallTouch, 10},
    {CallMenu, 1},       {CallVolumeUp, 1},        {CallVolumeDown, 1},    {CallParam, 4},
    {CallClearEffect, 2}, {CallAffordance, 2},     {CallUnlock, 2},        {CallSetOrientation, 3},
    {CallLoadModel, 1},  {CallLoadTexture, 8},     {CallKey, 3},           {CallWindow, 2},
    {CallContextSwitch, 3}, {CallContextLoss, 3},  {CallContextNone, 2},
};

// The developer self-test (84) restarts the effect up to a few hundred times:
// rare, so that it does not take the run over.
const int kSelfTestPerMille = 15;

}  // namespace

std::uint64_t mixSeed(std::uint64_t seed, std::uint64_t stream) {
    std::uint64_t z = seed + 0x9E3779B97F4A7C15ull * (stream + 1);
    z = (z ^ (z >> 30)) * 0xBF58476D1CE4E5B9ull;
    z = (z ^ (z >> 27)) * 0x94D049BB133111EBull;
    return z ^ (z >> 31);
}

const char* callName(CallKind kind) {
    switch (kind) {
        case CallStart: return "start";
        case CallInitEffect: return "initEffect";
        case CallRestart: return "restart";
        case CallStop: return "stop";
        case CallPause: return "pause";
        case CallRecycleTextures: return "recycleTextures";
        case CallDraw: return "draw";
        case CallTouch: return "touch";
        case CallMenu: return "menu";
        case CallVolumeUp: return "volumeUp";
        case CallVolumeDown: return "volumeDown";
        case CallParam: return "param";
        case CallClearEffect: return "clearEffect";
        case CallAffordance: return "affordance";
        case CallUnlock: return "unlock";
        case CallSetOrientation: return "setOrientation";
        case CallLoadModel: return "loadModel";
        case CallLoadTexture: return "loadTexture";
        case CallKey: return "key";
        case CallWindow: return "windowRectangle";
        case CallContextSwitch: return "contextSwitch";
        case CallContextLoss: return "contextLoss";
        case CallContextNone: return "contextNone";
        case CallKindCount: return "?";
    }
    return "?";
}

std::string describe(const Call& call) {
    char text[160];
    switch (call.kind) {
        case CallStart:
            std::snprintf(text, sizeof(text), "start(plug-in choice %d, %d x %d)", call.a, call.b, call.c);
            break;
        case CallTouch:
            std::snprintf(text, sizeof(text), "touch(%d, %d, action %d)", call.a, call.b, call.c);
            break;
        case CallParam:
            std::snprintf(text, sizeof(text), "param(%d, %d)", call.a, call.b);
            break;
        case CallSetOrientation:
            std::snprintf(text, sizeof(text), "setOrientation(%d)", call.a);
            break;
        case CallLoadTexture:
            std::snprintf(text, sizeof(text), "loadTexture(name choice %d, pattern %d, size choice %d%s)", call.a,
                          call.b, call.c, call.d ? ", unload" : "");
            break;
        case CallKey:
            std::snprintf(text, sizeof(text), "key(%d)", call.a);
            break;
        case CallWindow:
            std::snprintf(text, sizeof(text), "windowRectangle(%d, %d, %d, %d)", call.a, call.b, call.c, call.d);
            break;
        default:
            std::snprintf(text, sizeof(text), "%s()", callName(call.kind));
            break;
    }
    return text;
}

std::vector<Call> makeSequence(std::uint64_t seed, int index) {
    std::mt19937_64 random(mixSeed(seed, std::uint64_t(index)));
    auto below = [&random](int n) { return int(random() % std::uint64_t(n)); };
    auto between = [&random](int low, int high) { return low + int(random() % std::uint64_t(high - low + 1)); };

    int total = 0;
    for (const Weight& weight : kWeights) total += weight.weight;

    std::vector<Call> calls(std::size_t(between(20, 160)));
    for (Call& call : calls) {
        int pick = below(total);
        call.kind = CallDraw;
        for (const Weight& weight : kWeights) {
            if (pick < weight.weight) {
                call.kind = weight.kind;
                break;
            }
            pick -= weight.weight;
        }
        call.a = call.b = call.c = call.d = 0;
        call.random = random();
        switch (call.kind) {
            case CallStart:
                call.a = below(20);
                call.b = below(10) == 0 ? between(-4, 0) : between(1, 1200);
                call.c = below(10) == 0 ? between(-4, 0) : between(1, 2000);
                break;
            case CallTouch:
                call.a = between(-100, 1200);
                call.b = between(-100, 2000);
                call.c = below(12) == 0 ? (below(2) ? 3 : -1) : below(3);
                break;
            case CallParam:
                call.a = between(-1000, 1000);
                call.b = between(-1000, 1000);
                break;
            case CallSetOrientation:
                call.a = below(2);
                break;
            case CallLoadTexture:
                call.a = below(10);
                call.b = below(4);
                call.c = below(40);
                call.d = below(6) == 0;
                break;
            case CallKey: {
                const int pick = below(1000);
                if (pick < kSelfTestPerMille)
                    call.a = 84;
                else if (pick < 300)
                    call.a = 85;
                else if (pick < 550)
                    call.a = 65;
                else if (pick < 800)
                    call.a = below(3);
                else
                    call.a = below(2) ? 1000 + below(100) : 3 + below(60);
                if (call.a == 67) call.a = 68;  // 'C' blocks the caller for good, by design
                break;
            }
            case CallWindow:
                call.a = between(-50, 500);
                call.b = between(-50, 500);
                call.c = between(-3, 1200);
                call.d = between(-3, 2000);
                break;
            default:
                break;
        }
    }
    return calls;
}

}  // namespace visoak
