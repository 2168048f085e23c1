#include "Application/AnimationManager.h"

namespace vi {

float AnimationManager::mNow = 0.0f;
std::vector<Animation*> AnimationManager::mStorage;

}  // namespace vi
