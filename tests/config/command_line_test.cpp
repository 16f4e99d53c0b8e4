#include "config/command_line.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <chrono>
#include <sstream>

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
    p.ok = orv::parseCommandLine(static_cast<int>(argv.size()), argv.data(), p.s, p.paths, console);
    return p;
}

// The settings that differ from the start-up defaults, as "name=value" words (the output
// directory aside).
std::string changes(const orv::ProcessingSettings& s) {
    const orv::ProcessingSettings d = parse({}).s;
    std::ostringstream o;
    const auto add = [&](const char* name, const auto& value, const auto& base) {
        if (value != base) o << name << "=" << value << " ";
    };
    add("i", s.statsIntervalMin, d.statsIntervalMin);
    add("leq", s.leqInterval, d.leqInterval);
    add("w", s.generalWeighting, d.generalWeighting);
    add("oct", s.octaveBandCount, d.octaveBandCount);
    add("ofw", s.octaveFreqWeighting, d.octaveFreqWeighting);
    add("otw", s.octaveTimeWeighting, d.octaveTimeWeighting);
    add("aux", s.auxFilterType, d.auxFilterType);
    add("f1", s.auxFreq1, d.auxFreq1);
    add("f2", s.auxFreq2, d.auxFreq2);
    add("b1", s.auxBand1, d.auxBand1);
    add("b2", s.auxBand2, d.auxBand2);
    add("afw", s.auxFreqWeighting, d.auxFreqWeighting);
    add("atw", s.auxTimeWeighting, d.auxTimeWeighting);
    add("trg", s.triggeredHandling, d.triggeredHandling);
    add("bin", s.binMode, d.binMode);
    add("csv", s.rawLevelCsv, d.rawLevelCsv);
    add("wave", s.needWaveFiles, d.needWaveFiles);
    add("r", s.recursiveSearch, d.recursiveSearch);
    add("pipe", s.pipeName, d.pipeName);
    if (s.percentiles != d.percentiles) {
        o << "p=";
        for (std::size_t i = 0; i < s.percentiles.size(); ++i)
            o << s.percentiles[i] << (i + 1 < s.percentiles.size() ? "," : " ");
    }
    return o.str();
}

class CommandLine : public ::testing::Test {
protected:
    std::string session() const { return dir_ / "sessions"; }
    std::string out() const { return dir_ / "out"; }

    TempDir dir_;
};

TEST_F(CommandLine, MinimalLineIsAcceptedAndOutputDirectoryResolved) {
    testing_support::makeDirs(session());
    Parsed p = parse({"-s", session(), "-d", out()});
    EXPECT_EQ(p.ok, 1);
    EXPECT_EQ(p.out, "");
    EXPECT_EQ(changes(p.s), "");
    EXPECT_EQ(p.paths.paths, std::vector<std::string>{session()});
    EXPECT_TRUE(testing_support::exists(out()));
    EXPECT_EQ(p.s.outputDirValid, 1U);
    std::string canonical;
    ASSERT_TRUE(platform::canonicalDirectory(out(), canonical));
    EXPECT_EQ(p.s.outputDir, canonical + "/");
    // Too long for the result paths.
    std::string deep = dir_.path();
    while (deep.size() < 270) deep += "/dddddddddddddddddddd";
    EXPECT_EQ(parse({"-s", session(), "-d", deep}).ok, 0);
    EXPECT_EQ(parse({"-s", session(), "-d", dir_ / "no/such/parent"}).s.outputDirValid, 0U);
}

