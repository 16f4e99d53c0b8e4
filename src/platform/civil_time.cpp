#include "platform/civil_time.h"

namespace platform {
namespace {

constexpr std::int64_t kDaysPer400Years = 146097;
constexpr std::uint64_t kTicksPerDay = 86400ULL * kTicksPerSecond;
constexpr std::uint64_t kTicksPerMs = 10'000ULL;

// Days from 1601-01-01 to year-month-day (valid fields).
std::int64_t daysSince1601(unsigned year, unsigned month, unsigned day) {
    const std::int64_t y = static_cast<std::int64_t>(year) - 1601;
    std::int64_t days = y * 365 + y / 4 - y / 100 + y / 400;
    for (unsigned m = 1; m < month; ++m) days += daysInMonth(year, m);
    return days + static_cast<std::int64_t>(day) - 1;
}

}  // namespace

bool isLeapYear(unsigned year) { return (year % 4 == 0 && year % 100 != 0) || year % 400 == 0; }

unsigned daysInMonth(unsigned year, unsigned month) {
    static constexpr unsigned kDays[12] = {31, 28, 31, 30, 31, 30, 31, 31, 30, 31, 30, 31};
    if (month < 1 || month > 12) return 0;
    return month == 2 && isLeapYear(year) ? 29 : kDays[month - 1];
}

bool systemTimeToFileTime(const SystemTime& in, FileTime& out) {
    if (in.year < 1601 || in.year > 30827) return false;
    if (in.month < 1 || in.month > 12) return false;
    if (in.day < 1 || in.day > daysInMonth(in.year, in.month)) return false;
    if (in.hour > 23 || in.minute > 59 || in.second > 59 || in.milliseconds > 999) return false;
    const auto days = static_cast<std::uint64_t>(daysSince1601(in.year, in.month, in.day));
    const std::uint64_t seconds = in.hour * 3600ULL + in.minute * 60ULL + in.second;
    out = days * kTicksPerDay + seconds * kTicksPerSecond + in.milliseconds * kTicksPerMs;
    return true;
}

bool fileTimeToSystemTime(FileTime in, SystemTime& out) {
    if (in >= (1ULL << 63)) return false;
    std::uint64_t days = in / kTicksPerDay;
    std::uint64_t rest = in % kTicksPerDay;
    SystemTime t;
    t.dayOfWeek = static_cast<std::uint16_t>((days + 1) % 7);  // 1601-01-01 was a Monday
    // Whole 400-year cycles, then centuries, 4-year groups and single years.
    std::uint64_t year = 1601 + 400 * (days / kDaysPer400Years);
    days %= kDaysPer400Years;
    std::uint64_t centuries = days / 36524;
    if (centuries == 4) centuries = 3;  // the last day of a cycle
    days -= centuries * 36524;
    year += centuries * 100;
    const std::uint64_t quads = days / 1461;
    days -= quads * 1461;
    year += quads * 4;
    std::uint64_t years = days / 365;
    if (years == 4) years = 3;
    days -= years * 365;
    year += years;
    unsigned month = 1;
    while (days >= daysInMonth(static_cast<unsigned>(year), month)) {
        days -= daysInMonth(static_cast<unsigned>(year), month);
        ++month;
    }
    t.year = static_cast<std::uint16_t>(year);
    t.month = static_cast<std::uint16_t>(month);
    t.day = static_cast<std::uint16_t>(days + 1);
    t.hour = static_cast<std::uint16_t>(rest / (3600ULL * kTicksPerSecond));
    rest %= 3600ULL * kTicksPerSecond;
    t.minute = static_cast<std::uint16_t>(rest / (60ULL * kTicksPerSecond));
    rest %= 60ULL * kTicksPerSecond;
    t.second = static_cast<std::uint16_t>(rest / kTicksPerSecond);
    rest %= kTicksPerSecond;
    t.milliseconds = static_cast<std::uint16_t>(rest / kTicksPerMs);
    out = t;
    return true;
}

int compareFileTime(FileTime a, FileTime b) { return a < b ? -1 : (a > b ? 1 : 0); }

}  // namespace platform
