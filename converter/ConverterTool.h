#pragma once

// What vi-modelconv does for one command line: convert a mesh file into a
// model file, or describe and check a model file. Every refusal is decided
// before the output is written, and the output appears only when complete.
// Exit statuses: 0 success, 1 refused or failed, 2 bad command line.

#include <ostream>
#include <string>
#include <vector>

#include "ConverterOptions.h"
#include "MeshData.h"

namespace vi {

class ConverterTool {
public:
    static int run(const std::vector<std::string>& arguments, std::ostream& out, std::ostream& err);

    static int convert(const ConverterOptions& options, std::ostream& out, std::ostream& err);
    static int info(const std::string& path, std::ostream& out, std::ostream& err);
    // Each of --check's files: a line for a good one, an error for a bad one.
    static int check(const ConverterOptions& options, std::ostream& out, std::ostream& err);

    // Centring, fitting and scaling, in that order, on positions only.
    static void placeModel(const ConverterOptions& options, MeshData& mesh);
    static void bounds(const MeshData& mesh, glm::vec3& boundsMin, glm::vec3& boundsMax);
};

}  // namespace vi
