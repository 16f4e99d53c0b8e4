#include "fweight.h"

#include <algorithm>
#include <array>
#include <cmath>
#include <numbers>
#include <stdexcept>
#include <string>

namespace SlmLibrary {
namespace {

constexpr double kPi = std::numbers::pi;
// Pole frequencies of IEC 61672-1:2013 (Annex E).
constexpr double kF1 = 20.598997;
constexpr double kF2 = 107.65265;
constexpr double kF3 = 737.86223;
constexpr double kF4 = 12194.217;

double analogPowerA(double f) {
    const double f2 = f * f;
    const double num = kF4 * kF4 * f2 * f2;
    const double den =
        (f2 + kF1 * kF1) * std::sqrt((f2 + kF2 * kF2) * (f2 + kF3 * kF3)) * (f2 + kF4 * kF4);
    const double amp = num / den;
    return amp * amp;
}

double analogPowerC(double f) {
    const double f2 = f * f;
    const double amp = kF4 * kF4 * f2 / ((f2 + kF1 * kF1) * (f2 + kF4 * kF4));
    return amp * amp;
}

// Bilinear section of s^2 / ((s + w1)(s + w2)).
Sos highpassPair(double fa, double fb, double fs) {
    Zpk analog;
    analog.zeros = {0.0, 0.0};
    analog.poles = {-2.0 * kPi * fa, -2.0 * kPi * fb};
    analog.gain = 1.0;
    return design::toSos(design::bilinear(analog, fs), fs / 4.0, fs, 1.0).front();
}

// Solves the 3x3 system m x = v (Gaussian elimination with partial pivoting).
std::array<double, 3> solve3(std::array<std::array<double, 4>, 3> m) {
    for (int col = 0; col < 3; ++col) {
        int pivot = col;
        for (int r = col + 1; r < 3; ++r) {
            if (std::abs(m[r][col]) > std::abs(m[pivot][col])) pivot = r;
        }
        std::swap(m[col], m[pivot]);
        for (int r = 0; r < 3; ++r) {
            if (r == col) continue;
            const double k = m[r][col] / m[col][col];
            for (int c = col; c < 4; ++c) m[r][c] -= k * m[col][c];
        }
    }
    return {m[0][3] / m[0][0], m[1][3] / m[1][1], m[2][3] / m[2][2]};
}

// The 12194 Hz double pole: poles exp(-w4 T) (twice), numerator fitted so that the whole
// cascade `front` x this section follows analogPower.
Sos fittedHighSection(const SosList& front, double (*analogPower)(double), double fs) {
    const double p = std::exp(-2.0 * kPi * kF4 / fs);
    const double a1 = -2.0 * p;
    const double a2 = p * p;
    // |B(e^jw)|^2 = c0 + c1 cos w + c2 cos 2w: linear least squares of the relative error.
    std::array<std::array<double, 4>, 3> normal{};
    const double fTop = std::min(20000.0, 0.45 * fs);
    constexpr int kPoints = 600;
    for (int i = 0; i < kPoints; ++i) {
        const double f = 10.0 * std::pow(fTop / 10.0, i / (kPoints - 1.0));
        const double w = 2.0 * kPi * f / fs;
        const double den = std::norm(Sos{1.0, 0.0, 0.0, a1, a2}.response(f, fs)) *
                           std::norm(design::response(front, f, fs));
        const double target = analogPower(f);
        const double weight = f <= 16000.0 ? 1.0 : 0.3;
        const double row[3] = {den, den * std::cos(w), den * std::cos(2.0 * w)};
        for (int r = 0; r < 3; ++r) {
            for (int c = 0; c < 3; ++c)
                normal[r][c] += weight * row[r] * row[c] / (target * target);
            normal[r][3] += weight * row[r] / target;
        }
    }
    const std::array<double, 3> c = solve3(normal);
    // Spectral factor: with v = z + 1/z the palindromic P(z) becomes
    // (c2/2) v^2 + (c1/2) v + (c0 - c2) = 0; each v gives the root z of z^2 - v z + 1
    // inside the unit circle.
    const Complex qa = c[2] / 2.0;
    const Complex qb = c[1] / 2.0;
    const Complex qc = c[0] - c[2];
    std::array<Complex, 2> v;
    if (std::abs(qa) < 1e-15 * std::abs(qb)) {
        v = {-qc / qb, Complex(1e9, 0.0)};  // second root at infinity: zero at z = 0
    } else {
        const Complex disc = std::sqrt(qb * qb - 4.0 * qa * qc);
        v = {(-qb + disc) / (2.0 * qa), (-qb - disc) / (2.0 * qa)};
    }
    std::array<Complex, 2> zeros;
    for (int i = 0; i < 2; ++i) {
        const Complex r = std::sqrt(v[i] * v[i] - 4.0);
        const Complex z1 = (v[i] + r) / 2.0;
        const Complex z2 = (v[i] - r) / 2.0;
        zeros[i] = std::abs(z1) <= std::abs(z2) ? z1 : z2;
    }
    Sos s{1.0, -(zeros[0] + zeros[1]).real(), (zeros[0] * zeros[1]).real(), a1, a2};
    return s;
}

struct WeightingDesign {
    SosList shared;
    SosList aTail;
    SosList cTail;
};

WeightingDesign makeDesign(double fs) {
    WeightingDesign d;
    d.shared = {highpassPair(kF1, kF1, fs)};
    const Sos mid = highpassPair(kF2, kF3, fs);
    SosList aFront = {d.shared.front(), mid};
    d.aTail = {mid, fittedHighSection(aFront, analogPowerA, fs)};
    d.cTail = {fittedHighSection(d.shared, analogPowerC, fs)};
    // 0 dB at 1 kHz, as the analog definitions.
    auto normalize = [&](SosList& tail) {
        SosList all = d.shared;
        all.insert(all.end(), tail.begin(), tail.end());
        const double g = 1.0 / std::abs(design::response(all, 1000.0, fs));
        tail.back().b0 *= g;
        tail.back().b1 *= g;
        tail.back().b2 *= g;
    };
    normalize(d.aTail);
    normalize(d.cTail);
    return d;
}

SosList cascadeFor(unsigned code, const WeightingDesign& d) {
    SosList all;
    if (code == FWeight::Z) return all;
    all = d.shared;
    const SosList& tail = code == FWeight::C ? d.cTail : d.aTail;
    all.insert(all.end(), tail.begin(), tail.end());
    return all;
}

SosList cascadeFor(unsigned code, double fs) { return cascadeFor(code, makeDesign(fs)); }

}  // namespace

FWeight::FWeight(double sampleRate) : fs_(sampleRate) { init(Z, sampleRate); }

void FWeight::init(unsigned code, double sampleRate) {
    if (code != Z && code != A && code != C && code != All) {
        throw std::invalid_argument("unknown frequency weighting code " + std::to_string(code));
    }
    if (!(sampleRate >= 8000.0)) {
        throw std::invalid_argument("frequency weighting needs a sample rate of at least 8000 Hz");
    }
    code_ = code;
    fs_ = sampleRate;
    // A few hundred complex evaluations: cheap enough to design per init.
    const WeightingDesign d = makeDesign(fs_);
    a_ = SosCascade(cascadeFor(A, d));
    c_ = SosCascade(cascadeFor(C, d));
}

void FWeight::reset() {
    a_.reset();
    c_.reset();
}

void FWeight::Process(const float* in, float* out, std::size_t n) {
    if (code_ == Z) {
        if (out != in) {
            for (std::size_t i = 0; i < n; ++i) out[i] = in[i];
        }
        return;
    }
    (code_ == C ? c_ : a_).process(in, out, n);
}

int FWeight::ProcessAll(const float* in, float* outZ, float* outC, float* outA, std::size_t n) {
    // The cascades of Process, so each output equals the single weighting's; through
    // pieces of its own, as an output may be the input.
    constexpr std::size_t kPiece = 256;
    float a[kPiece];
    float c[kPiece];
    for (std::size_t pos = 0; pos < n; pos += kPiece) {
        const std::size_t m = std::min(kPiece, n - pos);
        c_.process(in + pos, c, m);
        a_.process(in + pos, a, m);
        if (outZ != nullptr && outZ != in) std::copy(in + pos, in + pos + m, outZ + pos);
        if (outC != nullptr) std::copy(c, c + m, outC + pos);
        if (outA != nullptr) std::copy(a, a + m, outA + pos);
    }
    return 1;
}

double FWeight::designResponseDb(unsigned code, double f, double sampleRate) {
    if (code == Z) return 0.0;
    return design::magnitudeDb(cascadeFor(code, sampleRate), f, sampleRate);
}

double FWeight::analogResponseDb(unsigned code, double f) {
    if (code == Z) return 0.0;
    const bool c = code == C;
    const double p =
        c ? analogPowerC(f) / analogPowerC(1000.0) : analogPowerA(f) / analogPowerA(1000.0);
    return 10.0 * std::log10(p);
}

double FWeight::settleSeconds(unsigned code, double sampleRate, double decayDb) {
    if (code == Z) return 0.0;
    return design::settleSeconds(cascadeFor(code, sampleRate), sampleRate, decayDb);
}

}  // namespace SlmLibrary
