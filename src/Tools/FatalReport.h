#pragma once

#include <string>

#include "Tools/Export.h"

// ---- Platform difference: who may read the last report ------------------
// On a desktop the hosts' exit handler tells the author why the effect ended,
// so the report's pointer is exported there; the phone's library keeps it in.
#if defined(__ANDROID__)
#define VI_FATAL_REPORT_VISIBILITY VI_HIDDEN
#else
#define VI_FATAL_REPORT_VISIBILITY VI_EXPORT
#endif
// ---------------------------------------------------------------------------

namespace vi {

// Composes the report of an unrecoverable failure. The caller has put the
// quoted detail text into `report`; this appends the location block and
// returns. Nothing is printed or logged: the caller then calls exit(line), so
// the exit status alone names the failure site and the text stays in memory.
class VI_HIDDEN FatalReport {
public:
    static void compose(std::string& report, int line, const char* function, const char* file);

    // The last report composed in this process, or null. Kept only so that a
    // debugger, or an exit handler of the desktop hosts or the tests, can find
    // the text that exit() leaves behind; the runtime itself never reads it.
    static VI_FATAL_REPORT_VISIBILITY const std::string* msLastReport;
};

}  // namespace vi
