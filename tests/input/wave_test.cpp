// Wave files: header and name rules, and the cursor that gates each record's audio.
#include <gtest/gtest.h>

#include "input/wave_cursor.h"
#include "support/test_support.h"
#include "support/wave_builder.h"

namespace {

using namespace testing_support;
using orv::AudioSpans;
using orv::WaveCursor;

TEST(WaveHeader, AcceptsTheLoggerLayoutsAndRefusesOthers) {
    const std::vector<std::int16_t> audio(10, 7);
    struct Case {
        WaveLayout layout;
        bool parses;
        std::uint32_t headerLength;
        bool analysable;
    };
    const Case cases[] = {
        {{}, true, 44, true},
        {{.listBodyBytes = 20}, true, 72, true},
        {{.listBodyBytes = 26}, false, 0, false},  // "fmt " is not where it must be
        {{.sampleRate = 44100}, true, 44, false},
        {{.channels = 2}, true, 44, false},
        {{.bitsPerSample = 24}, true, 44, false},
        {{.formatTag = 3}, true, 44, false},  // float samples
    };
    for (const Case& c : cases) {
        const std::string bytes = waveFileBytes(audio, c.layout);
        orv::WaveHeader h;
        const auto* data = reinterpret_cast<const unsigned char*>(bytes.data());
        ASSERT_EQ(orv::parseWaveHeader(data, bytes.size(), h), c.parses) << c.layout.listBodyBytes;
        if (!c.parses) continue;
        EXPECT_EQ(h.headerLength, c.headerLength);
        EXPECT_EQ(h.dataSize, 20U);
        EXPECT_EQ(orv::isAnalysableFormat(h.format), c.analysable) << c.layout.sampleRate;
    }
    orv::WaveHeader h;
    for (std::size_t n : {0, 11, 43}) {
        EXPECT_FALSE(orv::parseWaveHeader(
            reinterpret_cast<const unsigned char*>(waveFileBytes(audio).data()), n, h));
    }
}

TEST(WaveName, DateAndTimeFromTheName) {
    struct Case {
        const char* name;
        bool recording;
        const char* time;  // yyyy-mm-dd hh:mm:ss
        bool startsRecording;
    };
    const Case cases[] = {
        {"20200917_083000.wav", true, "2020-09-17 08:30:00", true},
        {"20240305_000030.wav", true, "2024-03-05 00:00:30", true},  // six digits: HHMMSS
        {"20240305_000059.WAV", true, "2024-03-05 00:00:59", true},
        {"20240305_07.wav", true, "2024-03-05 07:00:00", true},  // one or two digits: an hour
        {"20240305_7.wav", true, "2024-03-05 07:00:00", true},
        {"20240305_1230.wav", true, "2024-03-05 00:12:30", true},
        {"20200917_083000_001.wav", true, "2020-09-17 08:30:00", false},  // continuation part
        {"20200917-083000b.wav", true, "2020-09-17 08:30:00", false},
        {"notes.wav", false, "", false},
        {"20200917.wav", false, "", false},
        {"20200917_.wav", false, "", false},
        {"20201317_083000.wav", false, "", false},  // month 13
        {"20200917_250000.wav", false, "", false},  // hour 25
        {"99999999999999999999_1.wav", false, "", false},
    };
    for (const Case& c : cases) {
        orv::WaveName n;
        ASSERT_EQ(orv::parseWaveName(c.name, n), c.recording) << c.name;
        if (!c.recording) continue;
        platform::SystemTime t;
        platform::fileTimeToSystemTime(n.time, t);
        char text[64];
        std::snprintf(text, sizeof text, "%04u-%02u-%02u %02u:%02u:%02u", t.year, t.month, t.day,
                      t.hour, t.minute, t.second);
        EXPECT_EQ(std::string(text), c.time) << c.name;
        EXPECT_EQ(n.startsRecording, c.startsRecording) << c.name;
    }
}

// A session of wave files only, and records fed to a cursor.
class Cursor : public ::testing::Test {
protected:
    void addWave(const std::string& name, const std::vector<std::int16_t>& samples,
                 const WaveLayout& layout = {}) {
        writeWaveFile(dir_ / ("data.000/" + name), samples, layout);
        session_.waveFiles.push_back("data.000/" + name);
    }
    void triggered(unsigned preRecord) {
        session_.triggerOn = 1;
        session_.triggerPreRecordLength = preRecord;
    }
    WaveCursor& cursor() {
        if (!cursor_) {
            session_.sessionPath = dir_.path() + "/";
            cursor_ = std::make_unique<WaveCursor>(session_, 30, console_);
        }
        return *cursor_;
    }
    // Gates `count` records, the first ending at hh:mm:ss.t of 17/09/2020; returns for each
    // whether it was accepted, collecting the audio of the accepted ones.
    std::string gate(unsigned hh, unsigned mm, unsigned ss, unsigned tenth, std::size_t count,
                     std::vector<std::int16_t>* audio = nullptr, std::string* ends = nullptr) {
        orv::DataFileHeader h;
        h.day = 17;
        h.month = 9;
        h.year = 2020;
        std::string accepted;
        std::uint32_t slot = ((hh * 60 + mm) * 60 + ss) * 10 + tenth;
        for (std::size_t i = 0; i < count; ++i, ++slot) {
            h.hour = static_cast<std::uint16_t>(slot / 36000);
            orv::LevelRecord r;
            r.minute = static_cast<std::uint16_t>(slot / 600 % 60);
            r.second = static_cast<std::uint16_t>(slot / 10 % 60);
            r.tenth = static_cast<std::uint16_t>(slot % 10);
            AudioSpans period;
            const WaveCursor::Decision d = cursor().gate(r, h, period);
            accepted += d.accepted ? '+' : '.';
            if (ends != nullptr) *ends += d.endsBlock ? '|' : ' ';
            if (d.accepted && audio != nullptr) {
                std::vector<std::int16_t> samples(orv::kPeriodSamples);
                EXPECT_TRUE(period.read(0, samples.size(), samples.data()));
                audio->insert(audio->end(), samples.begin(), samples.end());
            }
        }
        return accepted;
    }

