#include "input/wave_cursor.h"

#include <algorithm>
#include <array>

#include "platform/error_text.h"

namespace orv {
namespace {

constexpr std::uint64_t kPeriodBytes = std::uint64_t{kPeriodSamples} * kBytesPerSample;
constexpr std::uint64_t kBytesPerSecond = std::uint64_t{kWaveSampleRate} * kBytesPerSample;
constexpr platform::FileTime kTicksPerPeriod = platform::kTicksPerSecond / 10;

// The name of a listed wave file without its data directory.
std::string_view baseName(const std::string& path) {
    const std::size_t slash = path.find_last_of("/\\");
    return slash == std::string::npos ? std::string_view(path)
                                      : std::string_view(path).substr(slash + 1);
}

}  // namespace

bool recordEndTime(const DataFileHeader& header, const LevelRecord& r, platform::FileTime& out) {
    platform::SystemTime t;
    t.year = header.year;
    t.month = header.month;
    t.day = header.day;
    t.hour = header.hour;
    t.minute = r.minute;
    t.second = r.second;
    t.milliseconds = static_cast<std::uint16_t>(r.tenth * 100U);
    return r.tenth <= 9 && platform::systemTimeToFileTime(t, out);
}

WaveCursor::WaveCursor(const SessionRecord& session, std::size_t historyPeriods,
                       platform::Console& out)
    : session_(session),
      out_(out),
      triggered_(session.triggerOn != 0),
      preRecord_(std::uint64_t{session.triggerPreRecordLength} * platform::kTicksPerSecond),
      historyPeriods_(historyPeriods) {}

void WaveCursor::printTime(platform::FileTime t, const char* end) {
    platform::SystemTime s;
    platform::fileTimeToSystemTime(t, s);
    out_.print("%04u-%02u-%02u %02u:%02u:%02u.%02u%s", s.year, s.month, s.day, s.hour, s.minute,
               s.second, s.milliseconds, end);
}

void WaveCursor::closeFile() { file_.reset(); }

WaveCursor::Open WaveCursor::openNext() {
    closeFile();
    while (nextFile_ < session_.waveFileCount()) {
        const std::string& listed = session_.waveFiles[nextFile_++];
        const std::string_view name = baseName(listed);
        WaveName stamp;
        if (!parseWaveName(name, stamp)) {
            out_.print("ERR: %s is not a recording - skipped\r\n", listed.c_str());
            continue;
        }
        auto source = std::make_shared<WaveSource>();
        source->name = listed;
        int error = 0;
        source->file = platform::openForRead(session_.sessionPath + listed, &error);
        if (!source->file.valid()) {
            out_.print("ERR: Unable to open %s : %s\r\n", listed.c_str(),
                       platform::errorText(error).c_str());
            return Open::Failed;
        }
        std::array<unsigned char, kMaxWaveHeaderLength> bytes{};
        const std::size_t got = source->file.readAt(0, bytes.data(), bytes.size());
        WaveHeader header;
        const std::uint64_t fileSize = source->file.size();
        if (!parseWaveHeader(bytes.data(), got, header) || fileSize < header.headerLength) {
            out_.print("ERR: %s has no valid wave header\r\n", listed.c_str());
            return Open::Failed;
        }
        std::uint64_t dataBytes = header.dataSize;
        if (dataBytes != fileSize - header.headerLength) {
            out_.print("\rERR: File size mismatch on %s\r\n", listed.c_str());
            dataBytes = fileSize - header.headerLength;
        }
        if (!isAnalysableFormat(header.format)) {
            out_.print("ERR: %s is not 48 kHz 16-bit mono PCM audio\r\n", listed.c_str());
            return Open::Failed;
        }

        const std::uint64_t seconds = dataBytes / kBytesPerSecond;
        // A continuation part follows the parts before it: it starts where their audio ends.
        platform::FileTime start = stamp.time;
        if (stamp.startsRecording) {
            continuationSeconds_ = seconds;
        } else {
            start += continuationSeconds_ * platform::kTicksPerSecond;
            continuationSeconds_ += seconds;
        }
        start = start > preRecord_ ? start - preRecord_ : 0;
        out_.print("%.*s - ", static_cast<int>(name.size()), name.data());
        printTime(start, " -> ");
        const std::uint64_t overlapSeconds =
            hasPrevious_ && previousEnd_ > start
                ? (previousEnd_ - start) / platform::kTicksPerSecond
                : 0;
        startTime_ = start;
        endTime_ = start + seconds * platform::kTicksPerSecond;
        previousEnd_ = endTime_;
        hasPrevious_ = true;
        printTime(endTime_, "\r\n");

        file_ = std::move(source);
        ++fileSerial_;
        fileStartsRecording_ = stamp.startsRecording;
        audioStart_ = header.headerLength;
        audioEnd_ = audioStart_ + dataBytes;
        // The audio that a previous file already covered is skipped; an overlap as long
        // as the file leaves none of it.
        position_ = audioStart_ + std::min(overlapSeconds * kBytesPerSecond, dataBytes);
        return Open::Opened;
    }
    return Open::NoneLeft;
}

WaveCursor::Decision WaveCursor::gate(const LevelRecord& r, const DataFileHeader& header,
                                      AudioSpans& period) {
    period.clear();
    if (triggered_) return gateTriggered(r, header, period);
    Decision d = gateContinuous(period);
    return finish(d.accepted, wasInRange_, r.cond2Mark, period);
}

WaveCursor::Decision WaveCursor::gateContinuous(AudioSpans& period) {
    std::uint64_t need = kPeriodSamples;
    while (need > 0 && !stopped_) {
        if (!file_ || audioEnd_ - position_ < kBytesPerSample) {
            const Open result = openNext();
            if (result == Open::NoneLeft) break;
            if (result == Open::Failed) {
                // The audio after a gap cannot be placed against the records any more.
                out_.print("Raw Data Disabled - Error Opening PCM Data file\r\n");
                stopped_ = true;
                break;
            }
            continue;
        }
        const std::uint64_t take = std::min(need, (audioEnd_ - position_) / kBytesPerSample);
        period.append(file_, position_, take);
        position_ += take * kBytesPerSample;
        need -= take;
    }
    // Without a whole period of audio the record takes none.
    return Decision{need == 0, false};
}

WaveCursor::Decision WaveCursor::gateTriggered(const LevelRecord& r, const DataFileHeader& header,
                                               AudioSpans& period) {
    platform::FileTime t = 0;
    const bool timed = recordEndTime(header, r, t);
    // Files whose range the records have passed are done with; a file that cannot be used
    // costs only the records of its own range.
    while (timed && (!file_ || t > endTime_)) {
        const Open result = openNext();
        if (result == Open::NoneLeft) break;
        if (result == Open::Failed) {
            out_.print("Raw Data Disabled - Error Opening PCM Data file\r\n");
        }
    }
    bool accepted = false;
    if (timed && file_ && t > startTime_ && t <= endTime_) {
        const std::uint64_t index = (t - startTime_) / kTicksPerPeriod - 1;
        const std::uint64_t offset = audioStart_ + index * kPeriodBytes;
        if (offset >= position_ && offset + kPeriodBytes <= audioEnd_) {
            period.append(file_, offset, kPeriodSamples);
            accepted = true;
        }
    }
    // A recording goes on over its continuation parts; a file that starts a recording
    // starts a new one even when it follows the previous without a gap.
    const bool continues =
        wasInRange_ && (fileSerial_ == lastFileSerial_ || (file_ && !fileStartsRecording_));
    return finish(accepted, continues, r.cond2Mark, period);
}

WaveCursor::Decision WaveCursor::finish(bool accepted, bool continuesRecording, std::uint32_t mark,
                                        const AudioSpans& period) {
    Decision d;
    d.accepted = accepted;
    d.continuesRecording = accepted && continuesRecording;
    if (accepted) {
        if (!continuesRecording) history_.clear();
        history_.push_back(PastPeriod{period, mark});
        if (history_.size() > historyPeriods_ + 1) history_.pop_front();
        lastFileSerial_ = fileSerial_;
        d.endsBlock = triggered_ && wasInRange_ && !continuesRecording;
    } else {
        history_.clear();
        lastFileSerial_ = 0;
        d.endsBlock = triggered_ && wasInRange_;
    }
    wasInRange_ = accepted;
    return d;
}

void WaveCursor::precedingAudio(AudioSpans& audio, std::vector<std::uint32_t>& marks) const {
    audio.clear();
    marks.clear();
    if (history_.size() < 2) return;
    for (std::size_t i = 0; i + 1 < history_.size(); ++i) {
        audio.append(history_[i].audio);
        marks.push_back(history_[i].mark);
    }
}

}  // namespace orv
