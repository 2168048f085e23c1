#include "FatalReportCapture.h"

#include <cstdio>
#include <cstdlib>

#include "Tools/FatalReport.h"

namespace vitest {

namespace {
void printLastReport() {
    if (vi::FatalReport::msLastReport) std::fprintf(stderr, "%s", vi::FatalReport::msLastReport->c_str());
}
}  // namespace

void printFatalReportAtExit() { std::atexit(printLastReport); }

}  // namespace vitest
