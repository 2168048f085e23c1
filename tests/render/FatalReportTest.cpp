// The text a fatal report leaves behind: quoted detail, then where it happened.
#include <gtest/gtest.h>

#include <string>

#include "Tools/FatalReport.h"

TEST(FatalReport, AppendsFileFunctionAndLineWithoutTrailingNewline) {
    std::string report = "\"Invalid file name: \"missing.bin\"\n";
    vi::FatalReport::compose(report, 71, "load", "/src/Tools/File.cpp");
    EXPECT_EQ(report,
              "\"Invalid file name: \"missing.bin\"\n"
              "In file : \"/src/Tools/File.cpp\"\n"
              "In function : \"load\"\n"
              "In line : 71");
    EXPECT_EQ(vi::FatalReport::msLastReport, &report);
    EXPECT_GE(report.capacity(), 8192u);

    std::string negative;
    vi::FatalReport::compose(negative, -12, "f", "g");
    EXPECT_EQ(negative, "In file : \"g\"\nIn function : \"f\"\nIn line : -12");
}
