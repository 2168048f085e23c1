#pragma once

// Plays host calls into the runtime as the host's Java side makes them:
// through the exported entry points, with the JNI stand-in, on the thread
// that owns the GL context, into the shared recording test scene with the
// host's picture shown. It keeps no account of the runtime's state, only what
// a host knows of its own calls, to make only calls a host may make: restart
// only after a start that returned names, never a second start of a library
// that failed, images loaded and replaced only with a context current, a name
// never used again once unloaded, the scene's picture unloaded only after a
// stop. A call that breaks one of these is skipped, so any part of a sequence
// is itself a sequence a host may play.
//
// The one check that needs no model: a frame drawn right after a context
// change equals the frame drawn right before it (the scene's picture depends
// on nothing the change touches). Crashes, sanitizer reports and hangs are
// for the supervising process to see.

#include <cstdint>
#include <set>
#include <string>
#include <vector>

#include "FakeJni.h"
#include "GlContext.h"
#include "Sequence.h"

namespace visoak {

class Player {
public:
    enum Outcome { Played, Skipped, FrameDiffers, JniMisuse };

    Player();
    ~Player();

    Outcome play(const Call& call, std::string& fault);
    // Frames after a context change found equal to the frame before it.
    long equalFrames() const { return mEqualFrames; }

private:
    enum Context { ContextMain, ContextSecond, ContextNone };

    void start(const Call& call, Outcome& outcome);
    void loadTexture(const Call& call, Outcome& outcome);
    std::vector<std::uint8_t> frame();
    Outcome compare(const std::vector<std::uint8_t>& before, const std::vector<std::uint8_t>& after,
                    std::string& fault);
    std::string name(int kind) const;
    void nameScenePicture();

    vitest::GlContext mGl;
    Context mContext;
    vitest::FakeJni mJni;
    bool mStarted;      // the last start returned names
    bool mSceneMayLive; // since a start or restart, no stop
    std::set<std::string> mBroken;  // libraries whose start failed
    std::set<std::string> mLoaded;
    int mGeneration[2];             // of the picture's and the other images' names
    std::vector<std::uint8_t> mBeforeChange;
    long mEqualFrames;
};

}  // namespace visoak
