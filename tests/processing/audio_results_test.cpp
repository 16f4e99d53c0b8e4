// End-to-end: the audio analysis of generated sessions, checked in the band, filtered
// channel and octave Leq files.
#include <gtest/gtest.h>

#include <cmath>
#include <filesystem>
#include <numbers>

#include "fweight.h"
#include "support/result_csv.h"
#include "support/session_builder.h"
#include "support/test_support.h"
#include "support/wave_builder.h"

namespace {

using namespace testing_support;

// Mid-band frequencies of the 125 Hz and 2 kHz octaves, and a tone's level in a session
// calibrated at 94 dB: 20 log10(amplitude / sqrt 2) + 94.
const double k125 = 1000.0 * std::pow(10.0, -0.9);
const double k2k = 1000.0 * std::pow(10.0, 0.3);
double toneLevel(double amplitude) { return 20.0 * std::log10(amplitude / std::sqrt(2.0)) + 94.0; }

double num(const std::string& field) { return std::stod(field); }

std::vector<std::int16_t> mix(std::vector<std::vector<std::int16_t>> parts) {
    std::vector<std::int16_t> out(parts[0].size());
    for (const auto& p : parts) {
        for (std::size_t i = 0; i < out.size(); ++i)
            out[i] = static_cast<std::int16_t>(out[i] + p[i]);
    }
    return out;
}

class AudioRun : public ::testing::Test {
protected:
    // An untriggered session from 08:00:00 of 17/09/2020: records of the 100 ms slots
    // [firstSlot, firstSlot + audio periods) and one wave file with the audio.
    void addSession(const std::string& name, const std::vector<std::int16_t>& audio,
                    std::size_t firstSlot = 1,
                    const std::function<void(std::size_t, LevelRow&)>& fill = {}) {
        SessionLayout layout = namedSession(name);
        layout.levelFiles[0].rows = makeRows(audio.size() / 4800, firstSlot, fill);
        const std::string dir = writeSession(dir_ / ("sessions/" + name), layout);
        writeWaveFile(dir + "/data.000/20200917_080000.wav", audio);
    }
    RunResult run(const std::string& out, std::vector<std::string> options,
                  const orv::RunEnvironment& env = {}) {
        std::vector<std::string> args{"-s", dir_ / "sessions", "-d", out};
        args.insert(args.end(), options.begin(), options.end());
        return runTool(args, env);
    }
    std::string out() const { return dir_ / "out"; }

