// End-to-end: the whole tool on generated sessions, checking the result files.
#include <gtest/gtest.h>

#include <unistd.h>

#include <cmath>
#include <filesystem>
#include <iomanip>
#include <sstream>

#include "support/result_csv.h"
#include "support/session_builder.h"
#include "support/test_support.h"

namespace {

using namespace testing_support;

std::vector<std::vector<std::string>> rows(const std::string& path) { return resultRows(path); }

// Rows for the 100 ms slots [first, last] of an hour, every level set to `level(slot)`.
std::vector<LevelRow> levelRows(std::size_t first, std::size_t last,
                                const std::function<float(std::size_t)>& level) {
    return makeRows(last - first + 1, first, [&](std::size_t slot, LevelRow& r) {
        r.splA = r.splC = r.leqA = r.leqC = level(slot);
    });
}

class SessionRun : public ::testing::Test {
protected:
    std::string out() const { return dir_ / "out"; }
    std::string sessions() const { return dir_ / "sessions"; }
    std::string addSession(const SessionLayout& layout, const std::string& dirName) {
        return writeSession(sessions() + "/" + dirName, layout);
    }
    RunResult run(const std::vector<std::string>& options) {
        std::vector<std::string> args{"-s", sessions(), "-d", out()};
        args.insert(args.end(), options.begin(), options.end());
        return runTool(args);
    }
    std::string result(const std::string& name) const { return out() + "/" + name; }

