// Text in a fixed buffer, never on the heap: the crash handler's, which
// cannot trust the heap once the effect may have broken it. What does not fit
// is cut off.
#pragma once

#include <cstddef>
#include <cstdint>

template <std::size_t Capacity>
struct FixedText {
    char data[Capacity] = {};
    std::size_t size = 0;

    FixedText& operator<<(const char* text) {
        while (*text && size + 1 < Capacity) data[size++] = *text++;
        data[size] = '\0';
        return *this;
    }
    // In base 10, or 16 with "0x" before it.
    FixedText& number(uintmax_t value, unsigned base) {
        char digits[24];
        int count = 0;
        do {
            digits[count++] = "0123456789abcdef"[value % base];
            value /= base;
        } while (value > 0);
        if (base == 16) *this << "0x";
        while (count > 0) {
            const char digit[2] = {digits[--count], '\0'};
            *this << digit;
        }
        return *this;
    }
    void clear() {
        size = 0;
        data[0] = '\0';
    }
};
