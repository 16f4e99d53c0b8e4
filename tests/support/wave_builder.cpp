#include "support/wave_builder.h"

#include <cmath>
#include <numbers>

#include "support/test_support.h"

namespace testing_support {
namespace {

void put16(std::string& s, std::uint32_t v) {
    s += static_cast<char>(v & 0xFF);
    s += static_cast<char>((v >> 8) & 0xFF);
}

void put32(std::string& s, std::uint32_t v) {
    put16(s, v & 0xFFFF);
    put16(s, v >> 16);
}

}  // namespace

std::string waveFileBytes(const std::vector<std::int16_t>& samples, const WaveLayout& layout) {
    const std::uint32_t blockAlign = layout.channels * layout.bitsPerSample / 8U;
    const auto dataSize = static_cast<std::uint32_t>(samples.size() * 2);
    std::string s = "RIFF";
    put32(s, 36 + dataSize);
    s += "WAVE";
    if (layout.listBodyBytes >= 0) {
        s += "LIST";
        put32(s, static_cast<std::uint32_t>(layout.listBodyBytes));
        s.append(static_cast<std::size_t>(layout.listBodyBytes), 'x');
    }
    s += "fmt ";
    put32(s, 16);
    put16(s, layout.formatTag);
    put16(s, layout.channels);
    put32(s, layout.sampleRate);
    put32(s, layout.sampleRate * blockAlign);
    put16(s, blockAlign);
    put16(s, layout.bitsPerSample);
    s += "data";
    put32(s, static_cast<std::uint32_t>(dataSize + layout.dataSizeDelta));
    for (std::int16_t v : samples) put16(s, static_cast<std::uint16_t>(v));
    return s;
}

void writeWaveFile(const std::string& path, const std::vector<std::int16_t>& samples,
                   const WaveLayout& layout) {
    writeFile(path, waveFileBytes(samples, layout));
}

std::vector<std::int16_t> markedSamples(std::uint32_t seed, std::size_t count) {
    std::vector<std::int16_t> out(count);
    for (std::size_t i = 0; i < count; ++i) {
        std::uint64_t h = (std::uint64_t{seed} << 32 | i) * 0x9E3779B97F4A7C15ULL;
        h ^= h >> 29;
        out[i] = static_cast<std::int16_t>(h >> 48);
    }
    return out;
}

std::vector<std::int16_t> toneSamples(double frequency, double amplitude, std::size_t count,
                                      double phase) {
    std::vector<std::int16_t> out(count);
    const double w = 2.0 * std::numbers::pi * frequency / 48000.0;
    for (std::size_t i = 0; i < count; ++i) {
        out[i] = static_cast<std::int16_t>(
            std::lround(amplitude * std::sin(w * static_cast<double>(i) + phase)));
    }
    return out;
}

}  // namespace testing_support
