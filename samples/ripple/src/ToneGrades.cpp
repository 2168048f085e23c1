#include "ToneGrades.h"

#include <cstring>

#include <glm/glm.hpp>

namespace vi {

namespace {

struct Grade {
    const char* name;
    glm::vec2 red[5];
    int redCount;
    glm::vec2 green[5];
    int greenCount;
    glm::vec2 blue[5];
    int blueCount;
};

// Control points (input level, output level), ascending in input.
const Grade kGrades[ToneGrades::kCount] = {
    {"clear water",
     {{0, 0}, {70, 60}, {190, 200}, {255, 255}}, 4,
     {{0, 2}, {70, 64}, {190, 202}, {255, 255}}, 4,
     {{0, 10}, {70, 76}, {190, 204}, {255, 252}}, 4},
    {"golden hour",
     {{0, 14}, {128, 152}, {255, 255}}, 3,
     {{0, 6}, {128, 130}, {255, 242}}, 3,
     {{0, 0}, {128, 100}, {255, 206}}, 3},
    {"moonlight",
     {{0, 0}, {128, 96}, {255, 214}}, 3,
     {{0, 6}, {128, 118}, {255, 232}}, 3,
     {{0, 26}, {128, 152}, {255, 255}}, 3},
    {"teal and amber",
     {{0, 0}, {64, 42}, {128, 128}, {192, 212}, {255, 255}}, 5,
     {{0, 12}, {64, 72}, {128, 128}, {192, 194}, {255, 244}}, 5,
     {{0, 28}, {64, 88}, {128, 124}, {192, 166}, {255, 214}}, 5},
    {"faded film",
     {{0, 36}, {128, 138}, {255, 238}}, 3,
     {{0, 32}, {128, 128}, {255, 230}}, 3,
     {{0, 42}, {128, 120}, {255, 212}}, 3},
};

}  // namespace

int ToneGrades::normalise(int grade) {
    int g = grade % kCount;
    return g < 0 ? g + kCount : g;
}

const char* ToneGrades::name(int grade) { return kGrades[normalise(grade)].name; }

float ToneGrades::strength(int percent) { return float(glm::clamp(percent, 0, 100)) / 100.0f; }

Curves* ToneGrades::create(int grade) {
    const Grade& g = kGrades[normalise(grade)];
    return new Curves(g.red, g.redCount, g.green, g.greenCount, g.blue, g.blueCount);
}

void ToneGrades::write(int grade, Curves& curves) {
    // A fresh table computed aside: recomputing in place would make the
    // framework create a second lookup texture. The aside object's texture
    // never reached GL, so deleting it makes no GL call.
    Curves* fresh = create(grade);
    std::memcpy(curves.mTable, fresh->mTable, sizeof curves.mTable);
    delete fresh;
}

}  // namespace vi
