#include "Application/ApplicationVar.h"

namespace vi {

int ApplicationVar::msWindowLeft = 0;
int ApplicationVar::msWindowTop = 0;
int ApplicationVar::msWindowWidth = 540;
int ApplicationVar::msWindowHeight = 960;
pthread_mutex_t ApplicationVar::msCriticalSection;
std::map<std::string, Texture*> ApplicationVar::msTexturesMap;
std::map<std::string, ModelObject*> ApplicationVar::msModelsMap;

Scene* gpScene = nullptr;
CreateSceneFunction gCreateScene = nullptr;

namespace {

// The lock lives as long as the library: made with default attributes (plain,
// non-recursive) when the library is loaded, destroyed at process exit.
struct CriticalSectionLifetime {
    CriticalSectionLifetime() { pthread_mutex_init(&ApplicationVar::msCriticalSection, nullptr); }
    ~CriticalSectionLifetime() { pthread_mutex_destroy(&ApplicationVar::msCriticalSection); }
};

CriticalSectionLifetime gCriticalSectionLifetime;

}  // namespace

}  // namespace vi
