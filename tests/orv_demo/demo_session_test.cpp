// The demo session generator: the session's files and names, the WAV and level file
// layouts, agreement of the level files with the audio, recordings of triggered and split
// sessions, and determinism.
#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <complex>
#include <cstdint>
#include <cstring>
#include <numbers>
#include <string>
#include <utility>
#include <vector>

#include "orv_demo/civil_time.h"
#include "orv_demo/demo_session.h"
#include "orv_demo/level_meter.h"
#include "orv_demo/session_files.h"
#include "support/test_support.h"
#include "support/wave_builder.h"

namespace orv_demo {
namespace {

using testing_support::listNames;
using testing_support::readFile;
using Strings = std::vector<std::string>;

struct Wave {
    std::string header;
    std::vector<std::int16_t> samples;
};

Wave readWave(const std::string& path) {
    const std::string bytes = readFile(path);
    Wave w;
    w.header = bytes.substr(0, 44);
    w.samples.resize((bytes.size() - 44) / 2);
    std::memcpy(w.samples.data(), bytes.data() + 44, w.samples.size() * 2);
    return w;
}

struct Row {
    unsigned minute = 0, second = 0, tenth = 0;
    double splA = 0, splC = 0, leqA = 0, leqC = 0;
    unsigned condition = 0;
    double battery = 0;
};

struct LevelFile {
    Strings header;  // the six header lines
    std::vector<Row> rows;
};

LevelFile readLevelFile(const std::string& path) {
    const std::string text = readFile(path);
    LevelFile f;
    std::size_t pos = 0;
    for (std::size_t end; (end = text.find("\r\n", pos)) != std::string::npos; pos = end + 2) {
        const std::string line = text.substr(pos, end - pos);
        if (f.header.size() < 6) {
            f.header.push_back(line);
            continue;
        }
        Row r;
        int used = 0;
        EXPECT_EQ(std::sscanf(line.c_str(), "%u:%u.%u,%lf,%lf,%lf,%lf,%u,%lf%n", &r.minute,
                              &r.second, &r.tenth, &r.splA, &r.splC, &r.leqA, &r.leqC, &r.condition,
                              &r.battery, &used),
                  9)
            << line;
        EXPECT_EQ(static_cast<std::size_t>(used), line.size()) << line;
        f.rows.push_back(r);
    }
    EXPECT_EQ(pos, text.size()) << "text after the last CR LF in " << path;
    return f;
}

// All records of a session in time order, with their time as tenths of the hour.
std::vector<Row> allRows(const std::string& dataDir) {
    std::vector<Row> rows;
    for (const std::string& name : listNames(dataDir)) {
        if (name.size() != 15 || name.substr(11) != ".csv") continue;
        const LevelFile f = readLevelFile(dataDir + "/" + name);
        rows.insert(rows.end(), f.rows.begin(), f.rows.end());
    }
    return rows;
}

double energyMeanDb(const std::vector<Row>& rows, double Row::*level) {
    double sum = 0.0;
    for (const Row& r : rows) sum += std::pow(10.0, 0.1 * (r.*level));
    return 10.0 * std::log10(sum / static_cast<double>(rows.size()));
}

// Mean change of a level from one record to the next.
double meanStepDb(const std::vector<Row>& rows, double Row::*level) {
    double sum = 0.0;
    for (std::size_t k = 1; k < rows.size(); ++k)
        sum += std::abs(rows[k].*level - rows[k - 1].*level);
    return sum / static_cast<double>(rows.size() - 1);
}

float calibrationGain(double calibrationDb) {
    char text[32];
    std::snprintf(text, sizeof text, "%.2f", calibrationDb);
    return static_cast<float>(
        std::pow(10.0, static_cast<double>(0.05F * readDecimalAsLogger(text))));
}

// Squared magnitude of the analog A or C weighting (IEC 61672-1 poles), 1 at 1 kHz.
double weightingPower(bool a, double f) {
    const double f1 = 20.598997, f2 = 107.65265, f3 = 737.86223, f4 = 12194.217;
    const auto r = [&](double x) {
        const double x2 = x * x;
        const double c = f4 * f4 * x2 / ((x2 + f1 * f1) * (x2 + f4 * f4));
        return a ? c * x2 / std::sqrt((x2 + f2 * f2) * (x2 + f3 * f3)) : c;
    };
    const double ratio = r(f) / r(1000.0);
    return ratio * ratio;
}

// Leq (dB) of the weighted calibrated samples, weighted in the frequency domain with the
// analog definition: independent of the level library's filters.
double weightedLeqDb(const std::vector<std::int16_t>& samples, float gain, bool aWeighting) {
    std::size_t n = 1;
    while (n < samples.size()) n *= 2;
    std::vector<std::complex<double>> x(n);
    for (std::size_t i = 0; i < samples.size(); ++i)
        x[i] = static_cast<double>(static_cast<float>(samples[i]) * gain);
    for (std::size_t i = 1, j = 0; i < n; ++i) {  // bit-reversal permutation
        std::size_t bit = n >> 1;
        for (; j & bit; bit >>= 1) j ^= bit;
        j ^= bit;
        if (i < j) std::swap(x[i], x[j]);
    }
    for (std::size_t len = 2; len <= n; len *= 2) {
        const std::complex<double> w =
            std::polar(1.0, -2.0 * std::numbers::pi / static_cast<double>(len));
        for (std::size_t i = 0; i < n; i += len) {
            std::complex<double> wk = 1.0;
            for (std::size_t k = 0; k < len / 2; ++k, wk *= w) {
                const std::complex<double> u = x[i + k], v = x[i + k + len / 2] * wk;
                x[i + k] = u + v;
                x[i + k + len / 2] = u - v;
            }
        }
    }
    double energy = 0.0;
    for (std::size_t k = 1; k < n; ++k) {
        const double f = static_cast<double>(std::min(k, n - k)) * 48000.0 / static_cast<double>(n);
        energy += std::norm(x[k]) * weightingPower(aWeighting, f);
    }
    // Parseval: sum of squares = energy / n.
    return 10.0 * std::log10(energy / static_cast<double>(n) / static_cast<double>(samples.size()));
}

DemoOptions shortSession(const std::string& outDir) {
    DemoOptions o;
    o.outDir = outDir;
    o.start = CivilTime{2024, 3, 5, 12, 59, 40};
    o.durationSeconds = 40;
    o.seed = 7;
    return o;
}

class DemoSessionTest : public ::testing::Test {
protected:
    static void SetUpTestSuite() {
        tmp_ = new testing_support::TempDir;
        summary_ = new DemoSummary(generateDemoSession(shortSession(tmp_->path())));
    }
    static void TearDownTestSuite() {
        delete summary_;
        delete tmp_;
    }
    static std::string session() { return tmp_->path() + "/Demo"; }
    static std::string data() { return session() + "/data.000"; }

