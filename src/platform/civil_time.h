// Calendar time fields and 100 ns ticks since 1601-01-01 00:00 (proleptic Gregorian, no time
// zone), with the conversions failing exactly where the Windows ones fail.
#pragma once

#include <cstdint>

namespace platform {

struct SystemTime {
    std::uint16_t year = 0;
    std::uint16_t month = 0;      // 1..12
    std::uint16_t dayOfWeek = 0;  // 0 = Sunday; ignored on the way in
    std::uint16_t day = 0;        // 1..31
    std::uint16_t hour = 0;
    std::uint16_t minute = 0;
    std::uint16_t second = 0;
    std::uint16_t milliseconds = 0;
};

using FileTime = std::uint64_t;  // 100 ns units since 1601-01-01 00:00

inline constexpr FileTime kTicksPerSecond = 10'000'000ULL;

// Fails (returns false) for month 0 or > 12, day 0 or past the month's end, hour > 23,
// minute > 59, second > 59, milliseconds > 999, year < 1601 or > 30827.
bool systemTimeToFileTime(const SystemTime& in, FileTime& out);
// Fails for tick values of 2^63 and above. Computes the day of week.
bool fileTimeToSystemTime(FileTime in, SystemTime& out);
// -1, 0 or 1.
int compareFileTime(FileTime a, FileTime b);

bool isLeapYear(unsigned year);
unsigned daysInMonth(unsigned year, unsigned month);

}  // namespace platform
