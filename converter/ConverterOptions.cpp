#include "ConverterOptions.h"

#include <cmath>
#include <cstdlib>

namespace vi {

namespace {

bool parseFloat(const std::string& text, float& value) {
    if (text.empty()) return false;
    char* end = nullptr;
    double parsed = std::strtod(text.c_str(), &end);
    if (*end != '\0' || !std::isfinite(parsed)) return false;
    value = float(parsed);
    return true;
}

}  // namespace

std::string ConverterOptions::usage() {
    return "usage: vi-modelconv [options] INPUT OUTPUT.bin\n"
           "       vi-modelconv --info FILE.bin\n"
           "       vi-modelconv --check FILE.bin...\n"
           "\n"
           "Converts a mesh file that assimp reads (OBJ, glTF/GLB, PLY, STL, FBX, ...) into the\n"
           "effect runtime's model file: little-endian u32 V, u32 I, V x 3 float positions,\n"
           "V x 3 float normals, V x 2 float texture coordinates, I x u16 triangle indices.\n"
           "All meshes of the file are joined into one, with their node transforms applied;\n"
           "polygons are triangulated, points and lines dropped, missing normals computed.\n"
           "The output is written to a temporary file beside OUTPUT and renamed only when\n"
           "complete: a refused or failed conversion leaves no file behind.\n"
           "\n"
           "Refused (non-zero status, nothing written):\n"
           "  - more than 65536 vertices after joining (16-bit indices cannot address them);\n"
           "  - a mesh without texture coordinates, unless --generate-uv is given;\n"
           "  - a file that cannot be read or holds no triangles;\n"
           "  - a file whose declared sizes cannot be real: an OFF or PLY header that\n"
           "    declares far more elements than the file holds, or any file that would need\n"
           "    more than 2 GiB + 16 x its size of memory to read.\n"
           "\n"
           "options:\n"
           "  --generate-uv[=MODE]  project texture coordinates for meshes that have none;\n"
           "                        meshes with their own coordinates keep them. MODE:\n"
           "                          spherical (default): around the centre of the model's\n"
           "                            bounding box, s = 0.5 + atan2(z, x) / 2pi (longitude),\n"
           "                            t = 0.5 + asin(y / r) / pi (latitude, 1 at the top);\n"
           "                          planar: the box's two longest axes scaled to 0..1,\n"
           "                            s along the longest.\n"
           "  --flat-normals        compute missing normals per face (faceted look) instead\n"
           "                        of smoothing them\n"
           "  --crease-angle DEG    smooth missing normals only across edges flatter than DEG\n"
           "                        degrees (default 66)\n"
           "  --flip-v              t = 1 - t, for textures whose first row is the image's top\n"
           "                        (the runtime's convention) when the source counts t upwards\n"
           "  --center              move the centre of the bounding box to the origin\n"
           "  --fit SIZE            scale uniformly so the longest box side is SIZE\n"
           "  --scale FACTOR        multiply all positions by FACTOR (after --center and --fit)\n"
           "  --quiet               print nothing on success\n"
           "  --info FILE.bin       print V, I, triangles and bounds of a model file and check\n"
           "                        its size, index count and indices against V and I\n"
           "  --check FILE.bin...   check model files (as --info does) and say what is wrong\n"
           "                        with each bad one; status 1 if any is bad\n"
           "  -h, --help            show this text\n";
}

bool ConverterOptions::parse(const std::vector<std::string>& arguments, std::string& error) {
    std::vector<std::string> files;
    for (std::size_t i = 0; i < arguments.size(); ++i) {
        const std::string& argument = arguments[i];
        auto value = [&](const char* option, std::string& out) {
            if (i + 1 >= arguments.size()) {
                error = std::string(option) + " needs a value";
                return false;
            }
            out = arguments[++i];
            return true;
        };
        std::string text;
        if (argument == "-h" || argument == "--help") {
            action = Help;
        } else if (argument == "--info") {
            action = Info;
        } else if (argument == "--check") {
            action = Check;
        } else if (argument == "--generate-uv") {
            generateUv = true;
        } else if (argument.rfind("--generate-uv=", 0) == 0) {
            generateUv = true;
            if (!UvProjection::parseMode(argument.substr(14), uvMode)) {
                error = "unknown projection '" + argument.substr(14) + "' (spherical or planar)";
                return false;
            }
        } else if (argument == "--flat-normals") {
            flatNormals = true;
        } else if (argument == "--crease-angle") {
            if (!value("--crease-angle", text)) return false;
            if (!parseFloat(text, creaseAngle) || creaseAngle < 0.0f || creaseAngle > 180.0f) {
                error = "--crease-angle needs degrees from 0 to 180, not '" + text + "'";
                return false;
            }
        } else if (argument == "--flip-v") {
            flipV = true;
        } else if (argument == "--center" || argument == "--centre") {
            centre = true;
        } else if (argument == "--fit") {
            if (!value("--fit", text)) return false;
            if (!parseFloat(text, fitSize) || fitSize <= 0.0f) {
                error = "--fit needs a positive size, not '" + text + "'";
                return false;
            }
        } else if (argument == "--scale") {
            if (!value("--scale", text)) return false;
            if (!parseFloat(text, scale) || scale == 0.0f) {
                error = "--scale needs a non-zero factor, not '" + text + "'";
                return false;
            }
        } else if (argument == "--quiet") {
            quiet = true;
        } else if (argument.size() > 1 && argument[0] == '-') {
            error = "unknown option '" + argument + "'";
            return false;
        } else {
            files.push_back(argument);
        }
    }
    if (action == Help) return true;
    if (action == Info) {
        if (files.size() != 1) {
            error = "--info takes exactly one model file";
            return false;
        }
        input = files[0];
        return true;
    }
    if (action == Check) {
        if (files.empty()) {
            error = "--check takes one or more model files";
            return false;
        }
        checked = files;
        return true;
    }
    if (files.size() != 2) {
        error = files.size() < 2 ? "an input mesh and an output file are needed" : "too many file names";
        return false;
    }
    input = files[0];
    output = files[1];
    return true;
}

}  // namespace vi