    static testing_support::TempDir* tmp_;
    static DemoSummary* summary_;
};

testing_support::TempDir* DemoSessionTest::tmp_ = nullptr;
DemoSummary* DemoSessionTest::summary_ = nullptr;

TEST_F(DemoSessionTest, FilesAndNamesFollowTheLoggerLayout) {
    EXPECT_EQ(listNames(session()), (Strings{"Demo.inf", "data.000"}));
    EXPECT_EQ(listNames(data()),
              (Strings{"20240305_12.csv", "20240305_125940.wav", "20240305_13.csv"}));
    EXPECT_EQ(readFile(session() + "/Demo.inf"),
              "SESSION NAME: Demo\r\nSESSION START: 05/03/2024 12:59:40\r\n"
              "SESSION END: 05/03/2024 13:00:20\r\nTWEIGHT: 125\r\nCALIBRATION: 20.00\r\n"
              "RANGE MULTIPLIER: 1.0\r\nTRIG SETTING: OFF\r\nTRIG TYPE: Level\r\n"
              "TRIG PRE REC LENGTH: 0\r\n");

    // The logger's 44-byte header: PCM, mono, 48 kHz, 16 bits, sizes of the whole file.
    const Wave w = readWave(data() + "/20240305_125940.wav");
    EXPECT_EQ(w.samples.size(), 40U * 48000U);
    EXPECT_EQ(w.header, testing_support::waveFileBytes(w.samples).substr(0, 44));
}

TEST_F(DemoSessionTest, LevelFilesHoldEveryRecordAcrossTheHour) {
    const LevelFile h12 = readLevelFile(data() + "/20240305_12.csv");
    const LevelFile h13 = readLevelFile(data() + "/20240305_13.csv");
    EXPECT_EQ(h12.header, (Strings{"Session Name,,Demo", "Logger Serial Number,,TL40217",
                                   "Date,,05/03/2024", "Hour,,12", h12.header[4],
                                   "Time,SPL-A,SPL-C,LEQ-A,LEQ-C,Signal Condition,Battery"}));
    EXPECT_EQ(h13.header[3], "Hour,,13");
    float temperature = 0;
    EXPECT_EQ(std::sscanf(h13.header[4].c_str(), "Temperature,,%f", &temperature), 1);
    EXPECT_GT(temperature, -10.0F);
    EXPECT_LT(temperature, 40.0F);
    // Records are stamped with the end of their 100 ms: 59:40.1 to 59:59.9, then 0:0.0 to
    // 0:20.0.
    ASSERT_EQ(h12.rows.size(), 199U);
    ASSERT_EQ(h13.rows.size(), 201U);

    std::vector<Row> rows = h12.rows;
    rows.insert(rows.end(), h13.rows.begin(), h13.rows.end());
    unsigned slot = 59 * 600 + 40 * 10 + 1;
    double battery = 12.8;
    for (const Row& r : rows) {
        EXPECT_EQ(r.minute * 600 + r.second * 10 + r.tenth, slot % 36000);
        ++slot;
        EXPECT_EQ(r.condition, 0U);
        EXPECT_LE(r.battery, battery);
        EXPECT_GE(r.battery, 12.6);
        battery = r.battery;
        EXPECT_GT(r.leqA, 35.0);
        EXPECT_LT(r.leqA, 80.0);
        EXPECT_GT(r.leqC, r.leqA);  // the rumble and the hum lie below 200 Hz
    }
}

TEST_F(DemoSessionTest, LevelFilesAgreeWithTheAudio) {
    const std::vector<Row> rows = allRows(data());
    const Wave w = readWave(data() + "/20240305_125940.wav");
    const float gain = calibrationGain(20.0);
    EXPECT_NEAR(energyMeanDb(rows, &Row::leqA), weightedLeqDb(w.samples, gain, true), 0.1);
    EXPECT_NEAR(energyMeanDb(rows, &Row::leqC), weightedLeqDb(w.samples, gain, false), 0.1);
    // The F-weighted level sampled every 100 ms carries the same energy on average, and
    // it is smoother than the 100 ms Leq: a 125 ms average, not a 1 s one.
    EXPECT_NEAR(energyMeanDb(rows, &Row::splA), energyMeanDb(rows, &Row::leqA), 0.2);
    EXPECT_NEAR(energyMeanDb(rows, &Row::splC), energyMeanDb(rows, &Row::leqC), 0.2);
    for (const auto& [spl, leq] :
         {std::pair{&Row::splA, &Row::leqA}, std::pair{&Row::splC, &Row::leqC}}) {
        const double smoothing = meanStepDb(rows, spl) / meanStepDb(rows, leq);
        EXPECT_GT(smoothing, 0.3);
        EXPECT_LT(smoothing, 0.75);
    }
    // A pass-by stands out from the background.
    double low = 200, high = 0;
    for (const Row& r : rows) {
        low = std::min(low, r.leqA);
        high = std::max(high, r.leqA);
    }
    EXPECT_GT(high - low, 10.0);
}

TEST_F(DemoSessionTest, SameSeedSameFilesOtherSeedOtherAudio) {
    testing_support::TempDir again;
    generateDemoSession(shortSession(again.path()));
    for (const std::string& name : listNames(data()))
        EXPECT_EQ(readFile(again / ("Demo/data.000/" + name)), readFile(data() + "/" + name))
            << name;
    DemoOptions other = shortSession(again.path());
    other.seed = 8;
    generateDemoSession(other);  // replaces the files of the first run
    EXPECT_EQ(listNames(again / "Demo/data.000"), listNames(data()));
    EXPECT_NE(readFile(again / "Demo/data.000/20240305_125940.wav"),
              readFile(data() + "/20240305_125940.wav"));
}

// In a triggered session a wave file covers the records whose time stamps t satisfy
// start < t <= start + duration, start being its name time less the pre-record length; the
// levels of those records are the levels of the file's audio, period by period. Record i
// of the session is stamped (i + 1) x 0.1 s after the session start.
TEST(DemoTriggeredSession, RecordingsHoldTheAudioOfTheirRecords) {
    testing_support::TempDir tmp;
    DemoOptions o = shortSession(tmp.path());
    o.durationSeconds = 150;
    o.triggered = true;
    o.preRecordSeconds = 3;
    const DemoSummary s = generateDemoSession(o);
    EXPECT_NE(readFile(tmp / "Demo/Demo.inf")
                  .find("TRIG SETTING: ON\r\nTRIG TYPE: Level\r\n"
                        "TRIG PRE REC LENGTH: 3\r\n"),
              std::string::npos);
    const std::vector<Row> rows = allRows(tmp / "Demo/data.000");
    ASSERT_EQ(rows.size(), 1500U);

    Strings waves;
    for (const std::string& name : listNames(tmp / "Demo/data.000"))
        if (name.ends_with(".wav")) waves.push_back(name);
    ASSERT_GE(waves.size(), 2U);
    ASSERT_EQ(waves.size(), s.plan.recordings.size());
    const std::int64_t sessionStart = *toSeconds(o.start);
    for (const std::string& name : waves) {
        SCOPED_TRACE(name);
        CivilTime t;
        ASSERT_EQ(std::sscanf(name.c_str(), "%4d%2u%2u_%2u%2u%2u.wav", &t.year, &t.month, &t.day,
                              &t.hour, &t.minute, &t.second),
                  6);
        const std::int64_t start = *toSeconds(t) - 3 - sessionStart;
        const Wave w = readWave(tmp / ("Demo/data.000/" + name));
        ASSERT_EQ(w.samples.size() % 48000, 0U);  // whole seconds
        std::vector<float> calibrated(w.samples.size());
        for (std::size_t i = 0; i < calibrated.size(); ++i)
            calibrated[i] = static_cast<float>(w.samples[i]) * calibrationGain(20.0);
        std::vector<PeriodPowers> periods;
        LevelMeter meter;
        meter.process(calibrated.data(), calibrated.size(), periods);
        const auto first = static_cast<std::size_t>(start * 10);
        ASSERT_LE(first + periods.size(), rows.size());
        // The meter here starts from silence; after 0.5 s the levels no longer depend on that.
        for (std::size_t k = 5; k < periods.size(); ++k) {
            EXPECT_NEAR(rows[first + k].leqA, 10.0 * std::log10(periods[k].leqA), 0.051) << k;
            EXPECT_NEAR(rows[first + k].leqC, 10.0 * std::log10(periods[k].leqC), 0.051) << k;
        }
    }
}

TEST(DemoSplitRecording, PartsFollowOneAnotherAndJoinToTheWholeRecording) {
    testing_support::TempDir whole, split;
    generateDemoSession(shortSession(whole.path()));
    DemoOptions o = shortSession(split.path());
    o.splitSeconds = 15;
    generateDemoSession(o);
    const Strings parts = {"20240305_125940.wav", "20240305_125940_001.wav",
                           "20240305_125940_002.wav"};
    Strings names = listNames(split / "Demo/data.000");
    EXPECT_EQ(names, (Strings{"20240305_12.csv", parts[0], parts[1], parts[2], "20240305_13.csv"}));
    std::vector<std::int16_t> joined;
    for (const std::string& p : parts) {
        const Wave w = readWave(split / ("Demo/data.000/" + p));
        EXPECT_EQ(w.samples.size(), (p == parts[2] ? 10U : 15U) * 48000U) << p;
        joined.insert(joined.end(), w.samples.begin(), w.samples.end());
    }
    EXPECT_EQ(joined, readWave(whole / "Demo/data.000/20240305_125940.wav").samples);
    EXPECT_EQ(readFile(split / "Demo/data.000/20240305_13.csv"),
              readFile(whole / "Demo/data.000/20240305_13.csv"));
}

TEST(DemoOverload, ConditionThreeExactlyWherePeriodsPassTheOverloadSample) {
    testing_support::TempDir tmp;
    DemoOptions o = shortSession(tmp.path());
    o.calibration = 0.0;  // 20 dB more raw signal: the loudest pass-by clips
    o.seed = 1;
    o.start.minute = 30;  // no hour boundary: one level file
    generateDemoSession(o);
    const std::vector<Row> rows = allRows(tmp / "Demo/data.000");
    const Wave w = readWave(tmp / "Demo/data.000/20240305_123040.wav");
    ASSERT_EQ(rows.size() * 4800, w.samples.size());
    std::size_t overloaded = 0;
    for (std::size_t k = 0; k < rows.size(); ++k) {
        int peak = 0;
        for (std::size_t i = k * 4800; i < (k + 1) * 4800; ++i)
            peak = std::max(peak, std::abs(static_cast<int>(w.samples[i])));
        EXPECT_EQ(rows[k].condition, peak > 27600 ? 3U : 0U) << k;
        overloaded += peak > 27600 ? 1 : 0;
    }
    EXPECT_GT(overloaded, 0U);
}

TEST(DemoLevelFilesOnly, DayChangeAndNoAudio) {
    testing_support::TempDir tmp;
    DemoOptions o = shortSession(tmp.path());
    o.start = CivilTime{2024, 12, 31, 23, 59, 30};
    o.durationSeconds = 60;
    o.audio = false;
    generateDemoSession(o);
    EXPECT_EQ(listNames(tmp / "Demo/data.000"), (Strings{"20241231_23.csv", "20250101_00.csv"}));
    const LevelFile last = readLevelFile(tmp / "Demo/data.000/20250101_00.csv");
    EXPECT_EQ(last.header[2], "Date,,01/01/2025");
    ASSERT_EQ(last.rows.size(), 301U);
    EXPECT_EQ(last.rows.back().second * 10 + last.rows.back().tenth, 300U);
    EXPECT_NE(readFile(tmp / "Demo/Demo.inf").find("SESSION END: 01/01/2025 00:00:30\r\n"),
              std::string::npos);
    const std::vector<Row> rows = allRows(tmp / "Demo/data.000");
    EXPECT_GT(energyMeanDb(rows, &Row::leqA), 35.0);
    EXPECT_LT(energyMeanDb(rows, &Row::leqA), 75.0);
}

}  // namespace
}  // namespace orv_demo
