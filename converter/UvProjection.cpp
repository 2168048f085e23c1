#include "UvProjection.h"

#include <cmath>
#include <utility>

namespace vi {

namespace {

constexpr float kPi = 3.14159265358979f;

}  // namespace

bool UvProjection::parseMode(const std::string& text, Mode& mode) {
    if (text == "spherical") {
        mode = Spherical;
        return true;
    }
    if (text == "planar") {
        mode = Planar;
        return true;
    }
    return false;
}

const char* UvProjection::name(Mode mode) {
    switch (mode) {
        case Spherical:
            return "spherical";
        case Planar:
            return "planar";
    }
    return "";
}

UvProjection::UvProjection(Mode mode, const glm::vec3& boundsMin, const glm::vec3& boundsMax)
    : mMode(mode), mCentre(0.5f * (boundsMin + boundsMax)), mMin(boundsMin), mExtent(boundsMax - boundsMin),
      mAxisS(0), mAxisT(1) {
    // Longest axis first; ties keep x before y before z so the result is stable.
    int order[3] = {0, 1, 2};
    for (int i = 0; i < 3; ++i)
        for (int j = i + 1; j < 3; ++j)
            if (mExtent[order[j]] > mExtent[order[i]]) std::swap(order[i], order[j]);
    mAxisS = order[0];
    mAxisT = order[1];
}

glm::vec2 UvProjection::project(const glm::vec3& position) const {
    switch (mMode) {
        case Spherical: {
            glm::vec3 d = position - mCentre;
            float r = glm::length(d);
            if (r <= 0.0f) return glm::vec2(0.5f, 0.5f);
            float s = 0.5f + std::atan2(d.z, d.x) / (2.0f * kPi);
            float t = 0.5f + std::asin(glm::clamp(d.y / r, -1.0f, 1.0f)) / kPi;
            return glm::vec2(s, t);
        }
        case Planar: {
            float extentS = mExtent[mAxisS];
            float extentT = mExtent[mAxisT];
            float s = extentS > 0.0f ? (position[mAxisS] - mMin[mAxisS]) / extentS : 0.5f;
            float t = extentT > 0.0f ? (position[mAxisT] - mMin[mAxisT]) / extentT : 0.5f;
            return glm::vec2(s, t);
        }
    }
    return glm::vec2(0.0f);
}

void UvProjection::apply(MeshData& mesh, std::size_t first, std::size_t count) const {
    for (std::size_t v = first; v < first + count; ++v) mesh.texCoords[v] = project(mesh.positions[v]);
}

}  // namespace vi