    TempDir dir_;
    orv::SessionRecord session_;
    std::string printed_;
    platform::Console console_{&printed_};
    std::unique_ptr<WaveCursor> cursor_;
};

TEST_F(Cursor, ContinuousAudioRunsOnAcrossFilesSkippingOverlaps) {
    // A: 5 s from 08:30:00; B starts at 08:30:02, so its first 3 s repeat the end of A.
    // C: 0.25 s, a period runs from its end into D.
    const auto a = markedSamples(1, 5 * 48000);
    const auto b = markedSamples(2, 4 * 48000);
    const auto c = markedSamples(3, 12000);
    const auto d = markedSamples(4, 48000);
    addWave("20200917_083000.wav", a);
    addWave("20200917_083002.wav", b);
    addWave("20200917_083006.wav", c);
    addWave("20200917_083007.wav", d);
    std::vector<std::int16_t> audio;
    EXPECT_EQ(gate(8, 30, 0, 1, 80, &audio), std::string(72, '+') + std::string(8, '.'));
    std::vector<std::int16_t> expected(a);
    expected.insert(expected.end(), b.begin() + 3 * 48000, b.end());
    expected.insert(expected.end(), c.begin(), c.end());
    expected.insert(expected.end(), d.begin(), d.begin() + 72 * 4800 - expected.size());
    EXPECT_TRUE(audio == expected);
    EXPECT_EQ(printed_,
              "20200917_083000.wav - 2020-09-17 08:30:00.00 -> 2020-09-17 08:30:05.00\r\n"
              "20200917_083002.wav - 2020-09-17 08:30:02.00 -> 2020-09-17 08:30:06.00\r\n"
              "20200917_083006.wav - 2020-09-17 08:30:06.00 -> 2020-09-17 08:30:06.00\r\n"
              "20200917_083007.wav - 2020-09-17 08:30:07.00 -> 2020-09-17 08:30:08.00\r\n");
}

TEST_F(Cursor, FileProblemsInContinuousAudio) {
    // A stray file is skipped; a size mismatch is reported and the file length used; a LIST
    // chunk moves the audio; a file that cannot be used stops the session's audio.
    const auto a = markedSamples(1, 48000);
    const auto b = markedSamples(2, 48000);
    writeFile(dir_ / "data.000/notes.wav", "text");
    session_.waveFiles.push_back("data.000/notes.wav");
    addWave("20200917_083000.wav", a, {.dataSizeDelta = 4000});
    addWave("20200917_083001.wav", b, {.listBodyBytes = 20});
    addWave("20200917_083002.wav", b, {.sampleRate = 44100});
    addWave("20200917_083003.wav", b);
    std::vector<std::int16_t> audio;
    EXPECT_EQ(gate(8, 30, 0, 1, 25, &audio), std::string(20, '+') + std::string(5, '.'));
    std::vector<std::int16_t> expected(a);
    expected.insert(expected.end(), b.begin(), b.end());
    EXPECT_TRUE(audio == expected);
    EXPECT_TRUE(cursor().stopped());
    EXPECT_EQ(printed_,
              "ERR: data.000/notes.wav is not a recording - skipped\r\n"
              "\rERR: File size mismatch on data.000/20200917_083000.wav\r\n"
              "20200917_083000.wav - 2020-09-17 08:30:00.00 -> 2020-09-17 08:30:01.00\r\n"
              "20200917_083001.wav - 2020-09-17 08:30:01.00 -> 2020-09-17 08:30:02.00\r\n"
              "ERR: data.000/20200917_083002.wav is not 48 kHz 16-bit mono PCM audio\r\n"
              "Raw Data Disabled - Error Opening PCM Data file\r\n");
}

TEST_F(Cursor, TriggeredRecordingsTakeTheRecordsOfTheirRange) {
    // Pre-record 2 s. Recording 1: named 08:30:02, 2 s in two parts of 1 s, so its range is
    // (08:30:00, 08:30:02]. Recording 2: named 08:30:05, range (08:30:03, 08:30:04].
    // Recording 3 follows it directly: (08:30:04, 08:30:05]. A bad file between them.
    triggered(2);
    const auto a1 = markedSamples(1, 48000);
    const auto a2 = markedSamples(2, 48000);
    const auto b = markedSamples(3, 48000);
    const auto c = markedSamples(4, 48000);
    addWave("20200917_083002.wav", a1);
    addWave("20200917_083002_001.wav", a2);
    addWave("20200917_083003.wav", b, {.channels = 2});
    addWave("20200917_083005.wav", b);
    addWave("20200917_083006.wav", c);
    std::vector<std::int16_t> audio;
    std::string ends;
    const std::string accepted = gate(8, 30, 0, 0, 56, &audio, &ends);
    // 08:30:00.0 (exactly at the start) is refused, 08:30:02.0 (exactly at the end) taken.
    EXPECT_EQ(accepted, "." + std::string(20, '+') + std::string(10, '.') + std::string(20, '+') +
                            std::string(5, '.'));
    std::string expectedEnds(56, ' ');
    for (std::size_t i : {21, 41, 51}) expectedEnds[i] = '|';
    EXPECT_EQ(ends, expectedEnds);
    std::vector<std::int16_t> expected(a1);
    for (const auto* part : {&a2, &b, &c})
        expected.insert(expected.end(), part->begin(), part->end());
    EXPECT_TRUE(audio == expected);
    EXPECT_EQ(printed_,
              "20200917_083002.wav - 2020-09-17 08:30:00.00 -> 2020-09-17 08:30:01.00\r\n"
              "20200917_083002_001.wav - 2020-09-17 08:30:01.00 -> 2020-09-17 08:30:02.00\r\n"
              "ERR: data.000/20200917_083003.wav is not 48 kHz 16-bit mono PCM audio\r\n"
              "Raw Data Disabled - Error Opening PCM Data file\r\n"
              "20200917_083005.wav - 2020-09-17 08:30:03.00 -> 2020-09-17 08:30:04.00\r\n"
              "20200917_083006.wav - 2020-09-17 08:30:04.00 -> 2020-09-17 08:30:05.00\r\n");
}

TEST_F(Cursor, PreRollIsTheSameRecordingsLatestAudio) {
    triggered(0);
    addWave("20200917_083001.wav", markedSamples(1, 5 * 48000));
    addWave("20200917_083010.wav", markedSamples(2, 48000));
    gate(8, 30, 0, 1, 45);  // 4.5 s of the first recording, after 0.9 s of nothing
    AudioSpans audio;
    std::vector<std::uint32_t> marks;
    cursor().precedingAudio(audio, marks);
    // The 3 s kept before the latest period: 0.4 s .. 3.4 s of the recording.
    ASSERT_EQ(audio.samples(), 30U * 4800);
    EXPECT_EQ(marks.size(), 30U);
    EXPECT_EQ(audio.spans().front().offset, 44U + 4 * 9600);
    gate(8, 30, 10, 1, 1);  // the next recording starts afresh
    cursor().precedingAudio(audio, marks);
    EXPECT_TRUE(audio.empty());
}

}  // namespace