    TempDir dir_;
};

TEST_F(AudioRun, TonesAndABurstReadTheirLevelsInTheirBands) {
    // 3 minutes: 125 Hz at 1000 and 2 kHz at 2000 (raw amplitudes), the 2 kHz tone at 30000
    // from 90 s to 91 s (an overload).
    const std::size_t n = 180 * 48000;
    auto high = toneSamples(k2k, 2000.0, n);
    const auto burst = toneSamples(k2k, 30000.0, n);
    std::copy(burst.begin() + 90 * 48000, burst.begin() + 91 * 48000, high.begin() + 90 * 48000);
    addSession("Tones", mix({toneSamples(k125, 1000.0, n), high}), 1,
               [](std::size_t slot, LevelRow& r) {
                   if (slot == 100) r.battery = 11.8F;
                   if (slot == 1500) r.condition = 3;
               });
    const RunResult r =
        run(out(), {"-oct", "1", "Z", "F", "-hpf", "1000", "C", "F", "-i", "1", "-leq", "1"});
    ASSERT_EQ(r.status, 0) << r.output;

    const double low = toneLevel(1000.0), steady = toneLevel(2000.0), loud = toneLevel(30000.0);
    const double burstLeq =
        10.0 *
        std::log10((59.0 * std::pow(10.0, steady / 10.0) + std::pow(10.0, loud / 10.0)) / 60.0);
    const double c2k = SlmLibrary::FWeight::designResponseDb(SlmLibrary::FWeight::C, k2k, 48000);
    const auto b125 = resultRows(out() + "/Tones_125Hz.csv");
    const auto b2k = resultRows(out() + "/Tones_2kHz.csv");
    const auto hpf = resultRows(out() + "/Tones_HPF.csv");
    ASSERT_EQ(b125.size(), 3U);
    ASSERT_EQ(hpf.size(), 3U);
    for (std::size_t k = 0; k < 3; ++k) {
        // Date, time with seconds, Leq, Lmax, L1 .. L99, Lmin, temperature, battery, overload.
        const auto& row = b125[k];
        ASSERT_EQ(row.size(), 16U);
        EXPECT_EQ(row[0], "17/09/2020");
        EXPECT_EQ(row[1], "08:0" + std::to_string(k + 1) + ":00");
        EXPECT_EQ(row[13], "21.5");
        EXPECT_EQ(row[14], k == 0 ? "11.8" : "12.6");
        EXPECT_EQ(row[15], k == 2 ? "1" : "0");
        // A steady tone: every statistic at its level, no start-up dip in any block.
        for (std::size_t c = 2; c <= 12; ++c) EXPECT_NEAR(num(row[c]), low, 0.3) << k << " " << c;
        const double expected2k = k == 1 ? burstLeq : steady;
        EXPECT_NEAR(num(b2k[k][2]), expected2k, 0.3) << k;
        EXPECT_NEAR(num(b2k[k][3]), k == 1 ? loud : steady, 0.3) << k;
        EXPECT_NEAR(num(b2k[k][12]), steady, 0.3) << k;
        // The C-weighted high-pass channel keeps the 2 kHz tone alone; it has Lpeak and no
        // seconds.
        ASSERT_EQ(hpf[k].size(), 17U);
        EXPECT_EQ(hpf[k][1], "08:0" + std::to_string(k + 1));
        EXPECT_NEAR(num(hpf[k][2]), expected2k + c2k, 0.3) << k;
        EXPECT_NEAR(num(hpf[k][3]), (k == 1 ? loud : steady) + c2k, 0.3) << k;
        if (k != 1) {
            EXPECT_NEAR(num(hpf[k][13]), steady + c2k + 3.01, 0.2) << k;
        }
    }
    // Every row of every band: Lmax >= L1 >= ... >= L99 >= Lmin.
    for (const char* band : {"8Hz", "16Hz", "31.5Hz", "63Hz", "125Hz", "250Hz", "500Hz", "1kHz",
                             "2kHz", "4kHz", "8kHz", "16kHz"}) {
        for (const auto& row : resultRows(out() + "/Tones_" + band + ".csv")) {
            for (std::size_t c = 3; c < 12; ++c) EXPECT_GE(num(row[c]), num(row[c + 1])) << band;
        }
    }
    // Two octaves or more from both tones: at least the 40.5 dB of the class 1 mask down.
    for (const char* band : {"8Hz", "16Hz", "31.5Hz", "500Hz", "8kHz", "16kHz"}) {
        EXPECT_LT(num(resultRows(out() + "/Tones_" + band + ".csv")[2][2]), steady - 40.0) << band;
    }
    // Octave Leq: one row a second, the 12 bands and the filtered channel; the burst's
    // second is overloaded.
    const auto leq = resultRows(out() + "/Tones_LEQ1OCT.csv");
    ASSERT_EQ(leq.size(), 180U);
    EXPECT_EQ(leq[90][1], "'08:01:31.0");
    EXPECT_EQ(leq[90][15], "1");
    EXPECT_EQ(leq[89][15], "0");
    EXPECT_NEAR(num(leq[100][6]), low, 0.1);
    EXPECT_NEAR(num(leq[100][14]), steady + c2k, 0.1);
    EXPECT_EQ(
        headerLines(out() + "/Tones_LEQ1OCT.csv")[20],
        "\"Date\",\"Time\",\"8Hz\",\"16Hz\",\"31.5Hz\",\"63Hz\",\"125Hz\",\"250Hz\",\"500Hz\","
        "\"1kHz\",\"2kHz\",\"4kHz\",\"8kHz\",\"16kHz\",\"HPF\",\"Overload\"\r");
}

TEST_F(AudioRun, ShortLeqRowsCoverTheOddPartFirst) {
    // Records from 0:35.1: the first block has 25 s, the second 60 s.
    const std::size_t n = 85 * 48000;
    addSession("Odd", toneSamples(1000.0, 1000.0, n), 351);
    struct Case {
        const char* seconds;
        std::size_t rows;
        std::vector<std::pair<std::size_t, const char*>> times;
    };
    const Case cases[] = {
        {"10", 9, {{0, "'08:00:40.0"}, {1, "'08:00:50.0"}, {2, "'08:01:00.0"}, {3, "'08:01:10.0"}}},
        {"4", 22, {{0, "'08:00:36.0"}, {1, "'08:00:40.0"}, {6, "'08:01:00.0"}, {7, "'08:01:04.0"}}},
        {"1", 85, {{0, "'08:00:36.0"}, {84, "'08:02:00.0"}}},
    };
    for (const Case& c : cases) {
        const std::string dir = out() + c.seconds;
        ASSERT_EQ(run(dir, {"-oct", "1", "Z", "F", "-i", "1", "-leq", c.seconds}).status, 0);
        const auto rows = resultRows(dir + "/Odd_LEQ1OCT.csv");
        ASSERT_EQ(rows.size(), c.rows) << c.seconds;
        for (const auto& [index, time] : c.times) EXPECT_EQ(rows[index][1], time) << c.seconds;
        // The 1 kHz band: the tone's level in every row, the odd part's included.
        for (std::size_t i = 1; i < rows.size(); ++i) {
            EXPECT_NEAR(num(rows[i][9]), toneLevel(1000.0), 0.1) << c.seconds << " " << i;
        }
    }
}

TEST_F(AudioRun, OutputIsTheSameForAnyWorkerCountAndFinishingOrder) {
    // A triggered session of twelve 5 s recordings, each its own block (-trg C): noise whose
    // level changes every second under two tones.
    SessionLayout layout = namedSession("Same");
    layout.info.trigSetting = "ON";
    layout.info.trigPreRecLength = "0";
    layout.levelFiles[0].rows = makeRows(800, 1);
    const std::string dir = writeSession(dir_ / "sessions/Same", layout);
    const std::size_t n = 5 * 48000;
    for (unsigned k = 0; k < 12; ++k) {
        std::vector<std::int16_t> noise = markedSamples(k, n);
        for (std::size_t i = 0; i < n; ++i) {
            noise[i] = static_cast<std::int16_t>(noise[i] / (4 << ((i / 48000 + k) % 5)));
        }
        char name[32];
        std::snprintf(name, sizeof name, "20200917_08%02u%02u.wav", (1 + 6 * k) / 60,
                      (1 + 6 * k) % 60);
        writeWaveFile(dir + "/data.000/" + name,
                      mix({noise, toneSamples(k125, 3000.0, n), toneSamples(k2k, 500.0, n)}));
    }
    const std::vector<std::string> options{"-oct", "3",  "Z",  "S",  "-bpf", "500", "2000",
                                           "A",    "F",  "-i", "1",  "-trg", "C",   "-leq",
                                           "1",    "-p", "10", "50", "90"};
    orv::RunEnvironment one;
    one.audio.workerThreads = 1;
    one.audio.workerLimit = 1;
    orv::RunEnvironment many;
    many.audio.workerThreads = 4;
    many.audio.workerLimit = 4;
    orv::RunEnvironment reverse;
    reverse.audio.workerThreads = 1;
    reverse.audio.reverseBlockOrder = true;
    ASSERT_EQ(run(out() + "1", options, one).status, 0);
    ASSERT_EQ(run(out() + "N", options, many).status, 0);
    ASSERT_EQ(run(out() + "R", options, reverse).status, 0);
    const auto names = listNames(out() + "1");
    ASSERT_EQ(names.size(), 40U);  // general, 2 Leq, 36 bands, filtered
    const auto rows = resultRows(out() + "1/Same_1kHz.csv");
    ASSERT_EQ(rows.size(), 12U);
    EXPECT_EQ(rows[0][1], "08:00:06");  // stamped by the first record after the recording
    EXPECT_EQ(rows[11][1], "08:01:12");
    EXPECT_EQ(resultRows(out() + "1/Same_LEQ3OCT.csv").size(), 60U);
    for (const std::string& name : names) {
        const std::string expected = readFile(out() + "1/" + name);
        EXPECT_EQ(readFile(out() + "N/" + name), expected) << name;
        EXPECT_EQ(readFile(out() + "R/" + name), expected) << name;
    }
}

TEST_F(AudioRun, FileNamesAndHeadersInBothLayouts) {
    addSession("Hdr", toneSamples(1000.0, 1000.0, 61 * 48000));
    const std::vector<std::string> options{"-oct", "1", "A",  "F", "-lpf", "1000",
                                           "C",    "S", "-i", "1", "-leq", "10"};
    ASSERT_EQ(run(out(), options).status, 0);
    std::vector<std::string> flat{"Hdr.csv", "Hdr_LEQ.csv", "Hdr_LEQ1OCT.csv", "Hdr_LPF.csv"};
    for (const char* band : {"8Hz", "16Hz", "31.5Hz", "63Hz", "125Hz", "250Hz", "500Hz", "1kHz",
                             "2kHz", "4kHz", "8kHz", "16kHz"}) {
        flat.push_back(std::string("Hdr_") + band + ".csv");
    }
    std::sort(flat.begin(), flat.end());
    EXPECT_EQ(listNames(out()), flat);

    auto bin = options;
    bin.push_back("-bin");
    ASSERT_EQ(run(out() + "bin", bin).status, 0);
    const std::string dir = out() + "bin/Hdr/";
    for (const char* name : {"GEN_A_1_F.csv", "LEQ_A_10_F.csv", "LEQ1OCT_A_10_F.csv",
                             "1OCT1kHz_A_1_F.csv", "1OCT16kHz_A_1_F.csv", "LPF-1122-0_C_1_S.csv"}) {
        EXPECT_TRUE(exists(dir + name)) << name;
    }
    const auto band = headerLines(dir + "1OCT1kHz_A_1_F.csv");
    EXPECT_EQ(band[0],
              "\"Quellmark -  Type 1 Environmental Noise Logger - 1kHz Octave Band Results\"\r");
    EXPECT_EQ(band[5], "\"Frequency Weighting\",\"\",\"\",\"\",\"A\"\r");
    EXPECT_EQ(band[6], "\"Time Averaging\",\"\",\"\",\"\",\"Fast\"\r");
    EXPECT_EQ(band[7], "\"Statistical Interval\",\"\",\"\",\"\",\"1 min\"\r");
    EXPECT_EQ(band[11], "\"Short Term Leq Length\",\"\",\"\",\"\",\"Not Applicable\"\r");
    EXPECT_EQ(band[20],
              "\"Date\",\"Time\",\"Leq\",\"Lmax\",\"L1\",\"L5\",\"L10\",\"L25\",\"L50\",\"L75\","
              "\"L90\",\"L99\",\"Lmin\",\"Temp\",\"Battery\",\"Overload\"\r");
    const auto filtered = headerLines(dir + "LPF-1122-0_C_1_S.csv");
    EXPECT_EQ(filtered[0], "\"Quellmark -  Type 1 Environmental Noise Logger - LPF Results\"\r");
    EXPECT_EQ(filtered[5], "\"Frequency Weighting\",\"\",\"\",\"\",\"C\"\r");
    EXPECT_EQ(filtered[6], "\"Time Averaging\",\"\",\"\",\"\",\"Slow\"\r");
    EXPECT_EQ(filtered[20],
              "\"Date\",\"Time\",\"Leq\",\"Lmax\",\"L1\",\"L5\",\"L10\",\"L25\",\"L50\",\"L75\","
              "\"L90\",\"L99\",\"Lmin\",\"Lpeak\",\"Temp\",\"Battery\",\"Overload\"\r");
    const auto octave = headerLines(dir + "LEQ1OCT_A_10_F.csv");
    EXPECT_EQ(octave[5], "\"Frequency Weighting\",\"\",\"\",\"\",\"A\"\r");
    EXPECT_EQ(octave[6], "\"Time Averaging\",\"\",\"\",\"\",\"Fast\"\r");
    EXPECT_EQ(octave[11], "\"Short Term Leq Length\",\"\",\"\",\"\",\"10 sec\"\r");
    // Both layouts hold the same rows.
    EXPECT_EQ(readFile(dir + "1OCT1kHz_A_1_F.csv"), readFile(out() + "/Hdr_1kHz.csv"));
}

TEST_F(AudioRun, AnUnusableWaveFileCostsOnlyItsOwnSession) {
    const auto audio = toneSamples(1000.0, 1000.0, 61 * 48000);
    addSession("Good", audio);
    const std::vector<std::string> options{"-oct", "1", "Z", "F", "-i", "1", "-csv"};
    ASSERT_EQ(run(out() + "clean", options).status, 0);
    addSession("Bad", audio);  // processed first; its wave file is then made stereo
    writeWaveFile(dir_ / "sessions/Bad/data.000/20200917_080000.wav", audio,
                  WaveLayout{.channels = 2});
    const RunResult r = run(out(), options);
    ASSERT_EQ(r.status, 0);
    EXPECT_NE(r.output.find("Raw Data Disabled - Error Opening PCM Data file\r\n"),
              std::string::npos);
    EXPECT_TRUE(resultRows(out() + "/Bad_1kHz.csv").empty());
    for (const std::string& name : listNames(out() + "clean")) {
        EXPECT_EQ(readFile(out() + "/" + name), readFile(out() + "clean/" + name)) << name;
    }
}

}  // namespace