// Each line: what the parser prints, which settings it changes and whether the line is
// accepted. "$s" and "$d" stand for a session and an output directory, "$t/" for the
// temporary directory; a line without "$s" or "$d" is "-s $s -d $d" followed by the options.
TEST_F(CommandLine, OptionsTheirMessagesAndTheSettingsTheyChange) {
    struct Case {
        std::vector<std::string> args;
        std::string out, changed;
        int ok = 1;
    };
    const std::string badPercentiles = "ERROR - Unable to set percentiles - Using defaults\r\n";
    const std::string badFrequency =
        " is an invalid frequency - Disabling Additional Filtering\r\n";
    const std::string badTrg =
        " is an invalid selection for triggered file handling - Using default\r\n";
    testing_support::writeFile(dir_ / "afile", "x");
    const Case cases[] = {
        // Structure: too few arguments, no output directory, no search path, unknown options.
        {{"-s", "$s", "-d"}, "", "", 0},
        {{"-s", "$s", "b", "c"}, "", "", 0},
        {{"-d", "$d", "x", "y"}, "", "", 0},
        {{"-h"}, "", "", 0},
        {{"-leqq"}, "", "", 0},
        {{"-"}, "", "", 0},
        {{"-zzz"}, "", "", 0},
        // Upper-case words, and four-letter words that begin with a two-letter name.
        {{"-S", "$s", "-D", "$d", "-R"}, "", "r=1 "},
        {{"-sab", "$s", "-Dxy", "$d", "-Iab", "30"},
         "Using 30min statistics interval length\r\n",
         "i=30 "},
        // Values that do not begin with "-" are skipped without a message.
        {{"stray", "words"}, "", ""},
        // Percentiles: sorted; a bad value keeps the defaults; a later -p replaces an earlier.
        {{"-p", "90", "10", "50"}, "Configured 3 percentiles\r\n", "p=10,50,90 "},
        {{"-p", "10", "abc"}, badPercentiles, ""},
        {{"-p", "12abc", "33.3"}, "Configured 2 percentiles\r\n", "p=12,33.3 "},
        {{"-p", "5", "nan"}, badPercentiles, ""},
        {{"-p", "5", "inf"}, badPercentiles, ""},
        {{"-p", "5", "1e99"}, badPercentiles, ""},
        {{"-p", "-r"}, badPercentiles, "r=1 "},
        {{"-p"}, badPercentiles, ""},
        {{"-p", "5", "-p", "7", "3"},
         "Configured 1 percentiles\r\nConfigured 2 percentiles\r\n",
         "p=3,7 "},
        // Statistics interval; -i takes the next argument whatever it is.
        {{"-i", "60"}, "Using 0min statistics interval length\r\n", "i=0 "},
        {{"-i", "7"}, "ERROR - 7 is an invalid interval - Using default\r\n", ""},
        {{"-i", "x"}, "ERROR - x is an invalid interval - Using default\r\n", ""},
        {{"-i", "10min"}, "Using 10min statistics interval length\r\n", "i=10 "},
        {{"-i", "-5"}, "ERROR - -5 is an invalid interval - Using default\r\n", ""},
        {{"-i"}, "ERROR -  is an invalid interval - Using default\r\n", ""},
        {{"-s", "$s", "-i", "-d", "$d"},
         "ERROR - -d is an invalid interval - Using default\r\n",
         "",
         0},
        // Leq interval.
        {{"-leq", "60"}, "Using 0min Leq interval length\r\n", "leq=0 "},
        {{"-LEQ", "4"}, "Using 4min Leq interval length\r\n", "leq=4 "},
        {{"-leq", "3"}, "ERROR - 3 is an invalid Leq interval - Using default\r\n", ""},
        {{"-leq", "x"}, "ERROR - x is an invalid Leq interval - Using default\r\n", ""},
        {{"-leq"}, "ERROR -  is an invalid Leq interval - Using default\r\n", ""},
        // General weighting: an invalid later -w goes back to the default.
        {{"-w", "c"}, "", "w=2 "},
        {{"-w", "C", "-w", "Z"},
         "ERROR - Z is an invalid frequency weighting - Using default\r\n",
         ""},
        {{"-w"}, "ERROR -  is an invalid frequency weighting - Using default\r\n", ""},
        // Output directory.
        {{"-d", "$t/other"}, "ERROR - Multiple output directories given.\r\n", "", 0},
        {{"-s", "$s", "-d", "$t/no/such/parent"},
         "ERROR - $t/no/such/parent is an invalid output directory\r\n",
         "",
         0},
        {{"-s", "$s", "-d", "$t/afile"},
         "ERROR - $t/afile is an invalid output directory\r\n",
         "",
         0},
        {{"-s", "$s", "-r", "-d"}, "ERROR -  is an invalid output directory\r\n", "r=1 ", 0},
        // After a refused output directory the following option fails the parse at once.
        {{"-s", "$s", "-d", "$t/x/y", "-d", "$d"},
         "ERROR - $t/x/y is an invalid output directory\r\n",
         "",
         0},
        // Octave bank; an option word where a letter belongs ends the option silently.
        {{"-oct", "3", "Z", "S"},
         "Enabled octave filter bank\r\nUsing Slow time weighting\r\nUsing Z frequency "
         "weighting\r\n",
         "oct=36 ofw=0 otw=3 wave=1 "},
        {{"-oct", "1", "c", "n"},
         "Enabled octave filter bank\r\nUsing None time weighting\r\nUsing C frequency "
         "weighting\r\n",
         "oct=12 ofw=2 otw=0 wave=1 "},
        {{"-oct", "2", "A", "F"},
         "ERROR - 2 is an invalid octave type - Disabling Octaves\r\n",
         ""},
        {{"-s", "$s", "-oct", "3", "-d", "$d"}, "", ""},
        {{"-oct", "3", "Q", "F"},
         "ERROR - Q is an invalid frequency weighting - Using default\r\n",
         ""},
        {{"-oct", "3", "A", "X"}, "ERROR - X is an invalid time weighting - Using default\r\n", ""},
        {{"-oct"}, "ERROR -  is an invalid octave type - Disabling Octaves\r\n", ""},
        {{"-oct", "3", "A"}, "", ""},
        {{"-oct", "1", "A", "F", "-oct", "3", "A"},
         "Enabled octave filter bank\r\nUsing Fast time weighting\r\nUsing A frequency "
         "weighting\r\n",
         "oct=12 wave=1 "},
        // Filtered channel: corners at the band edges of the accepted frequencies.
        {{"-lpf", "1000", "A", "F"},
         "Enabled aux filter bank\r\n",
         "aux=1 f1=1122.02 b1=16 afw=1 atw=2 wave=1 "},
        {{"-hpf", "1000", "A", "F"},
         "Enabled aux filter bank\r\n",
         "aux=2 f1=891.251 b1=16 afw=1 atw=2 wave=1 "},
        {{"-bpf", "100", "1000", "C", "S"},
         "Enabled aux filter bank\r\n",
         "aux=3 f1=89.1251 f2=1122.02 b1=6 b2=16 afw=2 atw=3 wave=1 "},
        {{"-bsf", "25", "20000", "A", "N"},
         "Enabled aux filter bank\r\n",
         "aux=4 f1=22.3872 f2=22387.2 b2=29 afw=1 wave=1 "},
        {{"-bpf", "316", "3160", "A", "F"},
         "Enabled aux filter bank\r\n",
         "aux=3 f1=281.838 f2=3548.13 b1=11 b2=21 afw=1 atw=2 wave=1 "},
        {{"-lpf", "315", "A", "F"}, "ERROR - 315" + badFrequency, ""},
        {{"-lpf", "0", "A", "F"}, "ERROR - 0" + badFrequency, ""},
        {{"-lpf", "x", "A", "F"}, "ERROR - x" + badFrequency, ""},
        {{"-lpf", "1000", "Z", "F"}, "", ""},
        // The last valid filter option is in force; an invalid later one changes nothing.
        {{"-lpf", "1000", "A", "F", "-hpf", "2000", "C", "S"},
         "Enabled aux filter bank\r\nEnabled aux filter bank\r\n",
         "aux=2 f1=1778.28 b1=19 afw=2 atw=3 wave=1 "},
        {{"-lpf", "1000", "A", "F", "-hpf", "999", "C", "S"},
         "Enabled aux filter bank\r\nERROR - 999" + badFrequency,
         "aux=1 f1=1122.02 b1=16 afw=1 atw=2 wave=1 "},
        {{"-apf", "C", "S"}, "Enabled aux filter bank\r\n", "aux=6 afw=2 atw=3 wave=1 "},
        {{"-apf", "Z", "S"}, "ERROR - Z" + badFrequency, ""},
        {{"-apf", "Q", "S"},
         "ERROR - Q is an invalid frequency weighting - Using default\r\nERROR - Q" + badFrequency,
         ""},
        {{"-s", "$s", "-apf", "-d", "$d"}, "ERROR - -d" + badFrequency, ""},  // -d still handled
        {{"-bpf", "100"}, "ERROR - " + badFrequency, ""},
        // Triggered sessions, sub-directory layout, raw levels and the progress pipe.
        {{"-trg", "c"}, "", "trg=1 "},
        {{"-trg", "C", "-trg", "split"}, "", ""},
        {{"-trg", "C", "-trg", "x"}, "ERROR - x" + badTrg, ""},
        {{"-s", "$s", "-trg", "-d", "$d"}, "ERROR - -d" + badTrg, ""},
        {{"-bin", "-csv", "-npn", "front"}, "", "bin=1 csv=1 wave=1 pipe=front "},
        {{"-npn"}, "", ""},
    };
    const auto expand = [&](std::string text) {
        for (const auto& [from, to] : {std::pair<std::string, std::string>{"$s", session()},
                                       {"$d", out()},
                                       {"$t", dir_.path()}}) {
            for (std::size_t at; (at = text.find(from)) != std::string::npos;)
                text.replace(at, from.size(), to);
        }
        return text;
    };
    for (const Case& c : cases) {
        std::vector<std::string> args;
        if (std::ranges::find_if(c.args, [](const std::string& a) {
                return a == "$s" || a == "$d";
            }) == c.args.end())
            args = {"-s", session(), "-d", out()};
        for (const std::string& a : c.args) args.push_back(expand(a));
        std::string line;
        for (const std::string& a : c.args) line += a + " ";
        SCOPED_TRACE(line);
        const Parsed p = parse(args);
        EXPECT_EQ(p.out, expand(c.out));
        EXPECT_EQ(changes(p.s), c.changed);
        EXPECT_EQ(p.ok, c.ok);
    }
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

}  // namespace
