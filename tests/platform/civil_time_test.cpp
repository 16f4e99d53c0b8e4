#include "platform/civil_time.h"

#include <gtest/gtest.h>

namespace {

using platform::FileTime;
using platform::SystemTime;

SystemTime make(unsigned y, unsigned mo, unsigned d, unsigned h = 0, unsigned mi = 0,
                unsigned s = 0, unsigned ms = 0) {
    SystemTime t;
    t.year = static_cast<std::uint16_t>(y);
    t.month = static_cast<std::uint16_t>(mo);
    t.day = static_cast<std::uint16_t>(d);
    t.hour = static_cast<std::uint16_t>(h);
    t.minute = static_cast<std::uint16_t>(mi);
    t.second = static_cast<std::uint16_t>(s);
    t.milliseconds = static_cast<std::uint16_t>(ms);
    return t;
}

FileTime ticks(const SystemTime& t) {
    FileTime f = 0;
    EXPECT_TRUE(platform::systemTimeToFileTime(t, f));
    return f;
}

TEST(CivilTime, KnownInstants) {
    EXPECT_EQ(ticks(make(1601, 1, 1)), 0U);
    // The Unix epoch is 11644473600 s after 1601-01-01.
    EXPECT_EQ(ticks(make(1970, 1, 1)), 11644473600ULL * platform::kTicksPerSecond);
    EXPECT_EQ(ticks(make(1601, 1, 1, 0, 0, 0, 1)), 10000U);
    EXPECT_EQ(ticks(make(1601, 1, 2)) - ticks(make(1601, 1, 1, 23, 59, 59, 999)), 10000U);

    SystemTime back;
    ASSERT_TRUE(platform::fileTimeToSystemTime(ticks(make(2020, 9, 17, 8, 29, 50)), back));
    EXPECT_EQ(back.dayOfWeek, 4);  // a Thursday
    ASSERT_TRUE(platform::fileTimeToSystemTime(0, back));
    EXPECT_EQ(back.dayOfWeek, 1);  // 1601-01-01 was a Monday
    ASSERT_TRUE(platform::fileTimeToSystemTime(ticks(make(2000, 2, 29)), back));
    EXPECT_EQ(back.dayOfWeek, 2);  // a Tuesday
}

TEST(CivilTime, RoundTripsOverTheWholeRange) {
    // Every day of the years around the leap-rule edges, and a sparse walk over the rest.
    auto roundTrip = [](const SystemTime& t) {
        FileTime f = 0;
        ASSERT_TRUE(platform::systemTimeToFileTime(t, f));
        SystemTime back;
        ASSERT_TRUE(platform::fileTimeToSystemTime(f, back));
        EXPECT_EQ(back.year, t.year);
        EXPECT_EQ(back.month, t.month);
        EXPECT_EQ(back.day, t.day);
        EXPECT_EQ(back.hour, t.hour);
        EXPECT_EQ(back.minute, t.minute);
        EXPECT_EQ(back.second, t.second);
        EXPECT_EQ(back.milliseconds, t.milliseconds);
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

TEST(CivilTime, LeapYears) {
    EXPECT_TRUE(platform::isLeapYear(2000));
    EXPECT_TRUE(platform::isLeapYear(2024));
    EXPECT_FALSE(platform::isLeapYear(1900));
    EXPECT_FALSE(platform::isLeapYear(2100));
    EXPECT_FALSE(platform::isLeapYear(2023));
    FileTime f = 0;
    EXPECT_TRUE(platform::systemTimeToFileTime(make(2024, 2, 29), f));
    EXPECT_TRUE(platform::systemTimeToFileTime(make(2000, 2, 29), f));
    EXPECT_FALSE(platform::systemTimeToFileTime(make(1900, 2, 29), f));
    EXPECT_FALSE(platform::systemTimeToFileTime(make(2023, 2, 29), f));
    EXPECT_EQ(ticks(make(2024, 3, 1)) - ticks(make(2024, 2, 28)),
              2 * 86400 * platform::kTicksPerSecond);
}

TEST(CivilTime, EveryInvalidFieldFails) {
    FileTime f = 12345;
    const SystemTime good = make(2020, 4, 30, 23, 59, 59, 999);
    EXPECT_TRUE(platform::systemTimeToFileTime(good, f));
    auto fails = [](SystemTime t) {
        FileTime out = 0;
        return !platform::systemTimeToFileTime(t, out);
    };
    SystemTime t = good;
    t.month = 0;
    EXPECT_TRUE(fails(t));
    t.month = 13;
    EXPECT_TRUE(fails(t));
    t = good;
    t.day = 0;
    EXPECT_TRUE(fails(t));
    t.day = 31;  // April has 30
    EXPECT_TRUE(fails(t));
    t = good;
    t.hour = 24;
    EXPECT_TRUE(fails(t));
    t = good;
    t.minute = 60;
    EXPECT_TRUE(fails(t));
    t = good;
    t.second = 60;
    EXPECT_TRUE(fails(t));
    t = good;
    t.milliseconds = 1000;
    EXPECT_TRUE(fails(t));
    t = good;
    t.year = 1600;
    EXPECT_TRUE(fails(t));
    t.year = 30828;
    EXPECT_TRUE(fails(t));
    t = good;
    t.dayOfWeek = 6;  // ignored on the way in
    EXPECT_FALSE(fails(t));
}

TEST(CivilTime, ConversionBackFailsFrom2To63) {
    SystemTime t;
    EXPECT_TRUE(platform::fileTimeToSystemTime((1ULL << 63) - 1, t));
    EXPECT_EQ(t.year, 30828);
    EXPECT_FALSE(platform::fileTimeToSystemTime(1ULL << 63, t));
    EXPECT_FALSE(platform::fileTimeToSystemTime(~0ULL, t));
}

TEST(CivilTime, Compare) {
    EXPECT_EQ(platform::compareFileTime(1, 2), -1);
    EXPECT_EQ(platform::compareFileTime(2, 2), 0);
    EXPECT_EQ(platform::compareFileTime(3, 2), 1);
}

}  // namespace
