// The names an effect binds that its program does not have, told to the
// author: the runtime drops such a binding silently, as the phone needs, and
// a misspelt uniform shows as a wrong picture and nothing said. Each name is
// handed to com.tarq.vi.player.Misspellings.unbound once per program, with the
// program's active names of its kind and the effect's line that added it.
// Runs when a name is added, on the GL thread; never per frame.
#pragma once

#include <jni.h>

#include <string>

#include "Render/UnboundNames.h"

class UnboundNameWarnings {
public:
    static void listen(JNIEnv* env);
    // A new effect starts: its names are told again, whatever the last one's were.
    static void forget();

private:
    static void onUnbound(const vi::ShaderProgram& program, vi::UnboundNames::Kind kind, const std::string& name);
};
