#pragma once

// The binary interface between the runtime and an effect plug-in. The runtime
// never knows the scene's class: it keeps the object made by the plug-in's
// "createScene" in vi::gpScene, reads and writes the data members below
// directly and calls the virtual operations by slot. Member order and slot
// order are fixed; slots 2, 13 and 15 are reserved for the plug-in and never
// called by the runtime. Self-contained: a plug-in needs only this header and GLM.

#include <map>
#include <string>
#include <vector>

#include <glm/glm.hpp>

#include "Application/Orientation.h"

namespace vi {

class Texture;
class ModelObject;

class Scene {
public:
    Scene()
        : mSize(0.0f, 0.0f), mAspect(1.0f), mScale(1.0f, 1.0f), mInitialised{false, false},
          mOrientation(Orientation::Initial) {}

    // `size` is the factory's first argument: window width and height, at least 1 each.
    explicit Scene(const int* size) : Scene() {
        mSize = glm::vec2(float(size[0]), float(size[1]));
        mAspect = mSize.x / mSize.y;
        mScale = mAspect < 1.0f ? glm::vec2(1.0f, mSize.y / mSize.x) : glm::vec2(mAspect, 1.0f);
    }

    Scene(const Scene&) = delete;
    Scene& operator=(const Scene&) = delete;

    virtual ~Scene() {}                                     // slots 0 and 1
    virtual void reserved2() {}                             // slot 2
    virtual void clearEffect() {}                           // slot 3
    virtual void affordance() {}                            // slot 4
    virtual void unlock() {}                                // slot 5
    virtual void textureUpdated() {}                        // slot 6
    virtual void initEffect() {}                            // slot 7
    virtual void initEffectAlternate() {}                   // slot 8
    virtual int draw() { return 0; }                        // slot 9
    virtual void touchDown(const glm::vec2& /*position*/) {}  // slot 10
    virtual void touchUp(const glm::vec2& /*position*/) {}    // slot 11
    virtual void touchMove(const glm::vec2& /*position*/) {}  // slot 12
    virtual void reserved13() {}                            // slot 13
    virtual void keyPressed(unsigned int /*key*/) {}        // slot 14
    virtual void reserved15() {}                            // slot 15
    virtual void param(int /*a*/, int /*b*/) {}             // slot 16

    glm::vec2 mSize;
    float mAspect;
    glm::vec2 mScale;
    // Entry Orientation::initialisedIndex(o) is true once the scene was
    // initialised for orientation o; the constructor must leave both false.
    bool mInitialised[2];
    Orientation::OrientationEnum mOrientation;
    std::vector<std::string> mNames;
};

typedef std::map<std::string, ModelObject*> ModelsMap;
typedef std::map<std::string, Texture*> TexturesMap;

// What the plug-in's factory, exported unmangled as "createScene", must be:
// window size (two ints, width then height), the shared models map, the shared
// textures map; returns a new scene owned by the runtime.
typedef Scene* (*CreateSceneFunction)(int* size, ModelsMap* models, TexturesMap* textures);

}  // namespace vi
