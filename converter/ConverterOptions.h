#pragma once

// The command line of vi-modelconv, parsed without side effects so that the
// tool can refuse a bad call before it reads or writes anything.

#include <string>
#include <vector>

#include "UvProjection.h"

namespace vi {

class ConverterOptions {
public:
    enum Action {
        Convert,
        Info,
        Check,
        Help,
    };

    // Returns false with a message for an unknown option, a missing or
    // malformed value, or the wrong number of file names.
    bool parse(const std::vector<std::string>& arguments, std::string& error);

    static std::string usage();

    Action action = Convert;
    std::string input;
    std::string output;
    std::vector<std::string> checked;  // --check's files
    bool generateUv = false;
    UvProjection::Mode uvMode = UvProjection::Spherical;
    bool flatNormals = false;
    float creaseAngle = 66.0f;
    bool flipV = false;
    bool centre = false;
    float fitSize = 0.0f;  // 0: keep the model's size
    float scale = 1.0f;
    bool quiet = false;
};

}  // namespace vi
