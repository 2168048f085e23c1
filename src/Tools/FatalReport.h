#pragma once

#include <string>

#include "Tools/Export.h"

namespace vi {

// Composes the report of an unrecoverable failure. The caller has put the
// quoted detail text into `report`; this appends the location block and
// returns. Nothing is printed or logged: the caller then calls exit(line), so
// the exit status alone names the failure site and the text stays in memory.
class VI_HIDDEN FatalReport {
public:
    static void compose(std::string& report, int line, const char* function, const char* file);

    // The last report composed in this process, or null. Kept only so that a
    // debugger, or a test's exit handler, can find the text that exit() leaves
    // behind; the runtime itself never reads it.
    static const std::string* msLastReport;
};

}  // namespace vi
