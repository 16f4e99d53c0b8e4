#include "config/settings.h"

#include <gtest/gtest.h>

#include <cmath>

#include "sessions/search_paths.h"
#include "sessions/session_record.h"

namespace {

using orv::ProcessingSettings;

// The order and the message of -p are the command line's tests; here the edges.
TEST(Percentiles, EqualValuesKeptEmptyListRefusedNaNCannotHangTheSort) {
    ProcessingSettings s;
    std::string out;
    platform::Console console(&out);
    const float equal[] = {50, 50, 10};
    EXPECT_EQ(orv::configurePercentiles(s, equal, 3, console), 1);
    EXPECT_EQ(s.percentiles, (std::vector<float>{10, 50, 50}));
    out.clear();
    EXPECT_EQ(orv::configurePercentiles(s, equal, 0, console), 0);
    EXPECT_EQ(s.percentileCount(), 0U);
    EXPECT_EQ(out, "");

    const float withNan[] = {50, NAN, 10};
    EXPECT_EQ(orv::configurePercentiles(s, withNan, 3, console), 1);
    EXPECT_EQ(s.percentiles[0], 10.0F);
    EXPECT_EQ(s.percentiles[1], 50.0F);
    EXPECT_TRUE(std::isnan(s.percentiles[2]));
    EXPECT_FALSE(orv::isSortedAscending(withNan, 3));
    EXPECT_TRUE(orv::isSortedAscending(equal + 2, 1));
}

TEST(Intervals, SettersStoreSixtyAsZeroAndRefuseOthersSilently) {
    ProcessingSettings s;
    s.statsIntervalMin = 15;
    s.leqInterval = 99;
    std::string out;
    platform::Console console(&out);
    EXPECT_EQ(orv::setStatsInterval(s, 60, console), 1);
    EXPECT_EQ(s.statsIntervalMin, 0U);
    EXPECT_EQ(out, "Using 0min statistics interval length\r\n");
    out.clear();
    EXPECT_EQ(orv::setStatsInterval(s, 7, console), 0);
    EXPECT_EQ(s.statsIntervalMin, 0U);
    EXPECT_EQ(out, "");
    for (unsigned v : {1U, 2U, 3U, 4U, 5U, 10U, 15U, 20U, 30U}) {
        EXPECT_EQ(orv::setStatsInterval(s, v, console), 1) << v;
        EXPECT_EQ(s.statsIntervalMin, v);
    }
    EXPECT_EQ(orv::setLeqInterval(s, 3, console), 0);  // a statistics interval, not a Leq one
    EXPECT_EQ(s.leqInterval, 99U);
    EXPECT_EQ(orv::setLeqInterval(s, 0, console), 1);
    EXPECT_EQ(s.leqInterval, 0U);
    EXPECT_EQ(orv::setLeqInterval(s, 60, console), 1);
    EXPECT_EQ(s.leqInterval, 0U);
}

TEST(Intervals, Boundaries) {
    // {minute, interval, boundary}: interval 0 (60 minutes) has its boundary at 0 only.
    for (const auto& [value, interval, boundary] : {std::tuple{45, 15, 1},
                                                    {50, 15, 0},
                                                    {0, 15, 1},
                                                    {0, 0, 1},
                                                    {30, 0, 0},
                                                    {56, 4, 1},
                                                    {58, 4, 0}}) {
        EXPECT_EQ(orv::isIntervalBoundary(static_cast<std::uint16_t>(value),
                                          static_cast<std::uint16_t>(interval)),
                  boundary)
            << value << " " << interval;
    }
}

TEST(StartUp, DefaultsAndTheirMessages) {
    ProcessingSettings s;
    s.octaveBandCount = 36;
    s.pipeName = "left over";
    orv::SearchPathList paths{{"/x"}, {"/x"}};
    orv::SessionTable table;
    table.entries.resize(2);
    std::string out;
    platform::Console console(&out);
    ASSERT_EQ(orv::initDefaults(s, paths, table, 0, console), 1);
    EXPECT_EQ(out,
              "Using Fast time weighting\r\nConfigured 8 percentiles\r\n"
              "Using 15min statistics interval length\r\n");
    EXPECT_EQ(s.statsIntervalMin, 15U);
    EXPECT_EQ(s.leqInterval, 99U);
    EXPECT_EQ(s.generalWeighting, 1U);
    EXPECT_EQ(s.octaveFreqWeighting, 1U);
    EXPECT_EQ(s.octaveTimeWeighting, 2U);
    EXPECT_EQ(s.octaveBandCount, 0U);
    EXPECT_EQ(s.auxFilterType, 0U);
    EXPECT_EQ(s.pipeName, "");
    EXPECT_EQ(s.percentiles, (std::vector<float>{1, 5, 10, 25, 50, 75, 90, 99}));
    EXPECT_TRUE(paths.paths.empty() && paths.comparable.empty());
    EXPECT_EQ(table.count(), 0U);

    out.clear();
    ASSERT_EQ(orv::initDefaults(s, paths, table, 20, console), 1);
    EXPECT_EQ(
        out.rfind("MSG: Non Intel Processor found. px version of code was set\r\nUsing Fast", 0),
        0U);

    orv::releaseLists(s, paths, table);
    EXPECT_EQ(s.percentileCount(), 0U);
}

}  // namespace
