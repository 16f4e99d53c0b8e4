// Demo sessions through the whole audio path: every second of audio that orv_cmd analyses
// is the second the logger measured, and the hourly raw levels computed from the audio are
// the logger's own levels, in plain, triggered and split sessions.
#include <gtest/gtest.h>

#include <cmath>
#include <map>

#include "input/level_data.h"
#include "orv_demo/demo_session.h"
#include "support/result_csv.h"
#include "support/test_support.h"

namespace {

using namespace testing_support;

// The records of a level data file (the logger's or an hourly raw file) by slot of the hour.
std::map<unsigned, orv::LevelRecord> levelRecords(const std::string& path) {
    const std::string text = readFile(path);
    orv::DataFileHeader header;
    std::size_t first = 0;
    EXPECT_TRUE(orv::parseDataFileHeader(text.data(), text.size(), header, first)) << path;
    orv::LevelRecordQueue queue;
    orv::decodeLevelRecords(text.data() + first, text.size() - first, queue);
    std::map<unsigned, orv::LevelRecord> out;
    for (const orv::LevelRecord& r : queue.records)
        out[r.minute * 600U + r.second * 10U + r.tenth] = r;
    return out;
}

// "AP Leq" per time stamp of the all-pass Leq file (the logger's own 100 ms levels) and the
// all-pass A channel's Leq of the octave Leq file (the audio), second by second.
TEST(DemoAudio, EveryAnalysedSecondIsTheSecondTheLoggerMeasured) {
    struct Case {
        const char* name;
        bool triggered;
        std::int64_t split;
    };
    for (const Case& c : {Case{"Plain", false, 0}, Case{"Trig", true, 0}, Case{"Split", true, 7}}) {
        TempDir dir;
        orv_demo::DemoOptions o;
        o.outDir = dir / "sessions";
        o.name = c.name;
        o.durationSeconds = 150;
        o.triggered = c.triggered;
        o.splitSeconds = c.split;
        const orv_demo::DemoSummary demo = orv_demo::generateDemoSession(o);
        const RunResult r = runTool({"-s", dir / "sessions", "-d", dir / "out", "-i", "1", "-leq",
                                     "1", "-oct", "1", "Z", "F", "-apf", "A", "F", "-csv"});
        ASSERT_EQ(r.status, 0) << r.output;
        EXPECT_EQ(r.output.find("ERR"), std::string::npos) << r.output;

        std::map<std::string, double> logger;
        for (const auto& row : resultRows(dir / ("out/" + std::string(c.name) + "_LEQ.csv"))) {
            logger[row[1]] = std::stod(row[2]);
        }
        const auto audio = resultRows(dir / ("out/" + std::string(c.name) + "_LEQ1OCT.csv"));
        // Untriggered: every second of the closed intervals; triggered: the recorded ones.
        EXPECT_GE(audio.size(), c.triggered ? std::size_t{20} : std::size_t{120}) << c.name;
        EXPECT_GE(demo.plan.recordings.size(), c.triggered ? 2U : 1U) << c.name;
        int previous = -10;
        for (const auto& row : audio) {
            const std::string& time = row[1];  // 'hh:mm:ss.0
            ASSERT_TRUE(logger.count(time)) << c.name << " " << time;
            const int second = std::stoi(time.substr(1, 2)) * 3600 +
                               std::stoi(time.substr(4, 2)) * 60 + std::stoi(time.substr(7, 2));
            // A recording's first second holds the meter's start-up.
            if (second == previous + 1) {
                EXPECT_NEAR(std::stod(row[14]), logger[time], 0.3) << c.name << " " << time;
            }
            previous = second;
        }

        // The hourly raw levels against the logger's, record by record, past the first
        // second of each recording (where the logger's meter had run on before).
        std::size_t compared = 0;
        for (const std::string& hour : demo.levelFiles) {
            if (!exists(dir / ("out/" + hour))) continue;
            const auto raw = levelRecords(dir / ("out/" + hour));
            const auto own = levelRecords(demo.plan.sessionDir + "/data.000/" + hour);
            unsigned previousSlot = 0, run = 0;
            for (const auto& [slot, rec] : raw) {
                run = slot == previousSlot + 1 ? run + 1 : 0;
                previousSlot = slot;
                ASSERT_TRUE(own.count(slot)) << hour << " " << slot;
                if (run < 10) continue;
                const orv::LevelRecord& mine = own.at(slot);
                EXPECT_NEAR(rec.splA, mine.splA, 0.2) << c.name << " " << hour << " " << slot;
                EXPECT_NEAR(rec.splC, mine.splC, 0.2) << c.name << " " << hour << " " << slot;
                EXPECT_NEAR(rec.leqA, mine.leqA, 0.2) << c.name << " " << hour << " " << slot;
                EXPECT_NEAR(rec.leqC, mine.leqC, 0.2) << c.name << " " << hour << " " << slot;
                EXPECT_EQ(rec.status, mine.status) << c.name << " " << hour << " " << slot;
                ++compared;
            }
        }
        EXPECT_GE(compared, c.triggered ? 150U : 1100U) << c.name;
    }
}

}  // namespace
