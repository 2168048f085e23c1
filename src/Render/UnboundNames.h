#pragma once

// Desktop only. The runtime drops a binding whose name the program does not
// have, silently, as the phone needs; a desktop host may listen, so that it
// can tell the author about a misspelt name. Heard once per add call that
// found nothing, on the GL thread (the program's name may belong to a lost
// context not yet repaired); never for the names a renderer binds by itself,
// never while a lost context is repaired, never per frame. Not compiled for
// Android.

#if !defined(__ANDROID__)

#include <string>

#include "Tools/Export.h"

namespace vi {

class ShaderProgram;

class VI_EXPORT UnboundNames {
public:
    enum class Kind { Attribute, Uniform, Sampler };
    using Listener = void (*)(const ShaderProgram& program, Kind kind, const std::string& name);

    // Null stops listening.
    static void listen(Listener listener);
    static void tell(const ShaderProgram& program, Kind kind, const std::string& name);
};

}  // namespace vi

#endif
