#pragma once

// The host calls the soak plays, and the player that makes them. A sequence is
// made in full from the seed and its number (Sequence.cpp), so any part of it
// can be played again from the same two numbers.
//
// The player makes each call as the host's Java side would: through the
// exported entry points, with the JNI stand-in, on the thread that owns the GL
// context, into the shared recording test scene with the host's picture shown.
// It keeps no account of the runtime's state, only what a host knows of its
// own calls, to make only calls a host may make: a restart only after a start
// that returned names, no second start of a library that failed, images
// loaded only with a context current, a name never used again once unloaded,
// the scene's picture unloaded only after a stop. Any other call is skipped,
// so any part of a sequence is a sequence a host may play.
//
// Its one check needs no model: a frame drawn right after a context change
// equals the frame drawn right before it (the scene's picture depends on
// nothing the change touches). Crashes, sanitizer reports and hangs are for
// the supervising process to see.

#include <cstdint>
#include <set>
#include <string>
#include <vector>

#include "FakeJni.h"
#include "GlContext.h"

namespace visoak {

// Arguments: start (library choice, width, height), touch (x, y, action), key
// (code), param (a, b), setOrientation (any int), loadTexture (name choice,
// pixel pattern, size choice, unload when 0), windowRectangle (left, top,
// width, height).
enum CallKind { CallStart, CallInitEffect, CallRestart, CallStop, CallPause, CallRecycleTextures, CallDraw,
                CallTouch, CallMenu, CallVolumeUp, CallVolumeDown, CallKey, CallParam, CallClearEffect,
                CallAffordance, CallUnlock, CallSetOrientation, CallLoadModel, CallLoadTexture, CallWindow,
                CallContextSwitch, CallContextLoss, CallContextNone, CallKindCount };

struct Call {
    CallKind kind;
    int a, b, c, d;
};

std::vector<Call> makeSequence(std::uint64_t seed, int index);
std::string describe(const Call& call);

class Player {
public:
    enum Outcome { Played, Skipped, FrameDiffers, JniMisuse };

    Player();
    ~Player();
    Outcome play(const Call& call, std::string& fault);
    long equalFrames() const { return mEqualFrames; }  // after a context change, equal to the one before

private:
    bool start(const Call& call);
    bool loadTexture(const Call& call);
    std::vector<std::uint8_t> frame();
    Outcome compare(const std::vector<std::uint8_t>& before, const std::vector<std::uint8_t>& after,
                    std::string& fault);
    std::string imageName(int kind) const;
    void nameScenePicture();

    vitest::GlContext mGl;
    enum { ContextMain, ContextSecond, ContextNone } mContext;
    vitest::FakeJni mJni;
    bool mStarted;                  // the last start returned names
    bool mSceneMayLive;             // a start or restart since the last stop
    std::set<std::string> mBroken;  // libraries whose start failed
    std::set<std::string> mLoaded;
    int mGeneration[2];             // of the picture's name and the other images' name
    std::vector<std::uint8_t> mBeforeChange;
    long mEqualFrames;
};

}  // namespace visoak
