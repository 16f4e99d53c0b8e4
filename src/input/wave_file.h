// Wave files of a session: the header, the start time carried in the name, and the audio
// of a run of periods as positions in one or more open files.
#pragma once

#include <cstddef>
#include <cstdint>
#include <memory>
#include <string>
#include <string_view>
#include <vector>

#include "platform/civil_time.h"
#include "platform/files.h"

namespace orv {

inline constexpr std::uint32_t kWaveSampleRate = 48000;
inline constexpr std::uint32_t kPeriodSamples = 4800;  // 100 ms, one level record
inline constexpr std::uint32_t kBytesPerSample = 2;

struct WaveFormat {
    std::uint16_t formatTag = 0;
    std::uint16_t channels = 0;
    std::uint32_t sampleRate = 0;
    std::uint32_t byteRate = 0;
    std::uint16_t blockAlign = 0;
    std::uint16_t bitsPerSample = 0;
};

struct WaveHeader {
    WaveFormat format;
    std::uint32_t headerLength = 0;  // 44, or 72 with a LIST chunk
    std::uint32_t dataSize = 0;      // as the data chunk states it
};

// The most bytes parseWaveHeader looks at.
inline constexpr std::size_t kMaxWaveHeaderLength = 72;

// Reads the header at the start of a wave file: "RIFF", an optional LIST chunk with a body
// of exactly 20 bytes, a "fmt " chunk taken as 16 bytes, and the data chunk's size. False
// when the bytes are not such a header (too short, no "RIFF", no "fmt " where expected).
bool parseWaveHeader(const unsigned char* data, std::size_t length, WaveHeader& out);

// Audio we can analyse: PCM, one channel, 16 bits, 48000 Hz, with the byte rate and block
// alignment that go with them.
bool isAnalysableFormat(const WaveFormat& format);

// The start time in a wave file name (without its directory): a decimal date YYYYMMDD, one
// separator, a decimal time, then ".wav" for the first file of a recording or more text for
// a continuation part. A time of exactly six digits is HHMMSS; a time of one or two digits
// is an hour; other lengths are HHMMSS when above 59, else an hour.
struct WaveName {
    platform::FileTime time = 0;
    bool startsRecording = false;
};
// False when the name does not carry a valid date and time.
bool parseWaveName(std::string_view fileName, WaveName& out);

// An open wave file from which the blocks that took its audio read by position. The cursor
// and those blocks share it; it is closed when the last of them lets go.
struct WaveSource {
    std::string name;  // as listed in the session, for messages
    platform::File file;
};

// Samples of one file: `samples` 16-bit samples from byte `offset` on.
struct AudioSpan {
    std::shared_ptr<const WaveSource> source;
    std::uint64_t offset = 0;
    std::uint64_t samples = 0;
};

// A run of audio made of spans of one or more files, read as one sequence of samples.
class AudioSpans {
public:
    // Appends samples; a span that continues the last one in the same file extends it.
    void append(const std::shared_ptr<const WaveSource>& source, std::uint64_t offset,
                std::uint64_t samples);
    void append(const AudioSpans& other);
    void clear();
    bool empty() const { return spans_.empty(); }
    std::uint64_t samples() const { return samples_; }
    const std::vector<AudioSpan>& spans() const { return spans_; }

    // Reads samples [first, first + count) into `out`. False when a read falls short; then
    // `failed` names the file and `error` holds the system's error code (0 at an early end).
    bool read(std::uint64_t first, std::size_t count, std::int16_t* out,
              std::string* failed = nullptr, int* error = nullptr) const;

private:
    std::vector<AudioSpan> spans_;
    std::uint64_t samples_ = 0;
};

}  // namespace orv
