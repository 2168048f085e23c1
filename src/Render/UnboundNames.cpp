#include "Render/UnboundNames.h"

#if !defined(__ANDROID__)

namespace vi {

namespace {
UnboundNames::Listener gListener = nullptr;
}  // namespace

void UnboundNames::listen(Listener listener) { gListener = listener; }

void UnboundNames::tell(const ShaderProgram& program, Kind kind, const std::string& name) {
    if (gListener) gListener(program, kind, name);
}

}  // namespace vi

#endif
