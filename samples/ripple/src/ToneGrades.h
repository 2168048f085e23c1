#pragma once

// The colour grades the host chooses with param(a, b): a picks a grade (taken
// modulo kCount), b its strength in percent. Each grade is three tone curves,
// written into a vi::Curves table, which the water shader reads through the
// table's 1 x 256 texture. Grades:
//   0 clear water     gentle contrast, a touch of blue in the shadows
//   1 golden hour     warm: reds lifted, blues lowered
//   2 moonlight       cool and dim: blues lifted, reds lowered
//   3 teal and amber  teal shadows, amber highlights
//   4 faded film      lifted blacks, softened whites, slightly warm

#include "Render/Curves.h"

namespace vi {

class ToneGrades {
public:
    static constexpr int kCount = 5;

    // Any int selects a grade: negative values count back from the last.
    static int normalise(int grade);
    static const char* name(int grade);
    // b in percent, clamped to 0..100, as a factor 0..1.
    static float strength(int percent);

    // Replaces the table of `curves` with the grade's curves. The table's
    // texture is dynamic, so the change shows at the next bind.
    static void write(int grade, Curves& curves);
    // A new vi::Curves holding the grade (the caller owns it).
    static Curves* create(int grade);
};

}  // namespace vi
