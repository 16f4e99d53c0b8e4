// Writer of 48 kHz, 16-bit, single-channel RIFF/WAVE files with the plain 44-byte header
// (RIFF, "fmt " chunk of 16 bytes, data chunk) that the logger writes.
#pragma once

#include <cstddef>
#include <cstdint>
#include <fstream>
#include <string>

namespace orv_demo {

inline constexpr std::uint32_t kSampleRate = 48000;

class WaveWriter {
public:
    // Creates the file with a header for an empty recording; throws std::runtime_error when
    // the file cannot be created.
    explicit WaveWriter(const std::string& path);
    WaveWriter(const WaveWriter&) = delete;
    WaveWriter& operator=(const WaveWriter&) = delete;
    // Closes the file (its header then states the samples written) when close was not called.
    ~WaveWriter();

    void write(const std::int16_t* samples, std::size_t count);
    // Writes the final chunk sizes into the header and closes the file; throws
    // std::runtime_error on a failed write.
    void close();
    std::uint64_t samplesWritten() const { return samples_; }

private:
    std::string path_;
    std::ofstream file_;
    std::uint64_t samples_ = 0;
};

// The 44 header bytes of a recording of `samples` samples.
std::string waveHeader(std::uint64_t samples);

}  // namespace orv_demo
