#pragma once

// Plays host calls into the runtime the way the host would (through the
// exported JNI functions, with a hand-made JNIEnv, on the thread that owns
// the GL context), keeps its own account of what the runtime's state must
// be, and after every call checks the runtime, the plug-ins' records and the
// picture against that account.
//
// What it checks after each call:
// - the scene exists and is ready exactly when the account says, and the
//   plug-in's own view (which initialisations it received) agrees;
// - each plug-in received exactly the calls the account expects (a frame only
//   when ready, textureUpdated on each replaced image while a scene exists,
//   and so on), no call ever began inside another, every scene made is
//   destroyed exactly once;
// - the renderer and texture registries hold exactly the live objects: the
//   live scene's own and the host's loaded images, nothing else; the shared
//   background program lives exactly while a background does; the animation
//   storage holds exactly the live scene's animation;
// - the host's images: pixels converted, the host's array left converted, a
//   replaced image kept in place, an unloaded name left filed with its stale
//   pointer; recycled static textures without client pixels;
// - the JNI use: every string and array handed out was given back (except the
//   path of a failed start, which the runtime keeps on purpose);
// - the picture: every frame drawn with a context current is read back; two
//   frames of the same state must be equal, and before each context change a
//   frame is drawn and read back, so the first frame after it is compared
//   with one drawn at the same state without the change.

#include <cstdint>
#include <map>
#include <memory>
#include <string>
#include <vector>

#include "Calls.h"
#include "FakeJni.h"
#include "PluginViews.h"

namespace vitest {
class GlContext;
}

namespace vi {
class Texture;
}

namespace visoak {

// Host patterns the soak can be told to leave out, to look past a known
// runtime defect until it is mended.
struct SoakAvoid {
    // Loading an image again before any GL texture was made for it.
    bool replaceBeforeFirstUpload = false;
    // Initialising the scene after a context change, before the next frame.
    bool initAfterContextChange = false;
};

struct PluginPaths {
    std::string soak;
    std::string test;
    std::string noFactory;
    std::string missing;
};

struct SoakStats {
    long calls = 0;    // played
    long skipped = 0;  // not played: invalid for the host in the state they met
    long losses = 0;
    long switches = 0;
    long noContext = 0;
    long frames = 0;   // ready frames
    long compared = 0; // frames compared with an earlier one of the same state
    long selfTests = 0;
};

class SoakHost {
public:
    SoakHost(const PluginPaths& paths, const SoakAvoid& avoid);
    ~SoakHost();

    // Brings the runtime to the state every sequence starts from.
    void beginSequence(std::uint64_t seed, int index);
    // Runs call number `index` of the sequence and checks everything; false
    // with `fault` set when something is wrong.
    bool run(const Call& call, int index, std::string& fault);
    // After a fault about a frame that differs from an earlier frame of the
    // same state: where that earlier frame was drawn (sequence, call);
    // -1 when the fault is of another kind.
    int faultOriginSequence() const { return mFaultOrigin.sequence; }
    int faultOriginCall() const { return mFaultOrigin.call; }
    // Stops the scene and unloads the host's images; checks the end state.
    bool endSequence(std::string& fault);

    const SoakStats& stats() const { return mStats; }

private:
    enum ContextState { ContextMain, ContextSecond, ContextNone };

    struct Expected {
        bool exists = false;
        Plugin live = PluginNone;
        int orientation = 0;
        bool initialised[2] = {false, false};
        Plugin factory = PluginNone;
        std::string rememberedPath;
        bool rememberedHandle = false;
        int left = 0, top = 0, width = 540, height = 960;
        bool ready() const { return exists && initialised[orientation != 0 ? 1 : 0]; }
    };

    // An image the host handed in, by name.
    struct HostImage {
        vi::Texture* texture = nullptr;  // kept after an unload: the stale pointer the map keeps
        bool live = false;               // loaded and not unloaded
        bool nullEntry = false;          // unloaded before any load
        int pattern = 0;
        unsigned width = 0, height = 0;
    };

    struct Step;

    bool runCall(const Call& call, Step& step);
    bool check(const Call& call, Step& step);
    void fail(Step& step, const std::string& what);

    // The calls.
    void start(const Call& call, Step& step);
    void restart(Step& step);
    void stop(bool pause, Step& step);
    void initEffect(Step& step);
    void draw(Step& step);
    void loadTexture(const Call& call, Step& step);
    void selfTest(const Call& call, Step& step);
    void changeContext(CallKind kind, Step& step);

    // Parts of the account and the checks.
    void expectDelivered(Step& step, SceneEvent event, int count = 1);
    void destroyLive(Step& step);
    bool sceneReadyForGl() const;
    std::string photoName() const;
    std::string nameFor(int choice, int& role);
    void checkPicture(Step& step);
    void checkRegistries(Step& step);
    void checkScene(Step& step);
    void checkHostImages(Step& step);
    void checkJni(Step& step, int expectedUtfChars);
    void unloadAll();

    PluginPaths mPaths;
    SoakAvoid mAvoid;
    std::unique_ptr<vitest::GlContext> mContext;
    ContextState mContextState;
    FakeJni mJni;
    Expected mExpected;
    std::map<std::string, HostImage> mImages;
    int mSequence;
    int mPhotoGeneration;
    int mExtraGeneration;
    int mGhostGeneration;
    int mTestInitialOrientation;
    std::vector<std::string> mTestNames;
    // The first frame of each state: a hash of its pixels and where it was
    // drawn; its pixels too while in the same sequence, to show differences.
    struct Picture {
        std::uint64_t hash = 0;
        int sequence = -1;
        int call = -1;
    };
    std::map<std::string, Picture> mPictureHashes;
    std::map<std::string, std::vector<std::uint8_t>> mPictures;
    Picture mFaultOrigin;
    int mCallIndex;
    bool mContextChangedSinceFrame;
    bool mObjectsStale;  // the context changed and no ready frame has repaired the objects since
    SoakStats mStats;
};

}  // namespace visoak
