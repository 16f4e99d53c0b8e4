#include "input/wave_file.h"

#include <algorithm>
#include <cstring>

#include "sessions/decimal_number.h"

namespace orv {
namespace {

std::uint16_t u16At(const unsigned char* p) {
    return static_cast<std::uint16_t>(p[0] | (p[1] << 8));
}

std::uint32_t u32At(const unsigned char* p) {
    return static_cast<std::uint32_t>(p[0]) | (static_cast<std::uint32_t>(p[1]) << 8) |
           (static_cast<std::uint32_t>(p[2]) << 16) | (static_cast<std::uint32_t>(p[3]) << 24);
}

bool hasId(const unsigned char* p, const char* id) { return std::memcmp(p, id, 4) == 0; }

char lower(char c) { return c >= 'A' && c <= 'Z' ? static_cast<char>(c - 'A' + 'a') : c; }

// A run of decimal digits from `pos`; false when there is none. Values beyond 32 bits are
// kept at 2^32 - 1, which no valid date or time reaches.
bool readDigits(std::string_view s, std::size_t& pos, std::uint32_t& value, std::size_t& digits) {
    const std::size_t start = pos;
    std::uint64_t v = 0;
    while (pos < s.size() && isDecimalDigit(s[pos])) {
        v = std::min<std::uint64_t>(v * 10 + static_cast<std::uint64_t>(s[pos] - '0'), 0xFFFFFFFF);
        ++pos;
    }
    digits = pos - start;
    value = static_cast<std::uint32_t>(v);
    return digits > 0;
}

}  // namespace

bool parseWaveHeader(const unsigned char* data, std::size_t length, WaveHeader& out) {
    if (length < 12 || !hasId(data, "RIFF")) return false;
    std::size_t fmt = 12;
    if (length >= 20 && hasId(data + 12, "LIST")) fmt = 40;  // id, size and a 20-byte body
    if (length < fmt + 32 || !hasId(data + fmt, "fmt ")) return false;
    const unsigned char* f = data + fmt + 8;
    out.format.formatTag = u16At(f);
    out.format.channels = u16At(f + 2);
    out.format.sampleRate = u32At(f + 4);
    out.format.byteRate = u32At(f + 8);
    out.format.blockAlign = u16At(f + 12);
    out.format.bitsPerSample = u16At(f + 14);
    // The data chunk follows the 16-byte format body; its id is not looked at.
    out.dataSize = u32At(data + fmt + 28);
    out.headerLength = static_cast<std::uint32_t>(fmt + 32);
    return true;
}

bool isAnalysableFormat(const WaveFormat& f) {
    return f.formatTag == 1 && f.channels == 1 && f.bitsPerSample == 16 &&
           f.sampleRate == kWaveSampleRate && f.blockAlign == kBytesPerSample &&
           f.byteRate == kWaveSampleRate * kBytesPerSample;
}

bool parseWaveName(std::string_view name, WaveName& out) {
    std::size_t pos = 0;
    std::uint32_t date = 0;
    std::uint32_t time = 0;
    std::size_t dateDigits = 0;
    std::size_t timeDigits = 0;
    if (!readDigits(name, pos, date, dateDigits) || pos == name.size()) return false;
    ++pos;  // the separator
    if (!readDigits(name, pos, time, timeDigits)) return false;

    platform::SystemTime t;
    t.year = static_cast<std::uint16_t>(std::min<std::uint32_t>(date / 10000, 0xFFFF));
    t.month = static_cast<std::uint16_t>(date % 10000 / 100);
    t.day = static_cast<std::uint16_t>(date % 100);
    if (timeDigits == 6 || (timeDigits > 2 && time > 59)) {
        t.hour = static_cast<std::uint16_t>(std::min<std::uint32_t>(time / 10000, 0xFFFF));
        t.minute = static_cast<std::uint16_t>(time % 10000 / 100);
        t.second = static_cast<std::uint16_t>(time % 100);
    } else {
        t.hour = static_cast<std::uint16_t>(std::min<std::uint32_t>(time, 0xFFFF));
    }
    if (!platform::systemTimeToFileTime(t, out.time)) return false;

    constexpr std::string_view kExtension = ".wav";
    out.startsRecording = name.size() - pos >= kExtension.size();
    for (std::size_t i = 0; out.startsRecording && i < kExtension.size(); ++i) {
        out.startsRecording = lower(name[pos + i]) == kExtension[i];
    }
    return true;
}

void AudioSpans::append(const std::shared_ptr<const WaveSource>& source, std::uint64_t offset,
                        std::uint64_t samples) {
    if (samples == 0) return;
    samples_ += samples;
    if (!spans_.empty()) {
        AudioSpan& last = spans_.back();
        if (last.source == source && last.offset + last.samples * kBytesPerSample == offset) {
            last.samples += samples;
            return;
        }
    }
    spans_.push_back(AudioSpan{source, offset, samples});
}

void AudioSpans::append(const AudioSpans& other) {
    for (const AudioSpan& s : other.spans_) append(s.source, s.offset, s.samples);
}

void AudioSpans::clear() {
    spans_.clear();
    samples_ = 0;
}

bool AudioSpans::read(std::uint64_t first, std::size_t count, std::int16_t* out,
                      std::string* failed, int* error) const {
    std::uint64_t skip = first;
    for (const AudioSpan& s : spans_) {
        if (count == 0) break;
        if (skip >= s.samples) {
            skip -= s.samples;
            continue;
        }
        const std::size_t n =
            static_cast<std::size_t>(std::min<std::uint64_t>(s.samples - skip, count));
        const std::size_t bytes = n * kBytesPerSample;
        int code = 0;
        if (s.source->file.readAt(s.offset + skip * kBytesPerSample, out, bytes, &code) != bytes) {
            if (failed != nullptr) *failed = s.source->name;
            if (error != nullptr) *error = code;
            return false;
        }
        out += n;
        count -= n;
        skip = 0;
    }
    if (count != 0) {
        if (failed != nullptr)
            *failed = spans_.empty() ? std::string() : spans_.back().source->name;
        if (error != nullptr) *error = 0;
        return false;
    }
    return true;
}

}  // namespace orv
