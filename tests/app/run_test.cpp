#include <gtest/gtest.h>

#include <tuple>

#include "config/command_line.h"
#include "support/test_support.h"

namespace {

using testing_support::runTool;
using testing_support::runToolProcess;
using testing_support::TempDir;

const std::string kStartup =
    "Using Fast time weighting\r\nConfigured 8 percentiles\r\nUsing 15min statistics interval "
    "length\r\n";

std::string usageText() {
    std::string text;
    platform::Console console(&text);
    orv::printUsage(console);
    return text;
}

TEST(Usage, HasEightyStringsAndVersion) {
    const std::string usage = usageText();
    EXPECT_EQ(
        usage.rfind(
            "\r\nQuellmark\r\nOrvane - Telwa Session Post Processing Command Line Tool\r\n\r\n"
            "Version :  V3.60\r\n\r\n"
            "USAGE   :  orv_cmd [options] -s <session dir> -d <output dir>\r\n\r\n",
            0),
        0U);
    const std::string tail =
        "                           Defaults to Split type handling\r\n"
        "\r\n";
    ASSERT_GE(usage.size(), tail.size());
    EXPECT_EQ(usage.substr(usage.size() - tail.size()), tail);
    EXPECT_NE(usage.find("        250, 316, 400, 500, 630, 800, 1000, 1250, 1600, 2000,\r\n"),
              std::string::npos);
    EXPECT_EQ(usage.find("-npn"), std::string::npos);
    EXPECT_EQ(usage.find("-bin"), std::string::npos);
    EXPECT_EQ(usage.find("-csv"), std::string::npos);
    // Every line ends with CR LF; no bare line feeds.
    for (std::size_t i = usage.find('\n'); i != std::string::npos; i = usage.find('\n', i + 1)) {
        ASSERT_GT(i, 0U);
        EXPECT_EQ(usage[i - 1], '\r') << "at " << i;
    }
}

// A refused line prints the start-up lines (after the processor message, when there is one),
// the parser's messages and the usage text, and ends the run with -1.
TEST(Run, RefusedLinesPrintStartupMessagesThenUsage) {
    TempDir dir;
    const std::string processor = "MSG: Non Intel Processor found. px version of code was set\r\n";
    const std::tuple<std::vector<std::string>, int, std::string> cases[] = {
        {{"-s", "only"}, 0, kStartup},  // too few arguments
        {{"-s", dir.path(), "-i", "7", "-d", dir / "out", "-h"},
         0,
         kStartup + "ERROR - 7 is an invalid interval - Using default\r\n"},
        {{"-s", "x"}, 20, processor + kStartup},
    };
    for (const auto& [args, vectorStatus, before] : cases) {
        const auto r = runTool(args, vectorStatus);
        EXPECT_EQ(r.status, -1) << args[1];
        EXPECT_EQ(r.output, before + usageText()) << args[1];
    }
}

TEST(Run, RealProcessExitsWith255OnRefusedLine) {
    const auto r = runToolProcess({"-s", "x", "-d"});
    EXPECT_EQ(r.status, 255);
    EXPECT_EQ(r.output.rfind(kStartup, r.output.find("Using Fast")), r.output.find("Using Fast"));
    EXPECT_NE(r.output.find("Version :  V3.60"), std::string::npos);
}

TEST(Run, EmptySearchReportsNoSessions) {
    TempDir dir;
    testing_support::makeDirs(dir / "empty");
    const auto r = runTool({"-s", dir / "empty", "-d", dir / "out"});
    EXPECT_EQ(r.status, 0);
    EXPECT_EQ(r.output, kStartup +
                            "Finding Sessions...\r\nFound 0 Session(s)\r\n\r\n"
                            "Processed 0 out of 0 sessions\r\n");
    const auto real = runToolProcess({"-s", dir / "empty", "-d", dir / "out"});
    EXPECT_EQ(real.status, 0);
    EXPECT_EQ(real.output, r.output);
}

TEST(Run, EachRunStartsFromFreshState) {
    TempDir dir;
    auto first = runTool({"-s", dir.path(), "-d", dir / "out", "-p", "50", "-i", "5"});
    EXPECT_EQ(first.status, 0);
    auto second = runTool({"-s", dir.path(), "-d", dir / "out"});
    EXPECT_EQ(second.output.rfind(kStartup + "Finding Sessions...\r\n", 0), 0U);
}

}  // namespace
