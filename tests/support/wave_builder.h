// Wave files for tests: the logger's 44-byte header (or a variant), and sample sequences
// in which every sample tells where it came from.
#pragma once

#include <cstdint>
#include <string>
#include <vector>

namespace testing_support {

struct WaveLayout {
    std::uint16_t formatTag = 1;
    std::uint16_t channels = 1;
    std::uint32_t sampleRate = 48000;
    std::uint16_t bitsPerSample = 16;
    int listBodyBytes = -1;          // >= 0: a LIST chunk with a body of this size
    std::int64_t dataSizeDelta = 0;  // added to the data chunk's stated size
};

// The whole file: header and samples (little-endian).
std::string waveFileBytes(const std::vector<std::int16_t>& samples, const WaveLayout& layout = {});
void writeWaveFile(const std::string& path, const std::vector<std::int16_t>& samples,
                   const WaveLayout& layout = {});

// `count` samples that differ from those of any other seed and position: sample i of seed s
// is a hash of (s, i).
std::vector<std::int16_t> markedSamples(std::uint32_t seed, std::size_t count);
// A sine of `amplitude` (full scale 32767) at `frequency` Hz, 48 kHz.
std::vector<std::int16_t> toneSamples(double frequency, double amplitude, std::size_t count,
                                      double phase = 0.0);

}  // namespace testing_support
