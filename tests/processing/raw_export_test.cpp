// End-to-end: hourly raw level files computed from the audio (-csv).
#include <gtest/gtest.h>

#include <cmath>

#include "fweight.h"
#include "input/level_data.h"
#include "support/session_builder.h"
#include "support/test_support.h"
#include "support/wave_builder.h"

namespace {

using namespace testing_support;

// A 1 kHz tone of raw amplitude 1000 in a session calibrated at 94 dB.
double toneLevel(unsigned weighting) {
    return 20.0 * std::log10(1000.0 / std::sqrt(2.0)) + 94.0 +
           SlmLibrary::FWeight::designResponseDb(weighting, 1000.0, 48000.0);
}

struct Hour {
    orv::DataFileHeader header;
    std::vector<orv::LevelRecord> records;
};

// Reads a raw level file back with the level data decoder.
Hour readBack(const std::string& path) {
    const std::string text = readFile(path);
    Hour h;
    std::size_t first = 0;
    EXPECT_TRUE(orv::parseDataFileHeader(text.data(), text.size(), h.header, first)) << path;
    orv::LevelRecordQueue queue;
    orv::decodeLevelRecords(text.data() + first, text.size() - first, queue);
    h.records = queue.records;
    EXPECT_EQ(text.substr(text.size() - 2), "\r\n");
    return h;
}

// Slot of the hour (0 .. 35999) of a record.
std::size_t slotOf(const orv::LevelRecord& r) { return r.minute * 600U + r.second * 10U + r.tenth; }

class RawExport : public ::testing::Test {
protected:
    // 08:58:00 .. 09:02:00 of 17/09/2020: two level files, one wave file of 4 minutes.
    SessionLayout session(const std::string& name) {
        SessionLayout layout = namedSession(name);
        layout.levelFiles[0].header.hour = 8;
        layout.levelFiles[0].rows = makeRows(1199, 34801, [](std::size_t slot, LevelRow& r) {
            r.condition = slot == 34900 ? 2 : (slot == 35000 ? 3 : 0);
            r.battery = slot == 35100 ? 11.9F : 12.6F;
        });
        LevelFileLayout nine = layout.levelFiles[0];
        nine.header.hour = 9;
        nine.header.temperature = 23.0F;
        nine.rows = makeRows(1201, 0);
        layout.levelFiles.push_back(nine);
        return layout;
    }
    // The session with its waves: (name, seconds of the tone); by default 10 minutes.
    void add(const SessionLayout& layout, const std::string& dir,
             const std::vector<std::pair<std::string, std::size_t>>& waves = {
                 {"20200917_085800.wav", 240}}) {
        const std::string path = writeSession(dir_ / ("sessions/" + dir), layout);
        for (const auto& [name, seconds] : waves) {
            writeWaveFile(path + "/data.000/" + name, toneSamples(1000.0, 1000.0, seconds * 48000));
        }
    }
    RunResult run(std::vector<std::string> options) {
        std::vector<std::string> args{"-s", dir_ / "sessions", "-d", dir_ / "out", "-csv"};
        args.insert(args.end(), options.begin(), options.end());
        return runTool(args);
    }

