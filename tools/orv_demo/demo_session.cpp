#include "demo_session.h"

#include <algorithm>
#include <cctype>
#include <cmath>
#include <cstdio>
#include <filesystem>
#include <fstream>
#include <memory>
#include <stdexcept>

#include "dsp.h"
#include "level_meter.h"
#include "session_files.h"
#include "sound_scene.h"
#include "wave_writer.h"

namespace orv_demo {
namespace {

namespace fs = std::filesystem;

constexpr const char* kDataDir = "data.000";
constexpr const char* kSerialNumber = "TL40217";
constexpr int kOverloadSample = 27600;  // raw sample magnitude above which a period overloads
constexpr std::int64_t kMaxPartSeconds = 21600;  // 6 h: 2 GB, well inside the RIFF size field
constexpr std::int64_t kMaxParts = 1000;         // first part and parts _001 to _999
constexpr std::int64_t kWarmUpRecords = 10;      // audio run before a recording to settle the meter
constexpr std::int64_t kBlockRecords = 10;

// A reader takes a time field of 59 or less in a wave file name as an hour, so a recording
// named 00:00:01 to 00:00:59 would be placed at 01:00:00 to 59:00:00; such names are not
// written.
bool nameReadAsHour(std::int64_t nameTime) {
    const std::int64_t ofDay = nameTime % 86400;
    return ofDay >= 1 && ofDay <= 59;
}

unsigned preRecordOf(const DemoOptions& o) {
    if (o.preRecordSeconds >= 0) return static_cast<unsigned>(o.preRecordSeconds);
    return o.triggered ? 5U : 0U;
}

std::int64_t untriggeredAudioSeconds(const DemoOptions& o) {
    if (!o.audio || o.triggered) return 0;
    return o.waveMinutes < 0 ? o.durationSeconds : std::min(o.durationSeconds, o.waveMinutes * 60);
}

SceneSettings sceneSettings(const DemoOptions& o, std::int64_t startSeconds) {
    SceneSettings s;
    s.seed = o.seed;
    s.startSecondOfDay = static_cast<double>(startSeconds % 86400);
    s.durationSeconds = static_cast<double>(o.durationSeconds);
    if (o.triggered) {
        // Room for the pre-record before the first trigger, and pass-bys far enough apart
        // for their recordings (pre-record, trigger 3 tau before the peak, up to 16 s after
        // the trigger) not to overlap.
        s.firstPassByAfter = preRecordOf(o) + 10.0;
        s.minPassBySpacing = preRecordOf(o) + 25.0;
    }
    return s;
}

// Adds a recording of `seconds` from record `firstRecord` on, named with `nameTime`.
void addRecording(SessionPlan& plan, const DemoOptions& o, std::int64_t firstRecord,
                  std::int64_t seconds, std::int64_t nameTime) {
    Recording r;
    r.firstRecord = firstRecord;
    r.endRecord = firstRecord + seconds * 10;
    const std::int64_t partSeconds = o.splitSeconds > 0 ? o.splitSeconds : seconds;
    const CivilTime name = fromSeconds(nameTime);
    for (std::int64_t done = 0, part = 0; done < seconds; done += partSeconds, ++part) {
        WavePart p;
        p.name = waveFileName(name, static_cast<unsigned>(part));
        p.firstRecord = firstRecord + done * 10;
        p.recordCount = std::min(partSeconds, seconds - done) * 10;
        r.parts.push_back(p);
    }
    plan.recordings.push_back(r);
}

// Record i of a session covers the audio from i x 0.1 s to (i + 1) x 0.1 s after the start
// and is stamped with the end of that period, as intervals are: a session starting at
// 12:58:00 begins with the record 58:0.1 and its minute closes with the record 59:0.0.
// This is also how a reader pairs records with audio: in an untriggered session every
// record takes the next 100 ms of the wave files from the first record on; in a triggered
// session a file covers the records whose stamps t satisfy start < t <= start + duration,
// start being its name time less the pre-record length, so its audio begins at its start.
SessionPlan planSession(const DemoOptions& o, const SoundScene& scene) {
    SessionPlan plan;
    plan.sessionDir = o.outDir + "/" + o.name;
    plan.startSeconds = *toSeconds(o.start);
    plan.recordCount = o.durationSeconds * 10;
    plan.preRecordSeconds = preRecordOf(o);
    char calibration[32];
    std::snprintf(calibration, sizeof calibration, "%.2f", o.calibration);
    plan.calibrationText = calibration;
    const auto pre = static_cast<std::int64_t>(plan.preRecordSeconds);

    if (const std::int64_t seconds = untriggeredAudioSeconds(o); seconds > 0)
        addRecording(plan, o, 0, seconds, plan.startSeconds + pre);
    if (o.audio && o.triggered) {
        for (const PassBy& p : scene.passBys()) {
            // The level passes the trigger threshold 10 dB below the peak, 3 tau before it;
            // recording goes on for 8 s after the level has fallen back there.
            const auto trigger = static_cast<std::int64_t>(std::floor(p.peakTime - 3.0 * p.tau));
            const auto after = static_cast<std::int64_t>(std::ceil(3.0 * p.tau)) + 8;
            const std::int64_t start = trigger - pre;
            const std::int64_t seconds = pre + after;
            const std::int64_t first = start * 10;
            if (start < 0 || first + seconds * 10 > plan.recordCount) continue;
            if (!plan.recordings.empty() && first < plan.recordings.back().endRecord) continue;
            if (nameReadAsHour(plan.startSeconds + trigger)) continue;
            addRecording(plan, o, first, seconds, plan.startSeconds + trigger);
        }
    }
    return plan;
}

bool hasExtension(const fs::path& p, const char* ext) {
    std::string e = p.extension().string();
    std::transform(e.begin(), e.end(), e.begin(),
                   [](unsigned char c) { return static_cast<char>(std::tolower(c)); });
    return e == ext;
}

// Removes the files an earlier run may have left: information files, level and wave files.
void clearSessionFiles(const fs::path& sessionDir) {
    const auto removeMatching = [](const fs::path& dir, std::initializer_list<const char*> exts) {
        std::error_code ec;
        if (!fs::is_directory(dir, ec)) return;
        for (const fs::directory_entry& e : fs::directory_iterator(dir)) {
            if (!e.is_regular_file()) continue;
            for (const char* ext : exts)
                if (hasExtension(e.path(), ext)) fs::remove(e.path());
        }
    };
    removeMatching(sessionDir, {".inf"});
    removeMatching(sessionDir / kDataDir, {".csv", ".wav"});
}

void writeText(const std::string& path, const std::string& text) {
    std::ofstream file(path, std::ios::binary | std::ios::trunc);
    file.write(text.data(), static_cast<std::streamsize>(text.size()));
    file.close();
    if (!file) throw std::runtime_error("cannot write " + path);
}

// Everything that turns the scene into files, for one session.
class SessionWriter {
public:
    SessionWriter(const DemoOptions& o, const SessionPlan& plan, const SoundScene& scene)
        : options_(o),
          plan_(plan),
          scene_(scene),
          response_(measureSourceResponse()),
          gain_(static_cast<float>(std::pow(
              10.0, static_cast<double>(0.05F * readDecimalAsLogger(plan.calibrationText))))),
          levels_(plan.sessionDir + "/" + kDataDir, o.name, kSerialNumber,
                  plan.startSeconds * 10 + 1, o.seed),
          model_(scene, response_, o.seed) {}

