// Reading orv_cmd's output: the kind of each file from its content, rows of every layout with
// their time formats, bad lines named by number, and which files make up which session in the
// flat and the -bin layout (roll-over parts, band sets, hourly level files).
#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "generated_results.h"
#include "orv_report/result_files.h"
#include "orv_report/sessions.h"
#include "support/test_support.h"

namespace orv_report {
namespace {

using namespace report_test;
using testing_support::writeFile;

ResultFile read(const std::string& text, std::vector<Problem>& problems) {
    ResultFile f = classifyFile("f.csv", text, problems);
    readRows(f, text, problems);
    return f;
}

TEST(ResultFileReading, KindFromContent) {
    Header h;
    h.leqLength = "1 sec";
    const Row row{at(0, 12, 15)};
    struct Case {
        std::string what, text;
        FileKind kind;
        std::string label;
        std::size_t rows;
    };
    const std::vector<Case> cases = {
        {"general", statFile(StatKind::General, "", h, {row}), FileKind::General, "", 1},
        {"band", statFile(StatKind::Band, "1.25kHz", h, {row}), FileKind::Band, "1.25kHz", 1},
        {"filtered", statFile(StatKind::Filtered, "BPF", h, {row}), FileKind::Filtered, "BPF", 1},
        {"all-pass Leq", leqFile(h, {}, {{at(0, 12, 0, 1), {52.1}}}), FileKind::Leq, "", 1},
        {"octave Leq", leqFile(h, {"31.5Hz", "63Hz"}, {{at(0, 12, 0, 1), {40, 41}}}),
         FileKind::OctaveLeq, "", 1},
        {"raw levels", rawFile("Site", "TL40217", at(0, 12), {50, 51}), FileKind::RawLevels, "", 0},
        {"someone else's csv", "a,b,c\r\n1,2,3\r\n", FileKind::Unknown, "", 0},
    };
    for (const Case& c : cases) {
        SCOPED_TRACE(c.what);
        std::vector<Problem> problems;
        const ResultFile f = read(c.text, problems);
        EXPECT_TRUE(problems.empty()) << describe(problems.front());
        EXPECT_EQ(f.kind, c.kind);
        EXPECT_EQ(f.label, c.label);
        EXPECT_EQ(f.stats.size() + f.leq.ends.size(), c.rows);
        if (c.kind == FileKind::Unknown || c.kind == FileKind::RawLevels) continue;
        EXPECT_EQ(f.header.serial, "TL40217");
        EXPECT_EQ(f.header.startText, "05/03/2024 - 12:00:00");
        EXPECT_EQ(*f.header.end, at(0, 14));
        EXPECT_EQ(f.header.statsMinutes, 15U);
        EXPECT_EQ(f.header.leqSeconds, 1U);
    }
    // A title with commas and quotes is read whole.
    h.title = "Road \"A1\", north";
    std::vector<Problem> problems;
    EXPECT_EQ(read(statFile(StatKind::General, "", h, {}), problems).header.title, h.title);
    // A header cut short is a problem of the file, not a crash.
    const std::string cut = statFile(StatKind::General, "", h, {}).substr(0, 300);
    classifyFile("cut.csv", cut, problems);
    ASSERT_EQ(problems.size(), 1U);
    EXPECT_EQ(describe(problems[0]).rfind("cut.csv:", 0), 0U);
}

TEST(ResultFileReading, RowsTimesAndBadLines) {
    Header h;
    std::vector<Row> rows = {{at(0, 12, 15)}, {at(0, 12, 30)}, {at(0, 12, 45)}, {at(0, 13)}};
    rows[1].errors = true, rows[1].overload = 1;
    rows[2].lmax = 77.7;
    std::string text = statFile(StatKind::General, "", h, rows);
    // Line 22 is the first row: spoil line 24 and repeat a time on a new last line (27).
    const std::size_t l24 = text.find("\"05/03/2024\",\"12:45\"");
    text.replace(text.find("77.7", l24), 4, "7x.7");
    text +=
        "\"05/03/2024\",\"12:30\",\"50.0\",\"60.0\",\"59.0\",\"50.0\",\"45.0\",\"44.0\",\"12.5\","
        "\"12.6\",\"0\",\r\n";
    text += "\r\n";  // blank lines are not rows
    std::vector<Problem> problems;
    const ResultFile f = read(text, problems);
    ASSERT_EQ(f.stats.size(), 3U);
    EXPECT_EQ(f.stats[0].end, at(0, 12, 15));
    EXPECT_TRUE(f.stats[1].errors);
    EXPECT_EQ(f.stats[1].overload, 1U);
    EXPECT_FLOAT_EQ(f.stats[1].l90, 45.0f);
    EXPECT_EQ(f.stats[2].end, at(0, 13));
    ASSERT_EQ(problems.size(), 2U);
    EXPECT_EQ(problems[0].line, 24U);
    EXPECT_EQ(problems[1].line, 26U);
    EXPECT_NE(problems[1].message.find("not after"), std::string::npos);

    // Leq times carry an apostrophe and a tenth; octave rows may carry one level more than
    // they have band titles (the filtered channel's) before the overload field.
    h.leqLength = "1 sec";
    std::string oct = leqFile(h, {"8Hz", "16Hz"}, {});
    oct += "\"05/03/2024\",\"'12:00:01.0\",\"40.0\",\"41.0\",\"39.0\",\"1\",\r\n";
    oct +=
        "\"05/03/2024\",\"'12:00:02.0\",\"40.5\",\"41.5\",\"39.5\",\"0\",\"Errors Found in "
        "Interval\"\r\n";
    const ResultFile o = read(oct, problems);
    ASSERT_EQ(o.leq.ends.size(), 2U);
    EXPECT_EQ(o.leq.width, 2U);
    EXPECT_EQ(o.leq.levels, (std::vector<float>{40.0f, 41.0f, 40.5f, 41.5f}));
    EXPECT_EQ(o.leq.overload, (std::vector<std::uint8_t>{1, 0}));
    EXPECT_EQ(o.leq.errors, (std::vector<std::uint8_t>{0, 1}));
    EXPECT_EQ(o.leq.ends[1], at(0, 12, 0, 2));
}

TEST(ResultFileReading, HourlyLevelFile) {
    std::vector<Problem> problems;
    const ResultFile f = read(rawFile("Site", "TL40217", at(1, 23), {50, 60, 0}), problems);
    EXPECT_TRUE(problems.empty());
    EXPECT_EQ(f.raw.hourStart, at(1, 23));
    EXPECT_EQ(f.raw.records, 3U);
    EXPECT_EQ(f.raw.levelsA, 2U);  // 0.0 is "no level"
    EXPECT_NEAR(f.raw.energyA, 1e5 + 1e6, 1e-3);
}

TEST(SessionCatalogue, BothLayoutsPartsAndHourlyFiles) {
    testing_support::TempDir dir;
    Header h;  // 12:00-14:00
    h.leqLength = "1 sec";
    const std::vector<Row> rows = {{at(0, 12, 15)}};
    const auto leq = [&](Seconds from, Seconds to) {
        return leqFile(h, {}, leqRows(from, to, 1, [](Seconds) { return 50.0; }));
    };
    // Flat: session Alpha with roll-over parts written out of name order, bands, octave Leq,
    // filtered channel; session Beta (title B) shares the hour 13 with Alpha.
    writeFile(dir / "Alpha.csv", statFile(StatKind::General, "", h, rows));
    writeFile(dir / "Alpha_LEQ.csv", leq(at(0, 12), at(0, 12, 10)));
    writeFile(dir / "Alpha_LEQ_2.csv", leq(at(0, 12, 20), at(0, 12, 30)));
    writeFile(dir / "Alpha_LEQ_1.csv", leq(at(0, 12, 10), at(0, 12, 20)));
    writeFile(dir / "Alpha_LEQ3OCT.csv", leqFile(h, {"8Hz", "10Hz"}, {}));
    for (const char* b : {"1kHz", "10Hz", "8Hz"})
        writeFile(dir / (std::string("Alpha_") + b + ".csv"), statFile(StatKind::Band, b, h, rows));
    writeFile(dir / "Alpha_BPF.csv", statFile(StatKind::Filtered, "BPF", h, rows));
    Header hb = h;
    hb.title = "B", hb.start = at(0, 13, 30), hb.end = at(0, 13, 50);
    writeFile(dir / "Beta.csv", statFile(StatKind::General, "", hb, {}));
    writeFile(dir / "20240305_12.csv",
              rawFile("Site", "TL40217", at(0, 12), std::vector<double>(100, 50)));
    writeFile(dir / "20240305_13.csv",
              rawFile("Site", "TL40217", at(0, 13), std::vector<double>(100, 50)));
    writeFile(dir / "20240305_13_1.csv",
              rawFile("B", "TL40217", at(0, 13), std::vector<double>(100, 50)));
    writeFile(dir / "20240306_13.csv", rawFile("Site", "TL40217", at(1, 13), {50}));  // no session
    writeFile(dir / "notes.csv", "x,y\r\n");
    writeFile(dir / "Alpha_LEQ_X.csv", leq(at(0, 12), at(0, 12, 1)));  // not a name of ours
    // -bin: session Gamma written twice (A and C weighting): the A-weighted files are shown.
    Header hc = h;
    hc.weighting = "C";
    writeFile(dir / "Gamma/GEN_C_15_F.csv", statFile(StatKind::General, "", hc, rows));
    writeFile(dir / "Gamma/GEN_A_15_F.csv", statFile(StatKind::General, "", h, rows));
    writeFile(dir / "Gamma/LEQ_A_1_F.csv", leq(at(0, 12), at(0, 12, 1)));
    writeFile(dir / "Gamma/LEQ_A_1_F_1.csv", leq(at(0, 12, 1), at(0, 12, 2)));
    writeFile(dir / "Gamma/3OCT1kHz_A_15_F.csv", statFile(StatKind::Band, "1kHz", h, rows));
    writeFile(dir / "Gamma/20240305_12.csv", rawFile("Site", "TL40217", at(0, 12), {50}));
    writeFile(dir / "report/index.csv", statFile(StatKind::General, "", h, rows));  // skipped

    std::vector<Problem> problems;
    Catalogue cat = findSessions(dir.path(), dir / "report", problems);
    ASSERT_EQ(cat.sessions.size(), 3U);
    ASSERT_EQ(problems.size(), 1U);
    EXPECT_NE(problems[0].file.find("Alpha_LEQ_X.csv"), std::string::npos);
    ASSERT_EQ(cat.unusedFiles.size(), 1U);
    EXPECT_NE(cat.unusedFiles[0].find("20240306_13.csv"), std::string::npos);

    SessionFiles& a = cat.sessions[0];
    EXPECT_EQ(a.name, "Alpha");
    EXPECT_FALSE(a.binLayout);
    ASSERT_EQ(a.leq.size(), 3U);
    EXPECT_NE(a.leq[1].path.find("Alpha_LEQ_1.csv"), std::string::npos);
    EXPECT_EQ(a.octaveLeq.size(), 1U);
    ASSERT_EQ(a.bands.size(), 3U);
    EXPECT_EQ(a.bands[0].label + a.bands[1].label + a.bands[2].label, "8Hz10Hz1kHz");
    ASSERT_TRUE(a.filtered);
    ASSERT_EQ(a.raw.size(), 2U);  // hours 12 and 13 of title Site
    readSessionRows(a, problems);
    EXPECT_EQ(a.leq[0].leq.ends.size(), 1800U);  // the three parts in part order
    EXPECT_EQ(a.leq[0].leq.ends.back(), at(0, 12, 30));
    EXPECT_EQ(cat.sessions[1].name, "Beta");
    ASSERT_EQ(cat.sessions[1].raw.size(), 1U);
    EXPECT_NE(cat.sessions[1].raw[0].path.find("20240305_13_1.csv"), std::string::npos);

    const SessionFiles& g = cat.sessions[2];
    EXPECT_EQ(g.name, "Gamma");
    EXPECT_TRUE(g.binLayout);
    ASSERT_TRUE(g.general);
    EXPECT_EQ(g.general->header.frequencyWeighting, "A");
    ASSERT_EQ(g.unused.size(), 1U);
    EXPECT_NE(g.unused[0].find("GEN_C_15_F.csv"), std::string::npos);
    EXPECT_EQ(g.leq.size(), 2U);
    EXPECT_EQ(g.bands.size(), 1U);
    EXPECT_EQ(g.raw.size(), 1U);
    EXPECT_EQ(problems.size(), 1U);
}

}  // namespace
}  // namespace orv_report
