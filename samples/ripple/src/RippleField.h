#pragma once

// The ripples on the water, kept as the arrays the water shader reads:
// for each of kSlots slots a centre (normalised screen position, origin
// bottom left) with its age in seconds, and an amplitude (0: slot free).
// A new ripple takes a free slot, or the one whose wave has the least energy
// left. Besides the ripples that touches make, the field lets a drop fall by
// itself every few seconds at positions from a fixed sequence, so the water
// never looks frozen; calm() fades every ripple out and holds the drops back.
// Plain data, no GL.

#include <glm/glm.hpp>

namespace vi {

class RippleField {
public:
    static constexpr int kSlots = 12;
    // A ripple older than this has spread out of sight and frees its slot.
    static constexpr float kLifetime = 7.0f;
    // How long calm() takes to flatten the water, and how long drops stay away after it.
    static constexpr float kCalmDuration = 0.4f;
    static constexpr float kCalmHold = 6.0f;
    // Self-falling drops: the first at kDropFirst seconds, then every kDropInterval.
    static constexpr float kDropFirst = 0.8f;
    static constexpr float kDropInterval = 2.6f;
    static constexpr float kDropAmplitude = 0.45f;

    RippleField();

    void add(const glm::vec2& centre, float time, float amplitude);
    // Fades out every ripple over kCalmDuration and holds back drops for kCalmHold.
    void calm(float time);
    // Ages the ripples to `time`, frees the spent ones, lets due drops fall.
    void update(float time);
    void setDropsEnabled(bool enabled) { mDropsEnabled = enabled; }

    // The k-th self-falling drop's position.
    static glm::vec2 dropPosition(unsigned int k);
    // What is left of a ripple's energy at an age: it decays and spreads.
    static float energy(float amplitude, float age);

    int activeCount() const;

    // Read by the water shader: (centre x, centre y, age) and amplitude per slot.
    glm::vec3 mRipples[kSlots];
    float mAmplitudes[kSlots];

private:
    float mStart[kSlots];
    float mBaseAmplitude[kSlots];
    // Ripples made before the latest calm() fade with it; later ones do not,
    // even when made at the same instant (an affordance calms, then adds).
    unsigned int mGeneration[kSlots];
    unsigned int mCalmGeneration;
    float mCalmStart;
    float mDropsResume;
    unsigned int mNextDrop;
    bool mDropsEnabled;
};

}  // namespace vi
