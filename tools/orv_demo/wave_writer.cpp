#include "wave_writer.h"

#include <bit>
#include <stdexcept>

namespace orv_demo {
namespace {

static_assert(std::endian::native == std::endian::little,
              "samples are written in memory order, which must be little-endian");

constexpr std::uint64_t kHeaderBytes = 44;
// The RIFF size field must hold the file size less 8 bytes.
constexpr std::uint64_t kMaxSamples = (0xFFFFFFFFULL - kHeaderBytes + 8) / 2;

void put16(std::string& out, std::uint16_t v) {
    out += static_cast<char>(v & 0xFF);
    out += static_cast<char>(v >> 8);
}

void put32(std::string& out, std::uint32_t v) {
    put16(out, static_cast<std::uint16_t>(v & 0xFFFF));
    put16(out, static_cast<std::uint16_t>(v >> 16));
}

}  // namespace

std::string waveHeader(std::uint64_t samples) {
    const auto dataBytes = static_cast<std::uint32_t>(samples * 2);
    std::string h;
    h.reserve(kHeaderBytes);
    h += "RIFF";
    put32(h, dataBytes + 36);
    h += "WAVEfmt ";
    put32(h, 16);
    put16(h, 1);  // PCM
    put16(h, 1);  // channels
    put32(h, kSampleRate);
    put32(h, kSampleRate * 2);  // byte rate
    put16(h, 2);                // block align
    put16(h, 16);               // bits per sample
    h += "data";
    put32(h, dataBytes);
    return h;
}

WaveWriter::WaveWriter(const std::string& path)
    : path_(path), file_(path, std::ios::binary | std::ios::trunc) {
    const std::string header = waveHeader(0);
    file_.write(header.data(), static_cast<std::streamsize>(header.size()));
    if (!file_) throw std::runtime_error("cannot create " + path_);
}

WaveWriter::~WaveWriter() {
    if (file_.is_open()) {
        try {
            close();
        } catch (const std::exception&) {
            // Nothing to report to from a destructor; close() is the checked path.
        }
    }
}

void WaveWriter::write(const std::int16_t* samples, std::size_t count) {
    if (samples_ + count > kMaxSamples) throw std::runtime_error("recording too long for " + path_);
    file_.write(reinterpret_cast<const char*>(samples), static_cast<std::streamsize>(count * 2));
    samples_ += count;
}

void WaveWriter::close() {
    const std::string header = waveHeader(samples_);
    file_.seekp(0);
    file_.write(header.data(), static_cast<std::streamsize>(header.size()));
    file_.close();
    if (!file_) throw std::runtime_error("cannot write " + path_);
}

}  // namespace orv_demo
