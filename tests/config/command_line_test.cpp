#include "config/command_line.h"

#include <gtest/gtest.h>

#include <chrono>

#include "config/settings.h"
#include "platform/directory.h"
#include "sessions/search_paths.h"
#include "sessions/session_record.h"
#include "support/test_support.h"

namespace {

using testing_support::TempDir;

struct Parsed {
    int ok = 0;
    orv::ProcessingSettings s;
    orv::SearchPathList paths;
    std::string out;  // what the parser printed (start-up lines excluded)
};

class CommandLine : public ::testing::Test {
protected:
    // Parses "orv_cmd <args>" after the start-up defaults.
    Parsed parse(const std::vector<std::string>& args) {
        Parsed p;
        orv::SessionTable table;
        std::string startup;
        platform::Console quiet(&startup);
        orv::initDefaults(p.s, p.paths, table, 0, quiet);
        std::vector<const char*> argv{"orv_cmd"};
        for (const auto& a : args) argv.push_back(a.c_str());
        platform::Console console(&p.out);
        p.ok = orv::parseCommandLine(static_cast<int>(argv.size()), argv.data(), p.s, p.paths,
                                     console);
        return p;
    }
    // "-s <session> -d <out>" followed by the given options.
    Parsed parseWith(const std::vector<std::string>& options) {
        std::vector<std::string> args{"-s", session(), "-d", out()};
        args.insert(args.end(), options.begin(), options.end());
        return parse(args);
    }
    std::string session() const { return dir_ / "sessions"; }
    std::string out() const { return dir_ / "out"; }

