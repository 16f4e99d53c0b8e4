// The command line of orv_demo.
#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "orv_demo/demo_options.h"

namespace orv_demo {
namespace {

using Args = std::vector<std::string>;

TEST(DemoCommandLine, OptionsAndDefaults) {
    ParsedCommandLine cl = parseCommandLine({});
    EXPECT_EQ(cl.error, "");
    EXPECT_EQ(cl.options.durationSeconds, 240);
    EXPECT_EQ(cl.options.start.hour * 100 + cl.options.start.minute, 1258U);

    cl =
        parseCommandLine({"--out", "o", "--name", "N", "--start", "2023-12-31T23:59:00",
                          "--duration", "86400", "--calibration", "12.5", "--seed", "99",
                          "--triggered", "--pre-record", "10", "--split-wave", "60", "--no-audio"});
    ASSERT_EQ(cl.error, "");
    const DemoOptions& o = cl.options;
    EXPECT_EQ(o.outDir + "/" + o.name, "o/N");
    EXPECT_EQ(o.start.year, 2023);
    EXPECT_EQ(o.start.day, 31U);
    EXPECT_EQ(o.durationSeconds, 86400);
    EXPECT_EQ(o.calibration, 12.5);
    EXPECT_EQ(o.seed, 99U);
    EXPECT_TRUE(o.triggered);
    EXPECT_EQ(o.preRecordSeconds, 10);
    EXPECT_EQ(o.splitSeconds, 60);
    EXPECT_FALSE(o.audio);
    EXPECT_TRUE(parseCommandLine({"--help"}).help);
}

TEST(DemoCommandLine, RefusedInput) {
    const std::vector<Args> refused = {
        {"--duration"},         // no value
        {"--frobnicate", "1"},  // unknown option
        {"stray"},
        {"--duration", "0"},
        {"--duration", "12s"},
        {"--duration", "1209601"},
        {"--start", "2024-02-30 10:00:00"},  // no such day
        {"--start", "2024-03-05 24:00:00"},
        {"--start", "2024-03-05"},
        {"--calibration", "-3"},  // the information file holds no sign
        {"--calibration", "abc"},
        {"--seed", "-1"},
        {"--name", "a/b"},
        {"--name", "a,b"},  // a comma would end the level files' title
        {"--name", ""},
        {"--split-wave", "0"},
        {"--pre-record", "61"},
        {"--triggered", "--wave-minutes", "2"},
        {"--duration", "86400"},                        // one wave file of 24 h is too long
        {"--duration", "86400", "--split-wave", "60"},  // 1440 parts
        // The wave file would be named 000030, which a reader takes for 30:00:00.
        {"--start", "2024-03-05 00:00:25", "--pre-record", "5"},
    };
    for (const Args& args : refused) {
        std::string line;
        for (const std::string& a : args) line += a + " ";
        EXPECT_NE(parseCommandLine(args).error, "") << line;
    }
    EXPECT_EQ(parseCommandLine({"--duration", "86400", "--split-wave", "3600"}).error, "");
    EXPECT_EQ(parseCommandLine({"--duration", "86400", "--wave-minutes", "10"}).error, "");
    EXPECT_EQ(parseCommandLine({"--start", "2024-03-05 00:00:25", "--no-audio"}).error, "");
}

}  // namespace
}  // namespace orv_demo