    TempDir dir_;
};

// Three minutes at a constant level: every statistic is that level. The first minute holds an
// overload and the interval's lowest battery reading (a reading of 0.0 is no reading); the
// second misses two records; the third is clean again.
TEST_F(SessionRun, ConstantLevelsGapsBatteryAndOverloadPerInterval) {
    SessionLayout layout = namedSession("Quiet");
    auto all = makeRows(1800, 1, [](std::size_t slot, LevelRow& r) {
        r.splA = r.splC = r.leqA = r.leqC = 55.3F;
        r.battery = slot == 300 ? 11.9F : (slot == 400 ? 0.0F : 12.4F);
        if (slot == 350) r.condition = 3;
    });
    all.erase(all.begin() + 700);
    all.erase(all.begin() + 800);
    layout.levelFiles[0].rows = all;
    addSession(layout, "Quiet");
    const RunResult r = run({"-i", "1"});
    ASSERT_EQ(r.status, 0) << r.output;
    EXPECT_NE(r.output.find("Found 1 Session(s)\r\n"), std::string::npos);
    EXPECT_NE(r.output.find("100.0 % Complete\r\n\r\n\r\nProcessed 1 out of 1 sessions\r\n"),
              std::string::npos)
        << r.output;

    const auto data = rows(result("Quiet.csv"));
    ASSERT_EQ(data.size(), 3U);  // 08:01, 08:02, 08:03; nothing for the partial last interval
    const std::vector<std::vector<std::string>> ends = {
        {"11.9", "1"}, {"12.4", "1", "Errors Found in Interval"}, {"12.4", "0"}};
    for (std::size_t i = 0; i < data.size(); ++i) {
        const auto& f = data[i];
        SCOPED_TRACE(i);
        ASSERT_EQ(f.size(), 14U + ends[i].size());
        EXPECT_EQ(f[0], "17/09/2020");
        EXPECT_EQ(f[1], "08:0" + std::to_string(i + 1));
        for (std::size_t k = 2; k <= 12; ++k) EXPECT_EQ(f[k], "55.3") << "column " << k;
        EXPECT_EQ(f[13], "21.5");  // temperature of the file header
        EXPECT_EQ(std::vector<std::string>(f.begin() + 14, f.end()), ends[i]);
    }
}

TEST_F(SessionRun, MixOfTwoLevelsGivesEnergyMeanAndPercentiles) {
    SessionLayout layout = namedSession("Mix");
    // One whole 1-minute interval (0:0.1 .. 1:0.0): a quarter of the records at 70 dB.
    layout.levelFiles[0].rows =
        levelRows(1, 600, [](std::size_t slot) { return slot % 4 == 0 ? 70.0F : 50.0F; });
    addSession(layout, "Mix");
    ASSERT_EQ(run({"-i", "1", "-p", "1", "10", "25", "26", "50", "90"}).status, 0);
    const auto data = rows(result("Mix.csv"));
    ASSERT_EQ(data.size(), 1U);
    const auto& f = data[0];
    const double leq = 10.0 * std::log10(0.25 * 1e7 + 0.75 * 1e5);
    EXPECT_EQ(f[2], (std::ostringstream() << std::fixed << std::setprecision(1) << leq).str());
    EXPECT_EQ(f[3], "70.0");   // Lmax
    EXPECT_EQ(f[4], "70.0");   // L1
    EXPECT_EQ(f[5], "70.0");   // L10
    EXPECT_EQ(f[6], "70.0");   // L25: reached by exactly a quarter of the records
    EXPECT_EQ(f[7], "50.0");   // L26
    EXPECT_EQ(f[8], "50.0");   // L50
    EXPECT_EQ(f[9], "50.0");   // L90
    EXPECT_EQ(f[10], "50.0");  // Lmin
    EXPECT_EQ(headerLines(result("Mix.csv"))[20],
              "\"Date\",\"Time\",\"Leq\",\"Lmax\",\"L1\",\"L10\",\"L25\",\"L26\",\"L50\",\"L90\","
              "\"Lmin\",\"Temp\",\"Battery\",\"Overload\"\r");
}

TEST_F(SessionRun, MissingHourFileIsABreakInTheSequence) {
    SessionLayout layout = namedSession("Hours");
    layout.levelFiles[0].header.hour = 8;
    layout.levelFiles[0].rows = levelRows(35401, 35999, [](std::size_t) { return 50.0F; });
    LevelFileLayout later;
    later.header = layout.levelFiles[0].header;
    later.header.hour = 10;  // hour 9 was not recorded
    later.rows = levelRows(0, 600, [](std::size_t) { return 50.0F; });
    layout.levelFiles.push_back(later);
    addSession(layout, "Hours");
    ASSERT_EQ(run({"-i", "1"}).status, 0);
    const auto data = rows(result("Hours.csv"));
    ASSERT_EQ(data.size(), 2U);
    EXPECT_EQ(data[0][1], "10:00");
    EXPECT_EQ(data[0].back(), "Errors Found in Interval");
    EXPECT_EQ(data[1][1], "10:01");
    EXPECT_EQ(data[1][15], "0");
}

TEST_F(SessionRun, CWeightingUsesTheCColumns) {
    SessionLayout layout = namedSession("Cw");
    layout.levelFiles[0].rows = makeRows(600, 1, [](std::size_t, LevelRow& r) {
        r.splA = 40.0F;
        r.leqA = 41.0F;
        r.splC = 60.0F;
        r.leqC = 61.0F;
    });
    addSession(layout, "Cw");
    ASSERT_EQ(run({"-i", "1", "-w", "C", "-leq", "30"}).status, 0);
    const auto data = rows(result("Cw.csv"));
    ASSERT_EQ(data.size(), 1U);
    EXPECT_EQ(data[0][2], "61.0");  // Leq from LEQ-C
    EXPECT_EQ(data[0][3], "60.0");  // Lmax from SPL-C
    EXPECT_EQ(headerLines(result("Cw.csv"))[5], "\"Frequency Weighting\",\"\",\"\",\"\",\"C\"\r");
    const auto leq = rows(result("Cw_LEQ.csv"));
    ASSERT_EQ(leq.size(), 2U);
    EXPECT_EQ(leq[0][2], "61.0");
}

TEST_F(SessionRun, ShortLeqRowsReachTheirSessionsFile) {
    SessionLayout layout = namedSession("Leq");
    // 0:0.1 .. 2:25.0: two whole minutes and 25 s; 10 s intervals with a level per interval.
    layout.levelFiles[0].rows = levelRows(
        1, 1450, [](std::size_t slot) { return 40.0F + static_cast<float>((slot - 1) / 100); });
    layout.levelFiles[0].rows[150].condition = 3;  // overload in the second 10 s interval
    addSession(layout, "Leq");
    ASSERT_EQ(run({"-i", "1", "-leq", "10"}).status, 0);
    const auto leq = rows(result("Leq_LEQ.csv"));
    // 12 intervals closed by the two statistics boundaries, then the two complete ones
    // (2:10, 2:20) at the end of the session; the unfinished 2:20-2:25 is dropped.
    ASSERT_EQ(leq.size(), 14U);
    EXPECT_EQ(leq[0][1], "'08:00:10.0");
    EXPECT_EQ(leq[13][1], "'08:02:20.0");
    EXPECT_EQ(leq[0][2], "40.0");
    EXPECT_EQ(leq[1][3], "1");
    EXPECT_EQ(leq[2][3], "0");
    EXPECT_EQ(leq[13][2], "53.0");
    const auto lines = headerLines(result("Leq_LEQ.csv"));
    EXPECT_EQ(lines[6], "\"Time Averaging\",\"\",\"\",\"\",\"125 ms\"\r");
    EXPECT_EQ(lines[11], "\"Short Term Leq Length\",\"\",\"\",\"\",\"10 sec\"\r");
    EXPECT_EQ(lines[20], "\"Date\",\"Time\",\"AP Leq\",\"Overload\"\r");
}

TEST_F(SessionRun, TwoSessionsInOneRunGiveTheFilesOfTwoSeparateRuns) {
    SessionLayout a = namedSession("Alpha");
    auto rowsA =
        levelRows(1, 1250, [](std::size_t slot) { return 50.0F + static_cast<float>(slot % 7); });
    rowsA.erase(rowsA.begin() + 1240);  // a gap near the end of the first session
    rowsA[1245].battery = 11.0F;
    a.levelFiles[0].rows = rowsA;
    SessionLayout b = namedSession("Beta");
    b.levelFiles[0].rows = levelRows(
        3001, 4800, [](std::size_t slot) { return 45.0F + static_cast<float>(slot % 3); });
    addSession(a, "Alpha");
    addSession(b, "Beta");
    ASSERT_EQ(run({"-i", "1", "-leq", "4"}).status, 0);
    const std::string together = readFile(result("Beta.csv"));
    const std::string togetherLeq = readFile(result("Beta_LEQ.csv"));

    TempDir alone;
    writeSession(alone / "sessions/Beta", b);
    ASSERT_EQ(
        runTool({"-s", alone / "sessions", "-d", alone / "out", "-i", "1", "-leq", "4"}).status, 0);
    EXPECT_EQ(readFile(alone / "out/Beta.csv"), together);
    EXPECT_EQ(readFile(alone / "out/Beta_LEQ.csv"), togetherLeq);
    EXPECT_EQ(rows(result("Beta.csv"))[0].size(), 16U);  // no gap mark carried over
}

// Three hourly files: progress by share of the files, or (-bin) by file name; the header
// block carries the values of the information file and of the level files' header.
TEST_F(SessionRun, ProgressLinesInBothLayoutsAndTheHeaderBlock) {
    SessionLayout layout = namedSession("Prog");
    layout.info.sessionStart = "01/03/2020 09:05:07";
    layout.info.sessionEnd = "01/03/2020 11:00:00";
    layout.info.timeWeighting = "1";  // Slow
    layout.levelFiles.clear();
    for (unsigned h = 8; h <= 10; ++h) {
        LevelFileLayout f;
        f.header.hour = h;
        f.header.serialNumber = "SN123456789";
        f.header.sessionTitle = std::string(90, 'T');
        f.rows = makeRows(5);
        layout.levelFiles.push_back(f);
    }
    addSession(layout, "Prog");
    RunResult r = run({});
    EXPECT_NE(r.output.find("33.3 % Complete\r\n66.7 % Complete\r\n100.0 % Complete\r\n\r\n"),
              std::string::npos)
        << r.output;
    r = run({"-i", "60", "-bin"});
    EXPECT_NE(
        r.output.find("data.000/20200917_08.csv Complete\r\ndata.000/20200917_09.csv Complete\r\n"
                      "data.000/20200917_10.csv Complete\r\n\r\n"),
        std::string::npos)
        << r.output;
    // Sub-directory layout: the time weighting and the 60-minute interval spell the name.
    const auto lines = headerLines(result("Prog/GEN_A_60_S.csv"));
    ASSERT_EQ(lines.size(), 21U);
    EXPECT_EQ(lines[1], "\"Logger Serial Number\",\"\",\"\",\"\",\"SN12345\"\r");
    EXPECT_EQ(lines[2], "\"Measurement Title\",\"\",\"\",\"\",\"" + std::string(81, 'T') + "\"\r");
    EXPECT_EQ(lines[3], "\"Measurement started at\",\"\",\"\",\"\",\"01/03/2020 - 09:05:07\"\r");
    EXPECT_EQ(lines[4], "\"Measurement stopped at\",\"\",\"\",\"\",\"01/03/2020 - 11:00:00\"\r");
    EXPECT_EQ(lines[6], "\"Time Averaging\",\"\",\"\",\"\",\"Slow\"\r");
    EXPECT_EQ(lines[7], "\"Statistical Interval\",\"\",\"\",\"\",\"60 min\"\r");
}

// A session whose general file cannot be created is skipped and its results count as lost; a
// session without readable records leaves a general file of the header only.
TEST_F(SessionRun, SessionsWithoutResultsCostOnlyThemselves) {
    addSession(namedSession("First"), "First");
    addSession(namedSession("Second"), "Second");
    SessionLayout empty = namedSession("Empty");
    empty.levelFiles[0].rows.clear();
    addSession(empty, "Empty");
    makeDirs(out() + "/First.csv");  // a directory where the file should go
    const RunResult r = run({});
    EXPECT_EQ(r.status, 2);
    EXPECT_NE(r.output.find("Unable to open " + out() + "/First.csv : 21\r\n"), std::string::npos)
        << r.output;
    EXPECT_NE(r.output.find("Processed 3 out of 3 sessions"), std::string::npos);
    EXPECT_TRUE(exists(result("Second.csv")));
    EXPECT_EQ(rows(result("Empty.csv")).size(), 0U);
    EXPECT_EQ(headerLines(result("Empty.csv")).size(), 21U);
}

TEST_F(SessionRun, RelativePathsKeepWorkingForEverySession) {
    addSession(namedSession("One"), "One");
    writeSession(dir_ / "other/Two", namedSession("Two"));
    CurrentDirGuard restore;
    ASSERT_EQ(::chdir(dir_.path().c_str()), 0);
    const RunResult r = runTool({"-s", "sessions", "other/Two", "-d", "out"});
    EXPECT_EQ(r.status, 0);
    EXPECT_NE(r.output.find("Finding Sessions...\r\nMSG: Added - \"One\".\r\nMSG: Added - "
                            "\"other/Two\".\r\nFound 2 Session(s)\r\n"),
              std::string::npos)
        << r.output;
    EXPECT_NE(r.output.find("Processed 2 out of 2 sessions"), std::string::npos);
    EXPECT_TRUE(exists(result("One.csv")));
    EXPECT_TRUE(exists(result("Two.csv")));
    EXPECT_EQ(rows(result("Two.csv")).size(), 1U);
    char cwd[4096];
    ASSERT_NE(::getcwd(cwd, sizeof cwd), nullptr);
    EXPECT_EQ(std::string(cwd), std::filesystem::canonical(dir_.path()).string());
}

}  // namespace
