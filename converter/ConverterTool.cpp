#include "ConverterTool.h"

#include <cstdio>
#include <limits>
#include <new>
#include <sstream>
#include <utility>

#include "DeclaredCounts.h"
#include "MemoryCeiling.h"
#include "MeshImporter.h"
#include "ModelFile.h"
#include "UvProjection.h"

namespace vi {

namespace {

const char* const kTool = "vi-modelconv: error: ";

std::string gigabytes(std::uint64_t bytes) {
    char text[32];
    std::snprintf(text, sizeof text, "%.1f GB", double(bytes) / 1e9);
    return text;
}

std::string formatVec3(const glm::vec3& v) {
    std::ostringstream text;
    text << "(" << v.x << ", " << v.y << ", " << v.z << ")";
    return text.str();
}

}  // namespace

int ConverterTool::run(const std::vector<std::string>& arguments, std::ostream& out, std::ostream& err) {
    ConverterOptions options;
    std::string error;
    if (!options.parse(arguments, error)) {
        err << kTool << error << "\n" << "Try 'vi-modelconv --help'.\n";
        return 2;
    }
    switch (options.action) {
        case ConverterOptions::Help:
            out << ConverterOptions::usage();
            return 0;
        case ConverterOptions::Info:
            return info(options.input, out, err);
        case ConverterOptions::Check:
            return check(options, out, err);
        case ConverterOptions::Convert:
            break;
    }
    // An allocation refused under the memory ceiling, in the importer or after it.
    try {
        return convert(options, out, err);
    } catch (const std::bad_alloc&) {
        const std::uint64_t ceiling = MemoryCeiling::current();
        err << kTool << "reading '" << options.input << "' ran out of memory";
        if (ceiling != 0) err << " (" << gigabytes(ceiling) << " allowed)";
        err << ": the sizes it declares cannot be real; nothing written\n";
        return 1;
    }
}

void ConverterTool::bounds(const MeshData& mesh, glm::vec3& boundsMin, glm::vec3& boundsMax) {
    boundsMin = glm::vec3(std::numeric_limits<float>::max());
    boundsMax = glm::vec3(-std::numeric_limits<float>::max());
    for (const glm::vec3& p : mesh.positions) {
        boundsMin = glm::min(boundsMin, p);
        boundsMax = glm::max(boundsMax, p);
    }
    if (mesh.positions.empty()) boundsMin = boundsMax = glm::vec3(0.0f);
}

void ConverterTool::placeModel(const ConverterOptions& options, MeshData& mesh) {
    glm::vec3 boundsMin, boundsMax;
    bounds(mesh, boundsMin, boundsMax);
    glm::vec3 offset = options.centre ? -0.5f * (boundsMin + boundsMax) : glm::vec3(0.0f);
    float factor = options.scale;
    if (options.fitSize > 0.0f) {
        glm::vec3 extent = boundsMax - boundsMin;
        float longest = glm::max(extent.x, glm::max(extent.y, extent.z));
        if (longest > 0.0f) factor *= options.fitSize / longest;
    }
    // A negative factor mirrors the model; swap corners so faces stay outward.
    for (glm::vec3& p : mesh.positions) p = (p + offset) * factor;
    if (factor < 0.0f) {
        for (glm::vec3& n : mesh.normals) n = -n;
        for (std::size_t i = 0; i + 2 < mesh.indices.size(); i += 3) std::swap(mesh.indices[i + 1], mesh.indices[i + 2]);
    }
}

int ConverterTool::convert(const ConverterOptions& options, std::ostream& out, std::ostream& err) {
    MeshImporter::Options importOptions;
    importOptions.flatNormals = options.flatNormals;
    importOptions.creaseAngleDegrees = options.creaseAngle;
    MeshData mesh;
    std::vector<MeshImporter::MissingUv> missingUv;
    std::string error;
    if (!DeclaredCounts::fit(options.input, error)) {
        err << kTool << error << "; nothing written\n";
        return 1;
    }
    if (!MeshImporter::import(options.input, importOptions, mesh, missingUv, error)) {
        err << kTool << error << "\n";
        return 1;
    }
    if (mesh.positions.size() > MeshData::kMaxVertices) {
        err << kTool << "'" << options.input << "' needs " << mesh.positions.size()
            << " vertices after joining its meshes, more than the " << MeshData::kMaxVertices
            << " that 16-bit indices can address; nothing written\n";
        return 1;
    }
    if (!missingUv.empty() && !options.generateUv) {
        err << kTool << "'" << options.input << "' has no texture coordinates in " << missingUv[0].meshName;
        if (missingUv.size() > 1) err << " and " << (missingUv.size() - 1) << " more mesh(es)";
        err << "; pass --generate-uv to project them; nothing written\n";
        return 1;
    }
    if (!missingUv.empty()) {
        glm::vec3 boundsMin, boundsMax;
        bounds(mesh, boundsMin, boundsMax);
        UvProjection projection(options.uvMode, boundsMin, boundsMax);
        for (const MeshImporter::MissingUv& run : missingUv) projection.apply(mesh, run.first, run.count);
    }
    if (options.flipV)
        for (glm::vec2& t : mesh.texCoords) t.y = 1.0f - t.y;
    placeModel(options, mesh);

    std::vector<std::uint8_t> bytes = ModelFile::encode(mesh);
    if (!ModelFile::writeAtomically(options.output, bytes, error)) {
        err << kTool << error << "\n";
        return 1;
    }
    if (!options.quiet) {
        out << "wrote " << options.output << ": " << mesh.positions.size() << " vertices, " << mesh.indices.size()
            << " indices (" << mesh.indices.size() / 3 << " triangles), " << bytes.size() << " bytes";
        if (!missingUv.empty())
            out << "; " << UvProjection::name(options.uvMode) << " texture coordinates for " << missingUv.size()
                << " mesh(es)";
        out << "\n";
    }
    return 0;
}

int ConverterTool::info(const std::string& path, std::ostream& out, std::ostream& err) {
    ModelFile::Info info;
    std::string error;
    switch (ModelFile::check(path, info, error)) {
        case ModelFile::Valid:
            break;
        case ModelFile::Invalid:
            err << kTool << "'" << path << "' is not a valid model file: " << error << "\n";
            return 1;
        case ModelFile::Unreadable:
            err << kTool << error << "\n";
            return 1;
    }
    out << "file: " << path << "\n"
        << "vertices: " << info.vertexCount << "\n"
        << "indices: " << info.indexCount << (info.indexCount == 0 ? " (drawn as a plain triangle list)" : "")
        << "\n"
        << "triangles: " << info.triangleCount() << "\n"
        << "bounds: min " << formatVec3(info.boundsMin) << " max " << formatVec3(info.boundsMax) << "\n"
        << "size: " << info.fileSize << " bytes, as V and I require\n";
    return 0;
}

int ConverterTool::check(const ConverterOptions& options, std::ostream& out, std::ostream& err) {
    int status = 0;
    for (const std::string& path : options.checked) {
        ModelFile::Info info;
        std::string error;
        switch (ModelFile::check(path, info, error)) {
            case ModelFile::Valid:
                if (!options.quiet)
                    out << path << ": a model of " << info.vertexCount << " vertices and " << info.triangleCount()
                        << " triangles\n";
                continue;
            case ModelFile::Invalid:
                err << kTool << "'" << path << "' cannot be a model file: " << error << "\n";
                break;
            case ModelFile::Unreadable:
                err << kTool << error << "\n";
                break;
        }
        status = 1;
    }
    return status;
}

}  // namespace vi
