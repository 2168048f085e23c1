#pragma once

// Process-wide state shared by the handlers, the host's texture loading and the
// scene. Plain globals: their consistency comes from msCriticalSection alone,
// except where a handler runs without it on purpose (window rectangle,
// texture recycling, texture loading).

#include <pthread.h>

#include <map>
#include <string>

#include "Application/Scene.h"
#include "Tools/Export.h"

namespace vi {

class VI_EXPORT ApplicationVar {
public:
    static int msWindowLeft;
    static int msWindowTop;
    static int msWindowWidth;
    static int msWindowHeight;
    static pthread_mutex_t msCriticalSection;
    // The maps hold pointers they do not own.
    static std::map<std::string, Texture*> msTexturesMap;
    static std::map<std::string, ModelObject*> msModelsMap;
};

VI_EXPORT extern Scene* gpScene;
VI_EXPORT extern CreateSceneFunction gCreateScene;

}  // namespace vi
