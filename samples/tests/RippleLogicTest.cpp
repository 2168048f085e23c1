// The ripple sample's plain logic: its ripples, grades and the wallpaper's
// cover fit. No GL.

#include <cmath>

#include <gtest/gtest.h>

#include "Render/Curves.h"
#include "RippleField.h"
#include "ToneGrades.h"
#include "WaterRenderer.h"

namespace {

using vi::RippleField;

TEST(RippleField, ATouchFillsAFreeSlotWithItsCentreAndAge) {
    RippleField field;
    field.setDropsEnabled(false);
    field.add(glm::vec2(0.25f, 0.75f), 1.0f, 0.8f);
    field.update(1.5f);
    ASSERT_EQ(field.activeCount(), 1);
    EXPECT_EQ(field.mRipples[0], glm::vec3(0.25f, 0.75f, 0.5f));
    EXPECT_FLOAT_EQ(field.mAmplitudes[0], 0.8f);
}

TEST(RippleField, WhenFullTheWeakestRippleMakesRoom) {
    RippleField field;
    field.setDropsEnabled(false);
    // Free slots fill in order; slot 5 holds a faint ripple.
    for (int i = 0; i < RippleField::kSlots; ++i) field.add(glm::vec2(0.5f), 10.0f, i == 5 ? 0.05f : 1.0f);
    field.add(glm::vec2(0.9f), 10.5f, 1.0f);
    field.update(10.5f);
    EXPECT_EQ(field.mRipples[5], glm::vec3(0.9f, 0.9f, 0.0f));
    EXPECT_FLOAT_EQ(field.mAmplitudes[5], 1.0f);
}

TEST(RippleField, CalmFadesEarlierRipplesButNotOnesMadeAfterItAtTheSameInstant) {
    RippleField field;
    field.setDropsEnabled(false);
    field.add(glm::vec2(0.2f), 1.0f, 1.0f);
    field.calm(2.0f);
    field.add(glm::vec2(0.8f), 2.0f, 0.5f);  // an affordance's hint: calm, then a ripple
    field.update(2.0f + 0.5f * RippleField::kCalmDuration);
    EXPECT_NEAR(field.mAmplitudes[0], 0.5f, 1e-5f);
    EXPECT_FLOAT_EQ(field.mAmplitudes[1], 0.5f);
    field.update(2.0f + RippleField::kCalmDuration);
    EXPECT_EQ(field.activeCount(), 1);
    EXPECT_EQ(glm::vec2(field.mRipples[1]), glm::vec2(0.8f));
}

TEST(RippleField, DropsFallOnTheirScheduleAtTheirPositions) {
    RippleField field;
    field.update(RippleField::kDropFirst - 0.01f);
    EXPECT_EQ(field.activeCount(), 0);
    field.update(RippleField::kDropFirst + 0.1f);
    ASSERT_EQ(field.activeCount(), 1);
    EXPECT_EQ(glm::vec2(field.mRipples[0]), RippleField::dropPosition(0));
    EXPECT_NEAR(field.mRipples[0].z, 0.1f, 1e-5f);
    EXPECT_FLOAT_EQ(field.mAmplitudes[0], RippleField::kDropAmplitude);
    field.update(RippleField::kDropFirst + RippleField::kDropInterval);
    EXPECT_EQ(field.activeCount(), 2);
}

TEST(ToneGrades, WritingAGradeReplacesTheWholeTable) {
    vi::Curves* target = vi::ToneGrades::create(2);
    vi::Curves* reference = vi::ToneGrades::create(4);
    vi::ToneGrades::write(4, *target);
    for (int texel = 0; texel < 256; ++texel)
        for (int channel = 0; channel < 3; ++channel)
            ASSERT_EQ(target->mTable[4 * texel + channel], reference->mTable[4 * texel + channel]) << texel;
    delete target;
    delete reference;
}

glm::vec2 applyTransform(const glm::vec4& transform, glm::vec2 screen) {
    return screen * glm::vec2(transform) + glm::vec2(transform.z, transform.w);
}

TEST(WaterRenderer, AWiderPictureIsCroppedAtItsSidesWithItsFirstRowOnTop) {
    // 4:3 picture on a 9:16 screen: the middle 42 % of its width shows.
    glm::vec4 transform = vi::WaterRenderer::coverTransform(glm::vec2(1024, 768), glm::vec2(540, 960));
    glm::vec2 topLeft = applyTransform(transform, glm::vec2(0.0f, 1.0f));
    glm::vec2 bottomRight = applyTransform(transform, glm::vec2(1.0f, 0.0f));
    const float shown = (540.0f / 960.0f) / (1024.0f / 768.0f);
    EXPECT_NEAR(topLeft.x, 0.5f - 0.5f * shown, 1e-6f);
    EXPECT_NEAR(bottomRight.x, 0.5f + 0.5f * shown, 1e-6f);
    EXPECT_NEAR(topLeft.y, 0.0f, 1e-6f);
    EXPECT_NEAR(bottomRight.y, 1.0f, 1e-6f);
}

}  // namespace