    TempDir dir_;
};

TEST_F(RawExport, EveryRecordOfEveryHourWithItsRealTime) {
    add(session("Raw"), "Raw");
    writeFile(dir_ / "out/20200917_09.csv", std::string(2'000'000, 'x'));  // an old, longer file
    // Blocks end at every minute: none at the last record of an hour.
    const RunResult r = run({"-i", "1", "-oct", "1", "A", "F"});
    ASSERT_EQ(r.status, 0) << r.output;
    const Hour eight = readBack(dir_ / "out/20200917_08.csv");
    const Hour nine = readBack(dir_ / "out/20200917_09.csv");
    EXPECT_EQ(eight.header.hour, 8);
    EXPECT_EQ(nine.header.hour, 9);
    EXPECT_EQ(eight.header.sessionTitle, "Raw");
    EXPECT_EQ(eight.header.serialNumber, "S/N 4711");
    EXPECT_EQ(nine.header.temperature, 23.0F);
    // 58:0.1 .. 59:59.9, then 0:0.0 .. 2:0.0: none missing, none doubled.
    ASSERT_EQ(eight.records.size(), 1199U);
    ASSERT_EQ(nine.records.size(), 1201U);
    for (std::size_t i = 0; i < 1199; ++i) ASSERT_EQ(slotOf(eight.records[i]), 34801 + i);
    for (std::size_t i = 0; i < 1201; ++i) ASSERT_EQ(slotOf(nine.records[i]), i);

    const double a = toneLevel(SlmLibrary::FWeight::A);
    const double c = toneLevel(SlmLibrary::FWeight::C);
    for (const Hour* h : {&eight, &nine}) {
        for (const orv::LevelRecord& rec : h->records) {
            EXPECT_NEAR(rec.splA, a, 0.1);
            EXPECT_NEAR(rec.leqA, a, 0.1);
            EXPECT_NEAR(rec.splC, c, 0.1);
            EXPECT_NEAR(rec.leqC, c, 0.1);
        }
    }
    // Each record's own condition, 3 for an overload, 1 for the other gain range (2 in the
    // level file), else 0, and its own battery reading.
    EXPECT_EQ(eight.records[199].status, 1U);
    EXPECT_EQ(eight.records[198].status, 0U);
    EXPECT_EQ(eight.records[299].battery, 11.9F);
    EXPECT_EQ(eight.records[298].battery, 12.6F);
    const std::string text = readFile(dir_ / "out/20200917_08.csv");
    const std::string head =
        "Session Name,,Raw\r\nLogger Serial Number,,S/N 4711\r\nDate,,17/09/2020\r\n"
        "Hour,,08\r\nTemperature,, 21.5\r\n"
        "Time,SPL-A,SPL-C,LEQ-A,LEQ-C,Signal Condition,Battery\r\n58:0.1,";
    EXPECT_EQ(text.substr(0, head.size()), head);
    const std::size_t gainRange = text.find("\r\n58:10.0,");
    ASSERT_NE(gainRange, std::string::npos);
    EXPECT_EQ(text.substr(text.find("\r\n", gainRange + 2) - 7, 7), ",1,12.6");
    EXPECT_EQ(text.find(",2,"), std::string::npos);
}

TEST_F(RawExport, SessionsOverTheSameHourKeepTheirOwnFiles) {
    add(session("First"), "First");
    add(session("Second"), "Second");
    RunResult r = run({"-i", "1"});
    ASSERT_EQ(r.status, 0) << r.output;
    EXPECT_EQ(listNames(dir_ / "out"),
              (std::vector<std::string>{"20200917_08.csv", "20200917_08_1.csv", "20200917_09.csv",
                                        "20200917_09_1.csv", "First.csv", "Second.csv"}));
    EXPECT_NE(r.output.find("MSG: " + (dir_ / "out/20200917_08.csv") +
                            " was written earlier in this run - this hour goes to " +
                            (dir_ / "out/20200917_08_1.csv") + "\r\n"),
              std::string::npos)
        << r.output;
    EXPECT_EQ(readBack(dir_ / "out/20200917_08_1.csv").header.sessionTitle, "Second");
    r = run({"-i", "1", "-bin"});
    ASSERT_EQ(r.status, 0) << r.output;
    EXPECT_TRUE(exists(dir_ / "out/First/20200917_09.csv"));
    EXPECT_TRUE(exists(dir_ / "out/Second/20200917_09.csv"));
}

TEST_F(RawExport, TriggeredRecordingsGiveTheirOwnRecordsOnly) {
    SessionLayout layout = session("Trig");
    layout.info.trigSetting = "ON";
    layout.info.trigPreRecLength = "0";
    add(layout, "Trig", {{"20200917_085830.wav", 10}, {"20200917_085930.wav", 5}});
    ASSERT_EQ(run({"-i", "1"}).status, 0);
    // 08:58:30.1 .. 08:58:40.0 and 08:59:30.1 .. 08:59:35.0.
    const Hour eight = readBack(dir_ / "out/20200917_08.csv");
    ASSERT_EQ(eight.records.size(), 150U);
    EXPECT_EQ(slotOf(eight.records[0]), 35101U);
    EXPECT_EQ(slotOf(eight.records[99]), 35200U);
    EXPECT_EQ(slotOf(eight.records[100]), 35701U);
    EXPECT_EQ(slotOf(eight.records[149]), 35750U);
    EXPECT_FALSE(exists(dir_ / "out/20200917_09.csv"));
    for (std::size_t i = 0; i < 150; ++i) {
        EXPECT_NEAR(eight.records[i].splA, toneLevel(SlmLibrary::FWeight::A), 0.1) << i;
    }
}

}  // namespace