    void run(DemoSummary& summary) {
        std::int64_t record = 0;
        for (const Recording& r : plan_.recordings) {
            for (; record < r.firstRecord; ++record) modelRecord(record);
            model_.continueFrom(renderRecording(r));
            record = r.endRecord;
            summary.audioSeconds += (r.endRecord - r.firstRecord) / 10;
        }
        for (; record < plan_.recordCount; ++record) modelRecord(record);
        levels_.finish();
        summary.levelFiles = levels_.fileNames();
        summary.overloadedRecords = overloaded_;
    }

private:
    // Battery: falling steadily from 12.8 V to 12.6 V over the session.
    float battery(std::int64_t record) const {
        return 12.8F - 0.2F * static_cast<float>(record) / static_cast<float>(plan_.recordCount);
    }

    void addRow(std::int64_t record, const PeriodPowers& p, bool overload) {
        LevelRow row;
        row.splA = SlmLibrary::Dsp::powerToDb(p.splA);
        row.splC = SlmLibrary::Dsp::powerToDb(p.splC);
        row.leqA = SlmLibrary::Dsp::powerToDb(p.leqA);
        row.leqC = SlmLibrary::Dsp::powerToDb(p.leqC);
        row.condition = overload ? 3U : 0U;
        row.battery = battery(record);
        levels_.add(row);
        if (overload) ++overloaded_;
    }

    void modelRecord(std::int64_t record) {
        double peak = 0.0;
        const PeriodPowers p = model_.next(record, peak);
        addRow(record, p, peak / gain_ > kOverloadSample);
    }

