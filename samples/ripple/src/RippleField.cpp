#include "RippleField.h"

#include <cmath>

namespace vi {

RippleField::RippleField()
    : mCalmGeneration(0), mCalmStart(-1.0f), mDropsResume(0.0f), mNextDrop(0), mDropsEnabled(true) {
    for (int i = 0; i < kSlots; ++i) {
        mRipples[i] = glm::vec3(0.0f);
        mAmplitudes[i] = 0.0f;
        mStart[i] = 0.0f;
        mBaseAmplitude[i] = 0.0f;
        mGeneration[i] = 0;
    }
}

float RippleField::energy(float amplitude, float age) { return amplitude * std::exp(-0.6f * age); }

void RippleField::add(const glm::vec2& centre, float time, float amplitude) {
    int slot = 0;
    float weakest = 1e30f;
    for (int i = 0; i < kSlots; ++i) {
        if (mBaseAmplitude[i] <= 0.0f) {
            slot = i;
            break;
        }
        float left = energy(mBaseAmplitude[i], time - mStart[i]);
        if (left < weakest) {
            weakest = left;
            slot = i;
        }
    }
    mStart[slot] = time;
    mBaseAmplitude[slot] = amplitude;
    mRipples[slot] = glm::vec3(centre, 0.0f);
    mAmplitudes[slot] = amplitude;
    mGeneration[slot] = mCalmGeneration;
}

void RippleField::calm(float time) {
    ++mCalmGeneration;
    mCalmStart = time;
    mDropsResume = time + kCalmHold;
}

void RippleField::update(float time) {
    // Due drops fall in order; those due while the water is held calm, or
    // long past (the scene was not drawn for a while), are skipped.
    while (mDropsEnabled && kDropFirst + kDropInterval * float(mNextDrop) <= time) {
        float due = kDropFirst + kDropInterval * float(mNextDrop);
        if (due >= mDropsResume && time - due < kDropInterval) add(dropPosition(mNextDrop), due, kDropAmplitude);
        ++mNextDrop;
    }
    float calmFactor = 1.0f;
    if (mCalmStart >= 0.0f) calmFactor = glm::clamp(1.0f - (time - mCalmStart) / kCalmDuration, 0.0f, 1.0f);
    for (int i = 0; i < kSlots; ++i) {
        if (mBaseAmplitude[i] <= 0.0f) continue;
        float age = time - mStart[i];
        bool calmed = mGeneration[i] < mCalmGeneration;
        if (age > kLifetime || (calmed && calmFactor <= 0.0f)) {
            mBaseAmplitude[i] = 0.0f;
            mAmplitudes[i] = 0.0f;
            mRipples[i].z = 0.0f;
            continue;
        }
        mRipples[i].z = glm::max(age, 0.0f);
        mAmplitudes[i] = mBaseAmplitude[i] * (calmed ? calmFactor : 1.0f);
    }
}

glm::vec2 RippleField::dropPosition(unsigned int k) {
    // Additive recurrences with the golden ratios: spread evenly, never repeating.
    float x = std::fmod(0.37f + 0.6180340f * float(k), 1.0f);
    float y = std::fmod(0.21f + 0.7548777f * float(k), 1.0f);
    return glm::vec2(0.12f + 0.76f * x, 0.14f + 0.72f * y);
}

int RippleField::activeCount() const {
    int count = 0;
    for (int i = 0; i < kSlots; ++i)
        if (mBaseAmplitude[i] > 0.0f) ++count;
    return count;
}

}  // namespace vi
