// The plug-in's one export: the factory the runtime looks up by name.

#include "Application/Scene.h"
#include "RippleScene.h"

extern "C" __attribute__((visibility("default"))) vi::Scene* createScene(int* size, vi::ModelsMap* models,
                                                                          vi::TexturesMap* textures) {
    return new vi::RippleScene(size, models, textures);
}
