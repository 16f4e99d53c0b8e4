// Test signals and small helpers for the level meter tests.
#pragma once

#include <cmath>
#include <cstdint>
#include <numbers>
#include <vector>

#include "filter_design.h"
#include "slm.h"
#include "sos.h"

namespace level_library_test {

inline constexpr double kFs = 48000.0;

inline std::vector<float> sine(double f, double amplitude, std::size_t n, double phase = 0.0) {
    std::vector<float> x(n);
    for (std::size_t i = 0; i < n; ++i) {
        x[i] = static_cast<float>(
            amplitude *
            std::sin(2.0 * std::numbers::pi * f * static_cast<double>(i) / kFs + phase));
    }
    return x;
}

// Uniform white noise, reproducible.
inline std::vector<float> whiteNoise(std::size_t n, std::uint32_t seed, double amplitude = 1.0) {
    std::vector<float> x(n);
    for (float& v : x) {
        seed ^= seed << 13;
        seed ^= seed >> 17;
        seed ^= seed << 5;
        v = static_cast<float>(amplitude * (static_cast<double>(seed) / 4294967296.0 - 0.5) * 2.0);
    }
    return x;
}

// White noise shaped to -3 dB per octave (pink, Kellet's filter, within 0.1 dB of ideal
// from 10 Hz up), optionally band-limited by 8th-order Butterworth filters to lo..hi.
inline std::vector<float> pinkNoise(std::size_t n, std::uint32_t seed) {
    std::vector<float> x = whiteNoise(n, seed);
    double b0 = 0, b1 = 0, b2 = 0, b3 = 0, b4 = 0, b5 = 0, b6 = 0;
    for (float& v : x) {
        const double w = v;
        b0 = 0.99886 * b0 + w * 0.0555179;
        b1 = 0.99332 * b1 + w * 0.0750759;
        b2 = 0.96900 * b2 + w * 0.1538520;
        b3 = 0.86650 * b3 + w * 0.3104856;
        b4 = 0.55000 * b4 + w * 0.5329522;
        b5 = -0.7616 * b5 - w * 0.0168980;
        const double pink = b0 + b1 + b2 + b3 + b4 + b5 + b6 + w * 0.5362;
        b6 = w * 0.115926;
        v = static_cast<float>(pink * 0.2);
    }
    return x;
}

inline void bandLimit(std::vector<float>& x, double lo, double hi) {
    using namespace SlmLibrary;
    const Zpk proto = design::butterworthPrototype(8);
    SosCascade high(design::toSos(
        design::bilinear(design::lowpassToHighpass(proto, design::prewarp(lo, kFs)), kFs), kFs / 2,
        kFs, 1.0));
    SosCascade low(design::toSos(
        design::bilinear(design::lowpassToLowpass(proto, design::prewarp(hi, kFs)), kFs), 0.0, kFs,
        1.0));
    high.process(x.data(), x.data(), x.size());
    low.process(x.data(), x.data(), x.size());
}

inline double meanSquareDb(const std::vector<float>& x, std::size_t from = 0) {
    double s = 0.0;
    for (std::size_t i = from; i < x.size(); ++i) s += static_cast<double>(x[i]) * x[i];
    return 10.0 * std::log10(s / static_cast<double>(x.size() - from));
}

// Statistics of one channel as plain values.
struct Reading {
    float leq = 0, lmin = 0, lmax = 0, lpeak = 0;
    std::vector<float> levels;
};

inline Reading readBand(const SlmLibrary::Slm& slm, unsigned band) {
    Reading r;
    r.levels.resize(slm.percentileCount());
    slm.getStatistics(band, &r.leq, &r.lmin, &r.lmax, r.levels.data(), &r.lpeak, nullptr, nullptr);
    return r;
}

inline Reading readAux(const SlmLibrary::Slm& slm) {
    Reading r;
    r.levels.resize(slm.percentileCount());
    slm.getAuxStatistics(&r.leq, &r.lmin, &r.lmax, r.levels.data(), &r.lpeak, nullptr, nullptr);
    return r;
}

// A meter of the Z-weighted bands first..last of the third-octave or the octave bank.
inline SlmLibrary::Slm bandMeter(bool third, unsigned tw, unsigned first, unsigned last) {
    SlmLibrary::Slm slm(kFs, 1, 48000);
    if (third) {
        slm.initThirdOct(tw, SlmLibrary::FWeight::Z, first, last, kFs, 0);
    } else {
        slm.initFullOct(tw, SlmLibrary::FWeight::Z, first, last, kFs, 0);
    }
    slm.resetAll();
    return slm;
}

// Feeds x in steps of at most one second, as the analysis work item does.
inline void feed(SlmLibrary::Slm& slm, const float* x, std::size_t n, bool shortLeq = false) {
    for (std::size_t pos = 0; pos < n; pos += 48000) {
        const std::size_t m = std::min<std::size_t>(48000, n - pos);
        slm.addSamples(x + pos, m, m / 10, shortLeq ? m : 0);
    }
}

}  // namespace level_library_test
