#include "platform/civil_time.h"

#include <gtest/gtest.h>

#include <cstring>
#include <vector>

namespace {

using platform::FileTime;
using platform::SystemTime;

SystemTime make(std::uint16_t y, std::uint16_t mo, std::uint16_t d, std::uint16_t h = 0,
                std::uint16_t mi = 0, std::uint16_t s = 0, std::uint16_t ms = 0) {
    return SystemTime{y, mo, 0, d, h, mi, s, ms};
}

FileTime ticks(const SystemTime& t) {
    FileTime f = 0;
    EXPECT_TRUE(platform::systemTimeToFileTime(t, f));
    return f;
}

TEST(CivilTime, KnownInstantsAndDaysOfWeek) {
    EXPECT_EQ(ticks(make(1601, 1, 1)), 0U);
    // The Unix epoch is 11644473600 s after 1601-01-01.
    EXPECT_EQ(ticks(make(1970, 1, 1)), 11644473600ULL * platform::kTicksPerSecond);
    EXPECT_EQ(ticks(make(1601, 1, 1, 0, 0, 0, 1)), 10000U);
    EXPECT_EQ(ticks(make(1601, 1, 2)) - ticks(make(1601, 1, 1, 23, 59, 59, 999)), 10000U);
    EXPECT_EQ(ticks(make(2024, 3, 1)) - ticks(make(2024, 2, 28)),
              2 * 86400 * platform::kTicksPerSecond);
    // 1601-01-01 a Monday, 2000-02-29 a Tuesday, 2020-09-17 a Thursday.
    for (const auto& [t, weekday] : {std::pair{make(1601, 1, 1), 1},
                                     {make(2000, 2, 29), 2},
                                     {make(2020, 9, 17, 8, 29, 50), 4}}) {
        SystemTime back;
        ASSERT_TRUE(platform::fileTimeToSystemTime(ticks(t), back));
        EXPECT_EQ(back.dayOfWeek, weekday) << t.year;
    }
    SystemTime last;
    EXPECT_TRUE(platform::fileTimeToSystemTime((1ULL << 63) - 1, last));
    EXPECT_EQ(last.year, 30828);
    EXPECT_FALSE(platform::fileTimeToSystemTime(1ULL << 63, last));
    EXPECT_FALSE(platform::fileTimeToSystemTime(~0ULL, last));
    using platform::compareFileTime;
    EXPECT_EQ((std::vector{compareFileTime(1, 2), compareFileTime(2, 2), compareFileTime(3, 2)}),
              (std::vector{-1, 0, 1}));
}

TEST(CivilTime, RoundTripsOverTheWholeRange) {
    // Every day of the years around the leap-rule edges, and a sparse walk over the rest.
    auto roundTrip = [](const SystemTime& t) {
        SystemTime back;
        ASSERT_TRUE(platform::fileTimeToSystemTime(ticks(t), back));
        back.dayOfWeek = 0;
        EXPECT_EQ(std::memcmp(&back, &t, sizeof t), 0)
            << t.year << "-" << t.month << "-" << t.day << " " << t.hour << ":" << t.minute << ":"
            << t.second << "." << t.milliseconds;
    };
    for (unsigned year : {1601U, 1700U, 1900U, 1999U, 2000U, 2020U, 2100U, 2400U, 30827U}) {
        for (unsigned m = 1; m <= 12; ++m) {
            for (unsigned d = 1; d <= platform::daysInMonth(year, m); ++d) {
                roundTrip(make(year, m, d, d % 24, (d * 7) % 60, (d * 13) % 60, (d * 37) % 1000));
            }
        }
    }
    // Month ends across the whole range, and year starts in increasing order.
    FileTime previous = ticks(make(1601, 1, 1));
    for (unsigned year = 1601; year <= 30827; year += 7) {
        for (unsigned m : {1U, 2U, 3U, 12U}) {
            roundTrip(make(year, m, platform::daysInMonth(year, m), 23, 59, 59, 999));
        }
        const FileTime now = ticks(make(year, 1, 1));
        EXPECT_GE(now, previous);
        previous = now;
    }
    roundTrip(make(30827, 12, 31, 23, 59, 59, 999));
}

TEST(CivilTime, EveryInvalidFieldFails) {
    const SystemTime good = make(2020, 4, 30, 23, 59, 59, 999);
    struct Case {
        std::uint16_t SystemTime::*field;
        std::uint16_t value;
        bool valid;
    };
    const Case cases[] = {
        {&SystemTime::month, 0, false},    {&SystemTime::month, 13, false},
        {&SystemTime::day, 0, false},      {&SystemTime::day, 31, false},  // April has 30
        {&SystemTime::hour, 24, false},    {&SystemTime::minute, 60, false},
        {&SystemTime::second, 60, false},  {&SystemTime::milliseconds, 1000, false},
        {&SystemTime::year, 1600, false},  {&SystemTime::year, 30828, false},
        {&SystemTime::dayOfWeek, 6, true},  // ignored on the way in
        {&SystemTime::year, 30827, true},
    };
    for (const Case& c : cases) {
        SystemTime t = good;
        t.*c.field = c.value;
        FileTime out = 0;
        EXPECT_EQ(platform::systemTimeToFileTime(t, out), c.valid) << c.value;
    }
    // February 29 only in leap years: every 4th, not every 100th, but every 400th.
    for (const auto& [year, leap] :
         {std::pair{2024, true}, {2000, true}, {1900, false}, {2100, false}, {2023, false}}) {
        FileTime out = 0;
        EXPECT_EQ(platform::isLeapYear(year), leap) << year;
        EXPECT_EQ(
            platform::systemTimeToFileTime(make(static_cast<std::uint16_t>(year), 2, 29), out),
            leap)
            << year;
    }
}

}  // namespace
