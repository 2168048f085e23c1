#pragma once

// A mesh read from the asset name + ".bin" and used in place: drawables filled
// from it point into the file's buffer, which must outlive their renderers.
// Little-endian: V (u32), I (u32), V positions (3 floats), V normals
// (3 floats), V texture coordinates (2 floats), I indices (u16).

#include <string>

#include "Render/Drawable.h"
#include "Tools/Export.h"
#include "Tools/File.h"

namespace vi {

class VI_EXPORT ModelObject : public File {
public:
    ModelObject();
    explicit ModelObject(const std::string& name);

    void load(const std::string& name);
    bool fillDrawable(Drawable& drawable);
    void scale(float factor);
};

}  // namespace vi
