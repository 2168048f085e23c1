// A program the crash handler starts for what it cannot do without the heap
// (addr2line reads debug information, rm removes folders): found on the PATH,
// forked without the fork handlers (they may need the heap themselves), its
// standard error discarded, ended if it takes longer than kLimitMilliseconds.
#pragma once

#include <cstddef>
#include <cstdint>

class HelperProgram {
public:
    static constexpr int kLimitMilliseconds = 10000;
    // The status of a program that is not installed.
    static constexpr int kNotFound = 127;

    // Runs it to its end, its standard output appended to `output` (a
    // terminated text of `capacity` bytes) when given; `keep`, if open, stays
    // open in it. Returns its exit status, or -1.
    static int run(const char* const arguments[], int keep, char* output, std::size_t capacity);
    static int64_t monotonicMilliseconds();
};
