#include <gtest/gtest.h>

#include <sstream>
#include <thread>

#include "results/general_results.h"
#include "results/leq_results.h"
#include "results/result_files.h"
#include "results/result_header.h"
#include "support/test_support.h"

namespace {

using testing_support::readFile;
using testing_support::TempDir;

orv::ResultHeaderInfo sampleInfo() {
    orv::ResultHeaderInfo info;
    info.serialNumber = "4711";
    info.title = "Riverside";
    info.generalWeighting = 1;
    info.octaveFreqWeighting = 2;
    info.statsIntervalMin = 0;
    info.leqInterval = 0;
    info.timeWeightingMs = 125;
    info.octaveTimeWeighting = 3;
    info.sessionStart = {2020, 3, 0, 1, 9, 5, 7, 0};
    info.sessionEnd = {2020, 3, 0, 2, 10, 0, 0, 0};
    info.percentiles = {1, 5, 10, 25, 50, 75, 90, 99};
    return info;
}

const char* const kGeneralHeader =
    "\"Quellmark -  Type 1 Environmental Noise Logger\"\r\n"
    "\"Logger Serial Number\",\"\",\"\",\"\",\"4711\"\r\n"
    "\"Measurement Title\",\"\",\"\",\"\",\"Riverside\"\r\n"
    "\"Measurement started at\",\"\",\"\",\"\",\"01/03/2020 - 09:05:07\"\r\n"
    "\"Measurement stopped at\",\"\",\"\",\"\",\"02/03/2020 - 10:00:00\"\r\n"
    "\"Frequency Weighting\",\"\",\"\",\"\",\"A\"\r\n"
    "\"Time Averaging\",\"\",\"\",\"\",\"Fast\"\r\n"
    "\"Statistical Interval\",\"\",\"\",\"\",\"60 min\"\r\n"
    "\"Auxiliary Power\",\"\",\"\",\"\",\"Not Applicable\"\r\n"
    "\"Tape Recorder\",\"\",\"\",\"\",\"Not Applicable\"\r\n"
    "\"Short Term Leq\",\"\",\"\",\"\",\"Not Applicable\"\r\n"
    "\"Short Term Leq Length\",\"\",\"\",\"\",\"Not Applicable\"\r\n"
    "\"Start Trigger\",\"\",\"\",\"\",\"Not Applicable\"\r\n"
    "\"Stop Trigger\",\"\",\"\",\"\",\"Not Applicable\"\r\n"
    "\"Master Timer\",\"\",\"\",\"\",\"Not Applicable\"\r\n"
    "\"Sub Timer\",\"\",\"\",\"\",\"Not Applicable\"\r\n"
    "\"Pre-measurement Reference\",\"\",\"\",\"\",\"Not Applicable\"\r\n"
    "\"Post-measurement Reference\",\"\",\"\",\"\",\"Not Applicable\"\r\n"
    "\"Engineering Units\",\"\",\"\",\"\",\"dB SPL\"\r\n"
    "\r\n";

// A temporary output directory and the run's record of lost results, with its console.
class Writers : public ::testing::Test {
protected:
    TempDir dir;
    std::string console;
    platform::Console out{&console};
    orv::RunResults run{out};
};

TEST_F(Writers, GeneralHeaderBlockAndColumnLine) {
    orv::GeneralResultsWriter writer(run);
    ASSERT_TRUE(writer.open(dir / "S1.csv"));
    ASSERT_TRUE(writer.writeHeader(sampleInfo(), 2));
    writer.close();
    EXPECT_EQ(
        readFile(dir / "S1.csv"),
        std::string(kGeneralHeader) +
            "\"Date\",\"Time\",\"Leq\",\"Lmax\",\"L1\",\"L5\",\"L10\",\"L25\",\"L50\",\"L75\","
            "\"L90\",\"L99\",\"Lmin\",\"Temp\",\"Battery\",\"Overload\"\r\n");
    EXPECT_EQ(console, "");
    EXPECT_EQ(orv::percentileLabels({33.3F, 66.7F, 0.5F}), "\"L33\",\"L66\",\"L0\",");
    EXPECT_FALSE(orv::GeneralResultsWriter(run).writeHeader(sampleInfo(), 2));  // not open
}

TEST_F(Writers, GeneralRows) {
    orv::GeneralIntervalRecord r;
    r.day = 5;
    r.month = 5;
    r.year = 2020;
    r.hour = 14;
    r.minute = 30;
    r.second = 0;
    r.leq = 54.26F;
    r.lmax = 71.04F;
    r.lmin = 40.0F;
    r.temperature = 21.5F;
    r.battery = 12.6F;
    r.percentileValues = {60.0F, 50.0F};
    EXPECT_EQ(orv::GeneralResultsWriter::formatRow(r),
              "\"05/05/2020\",\"14:30\",\"54.3\",\"71.0\",\"60.0\",\"50.0\",\"40.0\",\"21.5\","
              "\"12.6\",\"0\",\r\n");
    r.gapFlag = 1;
    r.overload = 1;
    EXPECT_EQ(orv::GeneralResultsWriter::formatRow(r),
              "\"05/05/2020\",\"14:30\",\"54.3\",\"71.0\",\"60.0\",\"50.0\",\"40.0\",\"21.5\","
              "\"12.6\",\"1\",\"Errors Found in Interval\"\r\n");
    // A long percentile list is written in full.
    r.percentileValues.assign(100, 99.9F);
    const std::string row = orv::GeneralResultsWriter::formatRow(r);
    EXPECT_EQ(std::count(row.begin(), row.end(), ','), 4 + 100 + 4);
    EXPECT_NE(row.find("\"Errors Found in Interval\"\r\n"), std::string::npos);

    EXPECT_TRUE(orv::GeneralResultsWriter(run).writeRow(r));  // closed: nothing, but no failure
}

const char* const kLeqAllPassLine7 = "\"Time Averaging\",\"\",\"\",\"\",\"125 ms\"\r\n";
const char* const kLeqLine12 = "\"Short Term Leq Length\",\"\",\"\",\"\",\"60 sec\"\r\n";

// Replaces the whole line that begins with `key` (line end included).
void replaceLine(std::string& text, const std::string& key, const std::string& line) {
    const auto at = text.find(key);
    ASSERT_NE(at, std::string::npos);
    text.replace(at, text.find("\r\n", at) + 2 - at, line);
}

// Both Leq files: their header blocks and column lines, and rows sent to the file their level
// count selects.
TEST_F(Writers, LeqHeadersAndRows) {
    orv::LeqRow row;
    row.time = {2021, 1, 0, 2, 12, 0, 5, 0};
    row.levels = {54.26F};
    row.errorsInInterval = 1;
    row.overload = 3;
    EXPECT_EQ(orv::LeqResultsWriter::formatRow(row),
              "\"02/01/2021\",\"'12:00:05.0\",\"54.3\",\"3\",\"Errors Found in Interval\"\r\n");
    row.errorsInInterval = 0;

    orv::LeqResultsWriter writer(run);
    ASSERT_TRUE(writer.open(orv::LeqFileKind::AllPass, dir / "S1_LEQ.csv"));
    ASSERT_TRUE(writer.open(orv::LeqFileKind::Octave, dir / "S1_LEQ1OCT.csv"));
    ASSERT_TRUE(writer.formatHeader(orv::LeqFileKind::AllPass, sampleInfo(), 1));
    ASSERT_TRUE(writer.writeColumnHeader(orv::LeqFileKind::AllPass));
    ASSERT_TRUE(writer.formatHeader(orv::LeqFileKind::Octave, sampleInfo(), 12));
    ASSERT_TRUE(writer.writeColumnHeader(orv::LeqFileKind::Octave));
    EXPECT_EQ(writer.lineCount(orv::LeqFileKind::AllPass), 21U);
    EXPECT_TRUE(writer.writeRow(row));
    row.levels.assign(12, 40.0F);
    EXPECT_TRUE(writer.writeRow(row));
    row.levels.clear();
    EXPECT_FALSE(writer.writeRow(row));  // no levels: written nowhere
    writer.close(orv::LeqFileKind::AllPass);
    writer.close(orv::LeqFileKind::Octave);

    std::string expected = kGeneralHeader;
    replaceLine(expected, "\"Time Averaging", kLeqAllPassLine7);
    replaceLine(expected, "\"Short Term Leq Length", kLeqLine12);
    EXPECT_EQ(readFile(dir / "S1_LEQ.csv"),
              expected + "\"Date\",\"Time\",\"AP Leq\",\"Overload\"\r\n" +
                  "\"02/01/2021\",\"'12:00:05.0\",\"54.3\",\"3\",\r\n");

    const std::string octave = readFile(dir / "S1_LEQ1OCT.csv");
    EXPECT_NE(octave.find("\"Frequency Weighting\",\"\",\"\",\"\",\"C\"\r\n"), std::string::npos);
    EXPECT_NE(octave.find("\"Time Averaging\",\"\",\"\",\"\",\"Slow\"\r\n"), std::string::npos);
    EXPECT_NE(
        octave.find("\r\n\r\n\"Date\",\"Time\",\"8Hz\",\"16Hz\",\"31.5Hz\",\"63Hz\",\"125Hz\","
                    "\"250Hz\",\"500Hz\",\"1kHz\",\"2kHz\",\"4kHz\",\"8kHz\",\"16kHz\","
                    "\"Overload\"\r\n\"02/01/2021\",\"'12:00:05.0\",\"40.0\","),
        std::string::npos);
    EXPECT_EQ(std::count(octave.begin(), octave.end(), '\n'), 22);
}

TEST_F(Writers, LeqRollsOverIntoNumberedPartsWithTheSameHeader) {
    orv::LeqResultsWriter writer(run, 25);  // parts of 25 lines: 21 header lines + 4 rows
    ASSERT_TRUE(writer.open(orv::LeqFileKind::AllPass, dir / "S1_LEQ.csv"));
    ASSERT_TRUE(writer.formatHeader(orv::LeqFileKind::AllPass, sampleInfo(), 1));
    ASSERT_TRUE(writer.writeColumnHeader(orv::LeqFileKind::AllPass));
    orv::LeqRow row;
    row.time = {2021, 1, 0, 2, 12, 0, 0, 0};
    row.levels = {50.0F};
    for (unsigned i = 0; i < 9; ++i) {
        row.time.second = static_cast<std::uint16_t>(i);
        ASSERT_TRUE(writer.writeRow(row));
    }
    writer.close(orv::LeqFileKind::AllPass);
    EXPECT_EQ(testing_support::listNames(dir.path()),
              (std::vector<std::string>{"S1_LEQ.csv", "S1_LEQ_1.csv", "S1_LEQ_2.csv"}));
    const std::string first = readFile(dir / "S1_LEQ.csv");
    const std::string second = readFile(dir / "S1_LEQ_1.csv");
    const std::string third = readFile(dir / "S1_LEQ_2.csv");
    EXPECT_EQ(std::count(first.begin(), first.end(), '\n'), 25);
    EXPECT_EQ(std::count(second.begin(), second.end(), '\n'), 25);
    EXPECT_EQ(std::count(third.begin(), third.end(), '\n'), 22);
    const std::string header = first.substr(0, first.find("\"02/01/2021\""));
    EXPECT_EQ(second.substr(0, header.size()), header);
    EXPECT_NE(second.find("'12:00:04.0"), std::string::npos);
    EXPECT_NE(third.find("'12:00:08.0"), std::string::npos);
    EXPECT_EQ(console, "");
    EXPECT_EQ(orv::ResultNaming::leqPart("/o/S1_LEQ3OCT.csv", 12), "/o/S1_LEQ3OCT_12.csv");
}

TEST_F(Writers, LeqConcurrentWritersNeverInterleaveLinesOrLoseRows) {
    orv::LeqResultsWriter writer(run, 121);  // 100 rows per part
    orv::ResultHeaderInfo info = sampleInfo();
    for (auto kind : {orv::LeqFileKind::AllPass, orv::LeqFileKind::Octave}) {
        ASSERT_TRUE(
            writer.open(kind, dir / (kind == orv::LeqFileKind::AllPass ? "a.csv" : "o.csv")));
        ASSERT_TRUE(writer.formatHeader(kind, info, 12));
        ASSERT_TRUE(writer.writeColumnHeader(kind));
    }
    auto produce = [&](std::size_t levels, int count) {
        for (int i = 0; i < count; i += 5) {
            std::vector<orv::LeqRow> batch(5);
            for (auto& row : batch) {
                row.time = {2021, 1, 0, 2, 12, 0, 0, 0};
                row.levels.assign(levels, 42.0F);
            }
            ASSERT_TRUE(writer.writeRows(batch));
        }
    };
    std::thread octave(produce, 12, 450);
    produce(1, 450);
    octave.join();
    writer.close(orv::LeqFileKind::AllPass);
    writer.close(orv::LeqFileKind::Octave);
    for (const char* base : {"a", "o"}) {
        std::size_t rowsSeen = 0;
        for (int part = 0; part < 5; ++part) {
            const std::string name =
                part == 0 ? dir / (std::string(base) + ".csv")
                          : dir / (std::string(base) + "_" + std::to_string(part) + ".csv");
            const std::string text = readFile(name);
            std::istringstream in(text);
            std::string line;
            int n = 0;
            while (std::getline(in, line)) {
                if (++n > 21) {
                    ++rowsSeen;
                    EXPECT_EQ(line.rfind("\"02/01/2021\",\"'12:00:00.0\",\"42.0\",", 0), 0U)
                        << line;
                    EXPECT_EQ(std::count(line.begin(), line.end(), '"'), base[0] == 'a' ? 8 : 30);
                }
            }
            EXPECT_EQ(n, part < 4 ? 121 : 71) << name;
        }
        EXPECT_EQ(rowsSeen, 450U);
    }
}

TEST_F(Writers, NamesInTheFlatAndSubDirectoryLayouts) {
    orv::ProcessingSettings s;
    s.outputDir = dir.path() + "/";
    s.generalWeighting = 1;
    s.statsIntervalMin = 0;
    s.leqInterval = 0;
    s.octaveFreqWeighting = 0;
    s.octaveTimeWeighting = 3;
    s.auxFilterType = 1;
    s.auxFreq1 = 1000.7F;
    s.auxFreq2 = 0.0F;
    s.auxFreqWeighting = 2;
    s.auxTimeWeighting = 0;
    const std::string o = s.outputDir;

    const orv::ResultNaming flat(s, "S1", 2);
    EXPECT_EQ(flat.general(), o + "S1.csv");
    EXPECT_EQ(flat.leq(orv::LeqFileKind::AllPass, 36), o + "S1_LEQ.csv");
    EXPECT_EQ(flat.leq(orv::LeqFileKind::Octave, 36), o + "S1_LEQ3OCT.csv");
    EXPECT_EQ(flat.octaveBand(0, 36), o + "S1_6.3Hz.csv");
    EXPECT_EQ(flat.octaveBand(11, 12), o + "S1_16kHz.csv");
    EXPECT_EQ(flat.filtered(), o + "S1_LPF.csv");
    EXPECT_EQ(flat.prepareSessionDirectory(), "");

    s.binMode = 1;
    const orv::ResultNaming bin(s, "S1", 3);
    const std::string d = o + "S1/";
    EXPECT_EQ(bin.prepareSessionDirectory(), d);
    EXPECT_TRUE(testing_support::exists(d));
    EXPECT_EQ(bin.general(), d + "GEN_A_60_S.csv");
    EXPECT_EQ(bin.leq(orv::LeqFileKind::AllPass, 12), d + "LEQ_A_60_S.csv");
    EXPECT_EQ(bin.leq(orv::LeqFileKind::Octave, 12), d + "LEQ1OCT_Z_60_S.csv");
    EXPECT_EQ(bin.octaveBand(7, 12), d + "1OCT1kHz_Z_60_S.csv");
    EXPECT_EQ(bin.filtered(), d + "LPF-1000-0_C_60_N.csv");
    s.statsIntervalMin = 15;
    s.leqInterval = 4;
    EXPECT_EQ(orv::ResultNaming(s, "S1", 2).general(), d + "GEN_A_15_F.csv");
    EXPECT_EQ(orv::ResultNaming(s, "S1", 2).leq(orv::LeqFileKind::AllPass, 0), d + "LEQ_A_4_F.csv");
}

TEST_F(Writers, FilesReplacedNotAppendedAndFailuresReported) {
    testing_support::writeFile(dir / "S1.csv", "an older and much longer result file\r\n");
    {
        orv::ResultFile f;
        ASSERT_TRUE(f.create(dir / "S1.csv", run));
        EXPECT_TRUE(f.write("new"));
    }
    EXPECT_EQ(readFile(dir / "S1.csv"), "new");
    EXPECT_FALSE(run.lost());

    orv::ResultFile f;
    EXPECT_FALSE(f.create(dir / "missing/S1.csv", run));
    EXPECT_FALSE(f.write("row"));  // nothing more to report
    EXPECT_EQ(console, "Unable to open " + dir / "missing/S1.csv" + " : 2\r\n");
    EXPECT_TRUE(run.lost());
    console.clear();
    const std::string longName = dir / std::string(260, 'x') + ".csv";
    EXPECT_FALSE(f.create(longName, run));
    EXPECT_EQ(console, "Unable to open " + longName + " : 36\r\n");
}

}  // namespace
