// The tool's readers of numbers in text: the decimal number reader shared by the session
// information file and the level data decoder, and a plain digit-run reader. Both work on
// bounded text (no terminator needed), since level data is parsed in place in its buffer.
#pragma once

#include <cstdint>

namespace orv {

inline bool isDecimalDigit(char c) { return c >= '0' && c <= '9'; }

// Reads an optional '-', a run of digits and optionally '.' with a run of digits, from
// `text` up to `limit`. Every step is done in 32-bit float, so that the values match the
// logger's own reader to the last bit. `end` receives the position after the last character
// read, or nullptr when the integer digits are directly followed by '-' (a number that runs
// into another, which callers treat as malformed). No exponent, blanks or '+' are read.
inline float parseDecimalFloat(const char* text, const char* limit, const char** end) {
    const char* p = text;
    float sign = 1.0F;
    if (p < limit && *p == '-') {
        sign = -1.0F;
        ++p;
    }
    float acc = 0.0F;
    while (p < limit && isDecimalDigit(*p)) {
        acc = acc * 10.0F + static_cast<float>(*p - '0');
        ++p;
    }
    float value = sign * acc;
    if (p < limit && *p == '.') {
        ++p;
        float scale = 1.0F;
        while (p < limit && isDecimalDigit(*p)) {
            scale = scale * 0.1F;
            value = value + (static_cast<float>(*p - '0') * scale) * sign;
            ++p;
        }
    } else if (p < limit && *p == '-') {
        *end = nullptr;
        return value;
    }
    *end = p;
    return value;
}

// Reads the run of decimal digits at `text` (empty reads as 0; the value wraps modulo 2^32
// on overflow) and returns the position after it.
inline const char* parseDigitRun(const char* text, const char* limit, std::uint32_t& value) {
    std::uint32_t acc = 0;
    while (text < limit && isDecimalDigit(*text)) {
        acc = acc * 10U + static_cast<std::uint32_t>(*text - '0');
        ++text;
    }
    value = acc;
    return text;
}

}  // namespace orv