    // Synthesises the recording's audio (after a warm-up second that settles the meter's
    // filters), writes it into the recording's wave files and the levels measured on the
    // written samples into the level files. Returns the powers of the last period.
    PeriodPowers renderRecording(const Recording& r) {
        constexpr std::size_t kBlock = kBlockRecords * kPeriodSamples;
        const std::int64_t warmFrom = r.firstRecord - kWarmUpRecords;
        AudioSynth synth(scene_, response_, options_.seed,
                         warmFrom * static_cast<std::int64_t>(kPeriodSamples));
        LevelMeter meter;
        std::vector<float> pressure(kBlock), calibrated(kBlock);
        std::vector<std::int16_t> samples(kBlock);
        std::vector<PeriodPowers> powers;
        const double toRaw = 1.0 / static_cast<double>(gain_);
        std::unique_ptr<WaveWriter> wave;
        std::size_t part = 0;
        PeriodPowers last;
        for (std::int64_t block = warmFrom; block < r.endRecord; block += kBlockRecords) {
            const auto periods =
                static_cast<std::size_t>(std::min(kBlockRecords, r.endRecord - block));
            const std::size_t count = periods * kPeriodSamples;
            synth.render(pressure.data(), count);
            std::array<int, kBlockRecords> peak{};
            for (std::size_t i = 0; i < count; ++i) {
                const double raw = std::nearbyint(static_cast<double>(pressure[i]) * toRaw);
                const auto s = static_cast<std::int16_t>(std::clamp(raw, -32768.0, 32767.0));
                samples[i] = s;
                // As the reader conditions a sample of a period without a range mark.
                calibrated[i] = static_cast<float>(s) * gain_;
                int& p = peak[i / kPeriodSamples];
                p = std::max(p, std::abs(static_cast<int>(s)));
            }
            powers.clear();
            meter.process(calibrated.data(), count, powers);
            for (std::size_t k = 0; k < periods; ++k) {
                const std::int64_t record = block + static_cast<std::int64_t>(k);
                if (record < r.firstRecord) continue;
                addRow(record, powers[k], peak[k] > kOverloadSample);
                while (!wave || record >= r.parts[part].firstRecord + r.parts[part].recordCount) {
                    if (wave) {
                        wave->close();
                        ++part;
                    }
                    wave = std::make_unique<WaveWriter>(plan_.sessionDir + "/" + kDataDir + "/" +
                                                        r.parts[part].name);
                }
                wave->write(samples.data() + k * kPeriodSamples, kPeriodSamples);
            }
            last = powers.back();
        }
        if (wave) wave->close();
        return last;
    }

    const DemoOptions& options_;
    const SessionPlan& plan_;
    const SoundScene& scene_;
    SourceResponse response_;
    float gain_;
    HourlyLevelWriter levels_;
    LevelModel model_;
    std::int64_t overloaded_ = 0;
};

bool nameIsUsable(const std::string& name) {
    if (name.empty() || name.size() > 79 || name == "." || name == "..") return false;
    return std::none_of(name.begin(), name.end(), [](unsigned char c) {
        return c < 0x20 || c == '/' || c == '\\' || c == ',' || c == 0x7F;
    });
}

}  // namespace

std::string checkOptions(const DemoOptions& o) {
    if (!nameIsUsable(o.name))
        return "the session name must be 1 to 79 characters without '/', '\\' or ','";
    if (o.start.year < 1980 || o.start.year > 2099 || !toSeconds(o.start))
        return "the start must be a valid time in the years 1980 to 2099";
    if (o.durationSeconds < 1 || o.durationSeconds > 14 * 86400)
        return "the duration must be 1 to 1209600 seconds (14 days)";
    if (!(o.calibration >= 0.0 && o.calibration < 100.0))
        return "the calibration must be at least 0 and below 100 dB (the information file "
               "holds no sign)";
    if (o.preRecordSeconds > 60) return "the pre-record length must be 0 to 60 seconds";
    if (o.splitSeconds < 0) return "the split length must be a positive number of seconds";
    if (o.triggered && o.waveMinutes >= 0)
        return "--wave-minutes applies to untriggered sessions only";
    if (const std::int64_t seconds = untriggeredAudioSeconds(o); seconds > 0) {
        const std::int64_t part = o.splitSeconds > 0 ? o.splitSeconds : seconds;
        if (std::min(part, seconds) > kMaxPartSeconds)
            return "a wave file holds at most 6 hours: use --split-wave, --wave-minutes or "
                   "--no-audio";
        if ((seconds + part - 1) / part > kMaxParts)
            return "a recording may be split into at most 1000 wave files";
        if (toSeconds(o.start) && nameReadAsHour(*toSeconds(o.start) + preRecordOf(o)))
            return "a wave file named 00:00:01 to 00:00:59 would be read as an hour: choose "
                   "another start or pre-record length";
    }
    return {};
}

DemoSummary generateDemoSession(const DemoOptions& options) {
    if (const std::string problem = checkOptions(options); !problem.empty())
        throw std::runtime_error(problem);
    const std::int64_t startSeconds = *toSeconds(options.start);
    const SoundScene scene(sceneSettings(options, startSeconds));
    DemoSummary summary;
    summary.plan = planSession(options, scene);
    summary.passBys = static_cast<std::size_t>(
        std::count_if(scene.passBys().begin(), scene.passBys().end(), [&](const PassBy& p) {
            return p.peakTime < static_cast<double>(options.durationSeconds);
        }));
    const SessionPlan& plan = summary.plan;

    const fs::path dir(plan.sessionDir);
    std::error_code ec;
    fs::create_directories(dir / kDataDir, ec);
    if (ec)
        throw std::runtime_error("cannot create " + (dir / kDataDir).string() + ": " +
                                 ec.message());
    clearSessionFiles(dir);

    SessionInfo info;
    info.name = options.name;
    info.start = options.start;
    info.end = fromSeconds(startSeconds + options.durationSeconds);
    info.calibration = plan.calibrationText;
    info.triggered = options.triggered;
    info.preRecordSeconds = plan.preRecordSeconds;
    writeText((dir / (options.name + ".inf")).string(), infoFileText(info));

    SessionWriter writer(options, plan, scene);
    writer.run(summary);
    return summary;
}

}  // namespace orv_demo