    TempDir dir_;
};

TEST_F(CommandLine, MinimalLineIsAcceptedAndOutputDirectoryResolved) {
    testing_support::makeDirs(session());
    Parsed p = parse({"-s", session(), "-d", out()});
    EXPECT_EQ(p.ok, 1);
    EXPECT_EQ(p.out, "");
    EXPECT_EQ(p.paths.paths, std::vector<std::string>{session()});
    EXPECT_TRUE(testing_support::exists(out()));
    EXPECT_EQ(p.s.outputDirValid, 1U);
    std::string canonical;
    ASSERT_TRUE(platform::canonicalDirectory(out(), canonical));
    EXPECT_EQ(p.s.outputDir, canonical + "/");
}

TEST_F(CommandLine, StructuralFailures) {
    EXPECT_EQ(parse({"-s", session(), "-d"}).ok, 0);  // fewer than five arguments
    EXPECT_EQ(parse({"-s", "a", "b", "c"}).ok, 0);    // no output directory
    EXPECT_EQ(parse({"-d", out(), "x", "y"}).ok, 0);  // no search path
    EXPECT_EQ(parseWith({"-h"}).ok, 0);               // unknown option
    EXPECT_EQ(parseWith({"-leqq"}).ok, 0);            // length 5
    EXPECT_EQ(parseWith({"-"}).ok, 0);                // length 1
    EXPECT_EQ(parseWith({"-zzz"}).ok, 0);
    // Upper-case words, and four-letter words that begin with a two-letter name.
    Parsed p = parse({"-S", session(), "-D", out(), "-R"});
    EXPECT_EQ(p.ok, 1);
    EXPECT_EQ(p.s.recursiveSearch, 1U);
    p = parse({"-sab", session(), "-Dxy", out(), "-Iab", "30"});
    EXPECT_EQ(p.ok, 1);
    EXPECT_EQ(p.s.statsIntervalMin, 30U);
}

TEST_F(CommandLine, SearchPaths) {
    Parsed p = parse({"-s", "/a", "/b", "/a", "-d", out()});
    EXPECT_EQ(p.ok, 1);
    EXPECT_EQ(p.out, "MSG: Duplicate Search Path Given - \"/a\".\r\n");
    EXPECT_EQ(p.paths.paths, (std::vector<std::string>{"/a", "/b"}));
    // A path that only starts like an earlier one is a different directory.
    testing_support::makeDirs(dir_ / "S10");
    testing_support::makeDirs(dir_ / "S1");
    p = parse({"-s", dir_ / "S10", dir_ / "S1", dir_ / "S1/", "-d", out()});
    EXPECT_EQ(p.paths.paths, (std::vector<std::string>{dir_ / "S10", dir_ / "S1"}));
    EXPECT_EQ(p.out, "MSG: Duplicate Search Path Given - \"" + dir_ / "S1/" + "\".\r\n");
    // Only duplicates still count as a given search path.
    p = parse({"-s", "/a", "-s", "/a", "-d", out()});
    EXPECT_EQ(p.ok, 1);
    // Thousands of paths take time in proportion to their number (each is resolved once).
    std::vector<std::string> many{"-s"};
    for (int i = 0; i < 4000; ++i) many.push_back(dir_ / std::to_string(i % 3999));
    many.insert(many.end(), {"-d", out()});
    const auto start = std::chrono::steady_clock::now();
    p = parse(many);
    EXPECT_LT(std::chrono::steady_clock::now() - start, std::chrono::seconds(2));
    EXPECT_EQ(p.paths.paths.size(), 3999U);
}

TEST_F(CommandLine, Percentiles) {
    Parsed p = parseWith({"-p", "90", "10", "50"});
    EXPECT_EQ(p.ok, 1);
    EXPECT_EQ(p.out, "Configured 3 percentiles\r\n");
    EXPECT_EQ(p.s.percentiles, (std::vector<float>{10, 50, 90}));

    p = parseWith({"-p", "10", "abc"});
    EXPECT_EQ(p.ok, 1);
    EXPECT_EQ(p.out, "ERROR - Unable to set percentiles - Using defaults\r\n");
    EXPECT_EQ(p.s.percentileCount(), 8U);

    p = parseWith({"-p", "12abc", "33.3"});
    EXPECT_EQ(p.s.percentiles, (std::vector<float>{12.0F, 33.3F}));

    for (const char* bad : {"nan", "inf", "1e99"}) {
        p = parseWith({"-p", "5", bad});
        EXPECT_EQ(p.out, "ERROR - Unable to set percentiles - Using defaults\r\n") << bad;
        EXPECT_EQ(p.s.percentileCount(), 8U);
    }
    // No value at all, before another option and at the end.
    p = parseWith({"-p", "-r"});
    EXPECT_EQ(p.ok, 1);
    EXPECT_EQ(p.out, "ERROR - Unable to set percentiles - Using defaults\r\n");
    EXPECT_EQ(p.s.recursiveSearch, 1U);
    p = parseWith({"-p"});
    EXPECT_EQ(p.out, "ERROR - Unable to set percentiles - Using defaults\r\n");
    EXPECT_EQ(p.s.percentileCount(), 8U);
    // A later -p replaces an earlier one.
    p = parseWith({"-p", "5", "-p", "7", "3"});
    EXPECT_EQ(p.s.percentiles, (std::vector<float>{3, 7}));
}

TEST_F(CommandLine, StatisticsInterval) {
    Parsed p = parseWith({"-i", "60"});
    EXPECT_EQ(p.out, "Using 0min statistics interval length\r\n");
    EXPECT_EQ(p.s.statsIntervalMin, 0U);
    p = parseWith({"-i", "7"});
    EXPECT_EQ(p.out, "ERROR - 7 is an invalid interval - Using default\r\n");
    EXPECT_EQ(p.s.statsIntervalMin, 15U);
    p = parseWith({"-i", "x"});
    EXPECT_EQ(p.out, "ERROR - x is an invalid interval - Using default\r\n");
    p = parseWith({"-i", "10min"});
    EXPECT_EQ(p.s.statsIntervalMin, 10U);
    p = parseWith({"-i", "-5"});
    EXPECT_EQ(p.out, "ERROR - -5 is an invalid interval - Using default\r\n");
    EXPECT_EQ(p.ok, 1);
    p = parseWith({"-i"});
    EXPECT_EQ(p.out, "ERROR -  is an invalid interval - Using default\r\n");
    EXPECT_EQ(p.ok, 1);
    // -i takes the next argument whatever it is: here the -d, so no output directory.
    p = parse({"-s", session(), "-i", "-d", out()});
    EXPECT_EQ(p.out, "ERROR - -d is an invalid interval - Using default\r\n");
    EXPECT_EQ(p.ok, 0);
}

TEST_F(CommandLine, LeqInterval) {
    Parsed p = parseWith({});
    EXPECT_EQ(p.s.leqInterval, 99U);
    p = parseWith({"-leq", "60"});
    EXPECT_EQ(p.out, "Using 0min Leq interval length\r\n");
    EXPECT_EQ(p.s.leqInterval, 0U);
    p = parseWith({"-LEQ", "4"});
    EXPECT_EQ(p.s.leqInterval, 4U);
    p = parseWith({"-leq", "3"});
    EXPECT_EQ(p.out, "ERROR - 3 is an invalid Leq interval - Using default\r\n");
    EXPECT_EQ(p.s.leqInterval, 99U);
    p = parseWith({"-leq", "x"});
    EXPECT_EQ(p.out, "ERROR - x is an invalid Leq interval - Using default\r\n");
    p = parseWith({"-leq"});
    EXPECT_EQ(p.out, "ERROR -  is an invalid Leq interval - Using default\r\n");
}

TEST_F(CommandLine, GeneralWeighting) {
    Parsed p = parseWith({"-w", "c"});
    EXPECT_EQ(p.s.generalWeighting, 2U);
    EXPECT_EQ(p.out, "");
    p = parseWith({"-w", "C", "-w", "Z"});
    EXPECT_EQ(p.s.generalWeighting, 1U);
    EXPECT_EQ(p.out, "ERROR - Z is an invalid frequency weighting - Using default\r\n");
    p = parseWith({"-w"});
    EXPECT_EQ(p.out, "ERROR -  is an invalid frequency weighting - Using default\r\n");
    EXPECT_EQ(p.ok, 1);
}

TEST_F(CommandLine, OutputDirectory) {
    Parsed p = parseWith({"-d", dir_ / "other"});
    EXPECT_EQ(p.ok, 0);
    EXPECT_EQ(p.out, "ERROR - Multiple output directories given.\r\n");

    p = parse({"-s", session(), "-d", dir_ / "no/such/parent"});
    EXPECT_EQ(p.ok, 0);
    EXPECT_EQ(p.s.outputDirValid, 0U);
    EXPECT_EQ(p.out, "ERROR - " + dir_ / "no/such/parent" + " is an invalid output directory\r\n");

    // A file of that name is not a directory the results can go to.
    testing_support::writeFile(dir_ / "afile", "x");
    p = parse({"-s", session(), "-d", dir_ / "afile"});
    EXPECT_EQ(p.ok, 0);
    EXPECT_EQ(p.out, "ERROR - " + dir_ / "afile" + " is an invalid output directory\r\n");

    p = parse({"-s", session(), "-r", "-d"});
    EXPECT_EQ(p.ok, 0);
    EXPECT_EQ(p.out, "ERROR -  is an invalid output directory\r\n");

    // Too long for the result paths.
    std::string deep = dir_.path();
    while (deep.size() < 270) deep += "/dddddddddddddddddddd";
    p = parse({"-s", session(), "-d", deep});
    EXPECT_EQ(p.ok, 0);
}

TEST_F(CommandLine, OctaveOption) {
    Parsed p = parseWith({"-oct", "3", "Z", "S"});
    EXPECT_EQ(p.out,
              "Enabled octave filter bank\r\nUsing Slow time weighting\r\nUsing Z frequency "
              "weighting\r\n");
    EXPECT_EQ(p.s.octaveBandCount, 36U);
    EXPECT_EQ(p.s.octaveFreqWeighting, 0U);
    EXPECT_EQ(p.s.octaveTimeWeighting, 3U);
    EXPECT_EQ(p.s.needWaveFiles, 1U);

    p = parseWith({"-oct", "1", "c", "n"});
    EXPECT_EQ(p.s.octaveBandCount, 12U);
    EXPECT_EQ(p.s.octaveTimeWeighting, 0U);

    p = parseWith({"-oct", "2", "A", "F"});
    EXPECT_EQ(p.out, "ERROR - 2 is an invalid octave type - Disabling Octaves\r\n");
    EXPECT_EQ(p.s.octaveBandCount, 0U);
    EXPECT_EQ(p.ok, 1);

    // An option word where a letter belongs ends the option silently and is handled next.
    p = parse({"-s", session(), "-oct", "3", "-d", out()});
    EXPECT_EQ(p.ok, 1);
    EXPECT_EQ(p.out, "");
    EXPECT_EQ(p.s.octaveBandCount, 0U);
    EXPECT_EQ(p.s.needWaveFiles, 0U);

    p = parseWith({"-oct", "3", "Q", "F"});
    EXPECT_EQ(p.out, "ERROR - Q is an invalid frequency weighting - Using default\r\n");
    EXPECT_EQ(p.s.octaveBandCount, 0U);
    p = parseWith({"-oct", "3", "A", "X"});
    EXPECT_EQ(p.out, "ERROR - X is an invalid time weighting - Using default\r\n");
    EXPECT_EQ(p.s.octaveBandCount, 0U);
    p = parseWith({"-oct"});
    EXPECT_EQ(p.out, "ERROR -  is an invalid octave type - Disabling Octaves\r\n");
    p = parseWith({"-oct", "3", "A"});
    EXPECT_EQ(p.out, "");
    EXPECT_EQ(p.s.octaveBandCount, 0U);
    // An earlier valid -oct stays in force when a later one ends early.
    p = parseWith({"-oct", "1", "A", "F", "-oct", "3", "A"});
    EXPECT_EQ(p.s.octaveBandCount, 12U);
}

TEST_F(CommandLine, FilterOptions) {
    Parsed p = parseWith({"-lpf", "1000", "A", "F"});
    EXPECT_EQ(p.out, "Enabled aux filter bank\r\n");
    EXPECT_EQ(p.s.auxFilterType, 1U);
    EXPECT_NEAR(p.s.auxFreq1, 1122.018F, 0.001F);
    EXPECT_EQ(p.s.auxBand1, 16U);
    EXPECT_EQ(p.s.needWaveFiles, 1U);

    p = parseWith({"-hpf", "1000", "A", "F"});
    EXPECT_NEAR(p.s.auxFreq1, 891.251F, 0.001F);
    EXPECT_EQ(p.s.auxFilterType, 2U);

    p = parseWith({"-bpf", "100", "1000", "C", "S"});
    EXPECT_EQ(p.s.auxFilterType, 3U);
    EXPECT_NEAR(p.s.auxFreq1, 89.125F, 0.001F);
    EXPECT_NEAR(p.s.auxFreq2, 1122.018F, 0.001F);
    EXPECT_EQ(p.s.auxBand1, 6U);
    EXPECT_EQ(p.s.auxBand2, 16U);
    EXPECT_EQ(p.s.auxFreqWeighting, 2U);
    EXPECT_EQ(p.s.auxTimeWeighting, 3U);

    p = parseWith({"-bsf", "25", "20000", "A", "N"});
    EXPECT_EQ(p.s.auxFilterType, 4U);
    EXPECT_NEAR(p.s.auxFreq2, 22387.2F, 0.1F);

    for (const char* bad : {"315", "0", "x"}) {
        p = parseWith({"-lpf", bad, "A", "F"});
        EXPECT_EQ(p.out, std::string("ERROR - ") + bad +
                             " is an invalid frequency - Disabling Additional Filtering\r\n");
        EXPECT_EQ(p.s.auxFilterType, 0U);
        EXPECT_EQ(p.s.needWaveFiles, 0U);
    }
    p = parseWith({"-lpf", "1000", "Z", "F"});
    EXPECT_EQ(p.out, "");
    EXPECT_EQ(p.s.auxFilterType, 0U);

    // The last valid filter option is in force; an invalid later one changes nothing.
    p = parseWith({"-lpf", "1000", "A", "F", "-hpf", "2000", "C", "S"});
    EXPECT_EQ(p.s.auxFilterType, 2U);
    EXPECT_EQ(p.s.auxBand1, 19U);
    p = parseWith({"-lpf", "1000", "A", "F", "-hpf", "999", "C", "S"});
    EXPECT_EQ(p.out,
              "Enabled aux filter bank\r\n"
              "ERROR - 999 is an invalid frequency - Disabling Additional Filtering\r\n");
    EXPECT_EQ(p.s.auxFilterType, 1U);

    p = parseWith({"-apf", "C", "S"});
    EXPECT_EQ(p.s.auxFilterType, 6U);
    EXPECT_EQ(p.s.auxFreq1, 0.0F);
    p = parseWith({"-apf", "Z", "S"});
    EXPECT_EQ(p.out, "ERROR - Z is an invalid frequency - Disabling Additional Filtering\r\n");
    p = parseWith({"-apf", "Q", "S"});
    EXPECT_EQ(p.out,
              "ERROR - Q is an invalid frequency weighting - Using default\r\n"
              "ERROR - Q is an invalid frequency - Disabling Additional Filtering\r\n");
    p = parse({"-s", session(), "-apf", "-d", out()});
    EXPECT_EQ(p.out, "ERROR - -d is an invalid frequency - Disabling Additional Filtering\r\n");
    EXPECT_EQ(p.ok, 1);  // the -d is still handled
    p = parseWith({"-bpf", "100"});
    EXPECT_EQ(p.out, "ERROR -  is an invalid frequency - Disabling Additional Filtering\r\n");
}

TEST_F(CommandLine, TriggeredHandlingAndFlags) {
    Parsed p = parseWith({"-trg", "c"});
    EXPECT_EQ(p.s.triggeredHandling, 1U);
    p = parseWith({"-trg", "C", "-trg", "split"});
    EXPECT_EQ(p.s.triggeredHandling, 0U);
    EXPECT_EQ(p.out, "");
    p = parseWith({"-trg", "C", "-trg", "x"});
    EXPECT_EQ(p.s.triggeredHandling, 0U);
    EXPECT_EQ(p.out,
              "ERROR - x is an invalid selection for triggered file handling - Using default\r\n");
    p = parse({"-s", session(), "-trg", "-d", out()});
    EXPECT_EQ(p.ok, 1);
    EXPECT_EQ(p.out,
              "ERROR - -d is an invalid selection for triggered file handling - Using default\r\n");

    p = parseWith({"-bin", "-csv", "-npn", "front"});
    EXPECT_EQ(p.s.binMode, 1U);
    EXPECT_EQ(p.s.rawLevelCsv, 1U);
    EXPECT_EQ(p.s.needWaveFiles, 1U);
    EXPECT_EQ(p.s.pipeName, "front");
    p = parseWith({"-npn"});
    EXPECT_EQ(p.ok, 1);
    EXPECT_EQ(p.s.pipeName, "");
}

TEST_F(CommandLine, ErrorsStopTheScanAtTheNextOption) {
    // After a refused output directory the following option fails the parse at once.
    Parsed p = parse({"-s", session(), "-d", dir_ / "x/y", "-d", out()});
    EXPECT_EQ(p.ok, 0);
    EXPECT_EQ(p.out, "ERROR - " + dir_ / "x/y" + " is an invalid output directory\r\n");
    // Values that do not begin with "-" are skipped without a message.
    p = parseWith({"stray", "words"});
    EXPECT_EQ(p.ok, 1);
    EXPECT_EQ(p.out, "");
}

}  // namespace
