#include "Tools/FatalReport.h"

#include <cstdio>

namespace vi {

const std::string* FatalReport::msLastReport = nullptr;

void FatalReport::compose(std::string& report, int line, const char* function, const char* file) {
    char number[32];
    std::snprintf(number, sizeof(number), "%d", line);
    report.reserve(report.size() + 8192);
    report += "In file : \"";
    report += file;
    report += "\"\nIn function : \"";
    report += function;
    report += "\"\nIn line : ";
    report += number;
    msLastReport = &report;
}

}  // namespace vi
