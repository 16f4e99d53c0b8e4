#include "sound_scene.h"

#include <algorithm>
#include <cmath>
#include <numbers>

#include "wave_writer.h"

namespace orv_demo {
namespace {

constexpr double kTwoPi = 2.0 * std::numbers::pi;
constexpr std::int64_t kNodeSamples = 480;  // gains are interpolated over 10 ms
constexpr double kPassByReach = 40.0;       // seconds from the peak where a pass-by ends
constexpr double kPassByTaper = 10.0;       // the last seconds of the reach fade out

// Shares of the background's A-weighted power.
constexpr double kBackgroundRumble = 0.35;
constexpr double kBackgroundHiss = 0.65;

// Hum levels (dB, unweighted) of 100, 200 and 300 Hz.
constexpr std::array<double, 3> kHumDb = {52.0, 44.0, 38.0};

double dbToPower(double db) { return std::pow(10.0, 0.1 * db); }

// One-pole coefficient for a corner frequency in Hz.
float onePole(double hz) { return static_cast<float>(1.0 - std::exp(-kTwoPi * hz / kSampleRate)); }

double passByEnvelope(const PassBy& p, double t) {
    const double dt = std::abs(t - p.peakTime);
    if (dt >= kPassByReach) return 0.0;
    const double r = dt / p.tau;
    double envelope = 1.0 / (1.0 + r * r);
    const double fadeFrom = kPassByReach - kPassByTaper;
    if (dt > fadeFrom)
        envelope *= 0.5 * (1.0 + std::cos(std::numbers::pi * (dt - fadeFrom) / kPassByTaper));
    return envelope;
}

// Level offset of the daily cycle: 0 dB at 14:00, -6 dB at 02:00.
double dailyOffsetDb(double secondOfDay) {
    const double hours = secondOfDay / 3600.0;
    return 3.0 * (std::cos(kTwoPi * (hours - 14.0) / 24.0) - 1.0);
}

}  // namespace

SoundScene::SoundScene(const SceneSettings& settings) : settings_(settings) {
    Rng rng(mix64(settings.seed, 0x5CE4E));
    double t = settings.firstPassByAfter + 10.0 * rng.uniform();
    // Pass-bys up to the reach past the end still sound inside the session.
    while (t < settings.durationSeconds + kPassByReach) {
        PassBy p;
        p.peakTime = t;
        p.peakDbA = 58.0 + 17.0 * rng.uniform();
        p.tau = 1.0 + 1.5 * rng.uniform();
        p.heavy = rng.uniform() < 0.25 ? 0.6 + 0.4 * rng.uniform() : 0.2 * rng.uniform();
        passBys_.push_back(p);
        // Fewer vehicles at night: the mean spacing grows from 40 s by 50 % per dB below
        // the daytime level.
        const double night = -dailyOffsetDb(settings.startSecondOfDay + t);
        const double mean = 40.0 * (1.0 + 0.5 * night);
        t += std::max(settings.minPassBySpacing, -std::log(1.0 - rng.uniform()) * mean);
    }
}

double SoundScene::smoothNoise(double u, std::uint64_t stream) const {
    const double cell = std::floor(u);
    const double f = u - cell;
    const auto node = static_cast<std::int64_t>(cell);
    const auto value = [&](std::int64_t n) {
        return 2.0 * unitFromBits(
                         mix64(mix64(settings_.seed, stream), static_cast<std::uint64_t>(n))) -
               1.0;
    };
    const double s = f * f * (3.0 - 2.0 * f);
    return value(node) + (value(node + 1) - value(node)) * s;
}

double SoundScene::backgroundDbA(double t) const {
    return 44.0 + dailyOffsetDb(settings_.startSecondOfDay + t) + 1.5 * smoothNoise(t / 30.0, 1) +
           0.7 * smoothNoise(t / 4.0, 2);
}

SourcePowers SoundScene::powersAt(double t) const {
    const double background = dbToPower(backgroundDbA(t));
    SourcePowers p{};
    p[kRumble] = kBackgroundRumble * background;
    p[kHiss] = kBackgroundHiss * background;
    const auto first =
        std::lower_bound(passBys_.begin(), passBys_.end(), t - kPassByReach,
                         [](const PassBy& a, double time) { return a.peakTime < time; });
    for (auto it = first; it != passBys_.end() && it->peakTime < t + kPassByReach; ++it) {
        const double power = dbToPower(it->peakDbA) * passByEnvelope(*it, t);
        const double rumbleShare = 0.1 + 0.25 * it->heavy;
        p[kRumble] += rumbleShare * power;
        p[kTyre] += (1.0 - rumbleShare) * power;
    }
    return p;
}

float NoiseBank::Pink::step(float white) {
    b0 = 0.99765F * b0 + white * 0.0990460F;
    b1 = 0.96300F * b1 + white * 0.2965164F;
    b2 = 0.57000F * b2 + white * 1.0526913F;
    return b0 + b1 + b2 + white * 0.1848F;
}

NoiseBank::Coefficients::Coefficients()
    : rumbleLow(onePole(50.0)),
      rumbleHigh(1.0F - onePole(25.0)),
      hissLow(onePole(2500.0)),
      tyreHigh(1.0F - onePole(400.0)),
      tyreLow(onePole(6000.0)) {}

NoiseBank::NoiseBank(std::uint64_t seed)
    : white_{Rng(mix64(seed, 1)), Rng(mix64(seed, 2)), Rng(mix64(seed, 3))} {}

void NoiseBank::next(float out[kNoiseSourceCount]) {
    // Rumble: white noise low-passed at 50 Hz, high-passed at 25 Hz.
    rumbleLow_ += k_.rumbleLow * (white_[kRumble].white() - rumbleLow_);
    rumbleHigh_ = k_.rumbleHigh * (rumbleHigh_ + rumbleLow_ - rumblePrev_);
    rumblePrev_ = rumbleLow_;
    out[kRumble] = rumbleHigh_;
    // Hiss: pink noise low-passed at 2.5 kHz.
    hissLow_ += k_.hissLow * (hissPink_.step(white_[kHiss].white()) - hissLow_);
    out[kHiss] = hissLow_;
    // Tyre noise: pink noise high-passed at 400 Hz and low-passed at 6 kHz.
    const float pink = tyrePink_.step(white_[kTyre].white());
    tyreHigh_ = k_.tyreHigh * (tyreHigh_ + pink - tyrePrev_);
    tyrePrev_ = pink;
    tyreLow_ += k_.tyreLow * (tyreHigh_ - tyreLow_);
    out[kTyre] = tyreLow_;
}

Hum::Hum(std::uint64_t seed) {
    Rng rng(mix64(seed, 0x4D));
    std::array<double, kHumDb.size()> phase{};
    for (double& p : phase) p = kTwoPi * rng.uniform();
    for (std::size_t i = 0; i < kCycle; ++i) {
        double v = 0.0;
        for (std::size_t h = 0; h < kHumDb.size(); ++h) {
            const double amplitude = std::sqrt(2.0 * dbToPower(kHumDb[h]));
            v +=
                amplitude * std::sin(kTwoPi * static_cast<double>((h + 1) * i) / kCycle + phase[h]);
        }
        cycle_[i] = static_cast<float>(v);
    }
}

float Hum::at(std::int64_t sampleIndex) const {
    const std::int64_t n = static_cast<std::int64_t>(kCycle);
    return cycle_[static_cast<std::size_t>(((sampleIndex % n) + n) % n)];
}

SourceResponse measureSourceResponse() {
    constexpr std::size_t kSettle = 24000;  // 0.5 s for the filters to settle
    constexpr std::size_t kMeasure = 40 * kPeriodSamples;
    constexpr std::size_t kTotal = kSettle + kMeasure;
    std::array<std::vector<float>, kNoiseSourceCount + 1> signals;
    for (auto& s : signals) s.resize(kTotal);
    NoiseBank noise(0x0DE40);
    const Hum hum(0x0DE40);
    float v[kNoiseSourceCount];
    for (std::size_t i = 0; i < kTotal; ++i) {
        noise.next(v);
        for (std::size_t s = 0; s < kNoiseSourceCount; ++s) signals[s][i] = v[s];
        signals[kNoiseSourceCount][i] = hum.at(static_cast<std::int64_t>(i));
    }
    SourceResponse r;
    std::vector<PeriodPowers> periods;
    for (std::size_t s = 0; s <= kNoiseSourceCount; ++s) {
        LevelMeter meter;
        periods.clear();
        meter.process(signals[s].data(), kTotal - kTotal % kPeriodSamples, periods);
        double a = 0.0, c = 0.0;
        const std::size_t skip =
            (kTotal - kTotal % kPeriodSamples) / kPeriodSamples - kMeasure / kPeriodSamples;
        for (std::size_t k = skip; k < periods.size(); ++k) {
            a += periods[k].leqA;
            c += periods[k].leqC;
        }
        a /= static_cast<double>(periods.size() - skip);
        c /= static_cast<double>(periods.size() - skip);
        if (s < kNoiseSourceCount) {
            r.a[s] = a;
            r.c[s] = c;
        } else {
            r.humA = a;
            r.humC = c;
        }
    }
    return r;
}

AudioSynth::AudioSynth(const SoundScene& scene, const SourceResponse& response, std::uint64_t seed,
                       std::int64_t firstSample)
    : scene_(scene),
      response_(response),
      noise_(mix64(seed, static_cast<std::uint64_t>(firstSample))),
      hum_(seed),
      next_(firstSample),
      node_(firstSample >= 0 ? firstSample / kNodeSamples
                             : -((-firstSample + kNodeSamples - 1) / kNodeSamples)) {
    // The filters of the noise sources start from rest; 0.1 s lets their slowest pole settle.
    float v[kNoiseSourceCount];
    for (std::size_t i = 0; i < kPeriodSamples; ++i) noise_.next(v);
    gain0_ = gainsAt(node_);
    gain1_ = gainsAt(node_ + 1);
}

SourcePowers AudioSynth::gainsAt(std::int64_t node) const {
    const double t = static_cast<double>(node * kNodeSamples) / kSampleRate;
    SourcePowers powers = scene_.powersAt(t);
    for (std::size_t s = 0; s < kNoiseSourceCount; ++s)
        powers[s] = std::sqrt(powers[s] / response_.a[s]);
    return powers;
}

void AudioSynth::render(float* out, std::size_t count) {
    float v[kNoiseSourceCount];
    for (std::size_t i = 0; i < count; ++i, ++next_) {
        const std::int64_t offset = next_ - node_ * kNodeSamples;
        if (offset == kNodeSamples) {
            ++node_;
            gain0_ = gain1_;
            gain1_ = gainsAt(node_ + 1);
        }
        const double w = static_cast<double>(next_ - node_ * kNodeSamples) / kNodeSamples;
        noise_.next(v);
        double x = hum_.at(next_);
        for (std::size_t s = 0; s < kNoiseSourceCount; ++s)
            x += (gain0_[s] + (gain1_[s] - gain0_[s]) * w) * v[s];
        out[i] = static_cast<float>(x);
    }
}

LevelModel::LevelModel(const SoundScene& scene, const SourceResponse& response, std::uint64_t seed)
    : scene_(scene), response_(response), seed_(mix64(seed, 0x1E7E1)) {}

PeriodPowers LevelModel::next(std::int64_t record, double& peakEstimate) {
    // The F time constant is 0.125 s: over one period the average keeps exp(-0.8) of its
    // value. The period's power is taken as constant over the period.
    constexpr double kKeep = 0.44932896411722156;
    const SourcePowers target = scene_.powersAt((static_cast<double>(record) + 0.5) / 10.0);
    PeriodPowers p;
    p.leqA = response_.humA;
    p.leqC = response_.humC;
    for (std::size_t s = 0; s < kNoiseSourceCount; ++s) {
        p.leqA += target[s];
        p.leqC += target[s] * response_.c[s] / response_.a[s];
    }
    // 100 ms of A-weighted noise varies by a few tenths of a dB; the C-weighted level,
    // carried by narrow-band rumble, by about a dB.
    Rng rng(mix64(seed_, static_cast<std::uint64_t>(record)));
    p.leqA *= dbToPower(0.4 * rng.normal());
    p.leqC *= dbToPower(1.0 * rng.normal());
    if (!started_) {
        fA_ = p.leqA;
        fC_ = p.leqC;
        started_ = true;
    }
    fA_ = kKeep * fA_ + (1.0 - kKeep) * p.leqA;
    fC_ = kKeep * fC_ + (1.0 - kKeep) * p.leqC;
    p.splA = fA_;
    p.splC = fC_;
    peakEstimate = 4.5 * std::sqrt(p.leqC);
    return p;
}

void LevelModel::continueFrom(const PeriodPowers& last) {
    fA_ = last.splA;
    fC_ = last.splC;
    started_ = true;
}

}  // namespace orv_demo
