// The synthetic sound scene of a demo session: a roadside with distant traffic as a steady
// background (following a daily cycle), vehicles passing by, and a constant transformer
// hum. The scene is a deterministic function of its seed and of time; it is heard either
// as audio (AudioSynth) or, where no audio is needed, as a cheaper model of the 100 ms
// powers the level meter would measure (LevelModel).
#pragma once

#include <array>
#include <cstddef>
#include <cstdint>
#include <vector>

#include "level_meter.h"
#include "random.h"

namespace orv_demo {

// Independent noise signals the scene is mixed from.
enum NoiseSource : std::size_t {
    kRumble = 0,  // low-frequency traffic and engine rumble
    kHiss = 1,    // broadband distant traffic, high frequencies damped
    kTyre = 2,    // tyre and road noise of a near vehicle, strongest around 1 kHz
    kNoiseSourceCount = 3
};

using SourcePowers = std::array<double, kNoiseSourceCount>;

// One vehicle passing by: a point source at closest distance d moving at speed v gives an
// intensity proportional to 1 / (1 + (t / tau)^2) with tau = d / v.
struct PassBy {
    double peakTime = 0.0;  // seconds from the session start
    double peakDbA = 0.0;   // A-weighted level at the closest point
    double tau = 0.0;       // seconds from the closest point to 3 dB below the peak
    double heavy = 0.0;     // 0 (car) .. 1 (lorry): share of engine rumble
};

struct SceneSettings {
    std::uint64_t seed = 1;
    double startSecondOfDay = 0.0;   // session start within its day, for the daily cycle
    double durationSeconds = 240.0;  // pass-bys are placed up to this time
    double firstPassByAfter = 8.0;   // the first pass-by peaks 0 to 10 s after this time
    double minPassBySpacing = 12.0;  // seconds between the peaks of two pass-bys
};

class SoundScene {
public:
    explicit SoundScene(const SceneSettings& settings);

    const std::vector<PassBy>& passBys() const { return passBys_; }
    // A-weighted level of the background noise, without the hum, at time t (seconds from
    // the session start; negative times are before the start).
    double backgroundDbA(double t) const;
    // Target A-weighted power (mean square of the A-weighted signal) of each noise source
    // at time t.
    SourcePowers powersAt(double t) const;

private:
    double smoothNoise(double u, std::uint64_t stream) const;

    SceneSettings settings_;
    std::vector<PassBy> passBys_;  // in time order
};

// A- and C-weighted mean squares of each source at unit gain, and of the hum, as the level
// meter measures them; they turn the scene's target powers into gains and let the level
// model predict the C-weighted levels.
struct SourceResponse {
    SourcePowers a{}, c{};
    double humA = 0.0, humC = 0.0;
};

// Measures the response with the level meter on a few seconds of each source. The result
// does not depend on any seed.
SourceResponse measureSourceResponse();

// Unit-gain noise sources: one white noise generator per source, shaped by simple filters.
class NoiseBank {
public:
    explicit NoiseBank(std::uint64_t seed);
    void next(float out[kNoiseSourceCount]);

private:
    struct Pink {  // -3 dB per octave from white noise (three-pole approximation)
        float b0 = 0, b1 = 0, b2 = 0;
        float step(float white);
    };
    struct Coefficients {  // one-pole filter coefficients
        Coefficients();
        float rumbleLow, rumbleHigh, hissLow, tyreHigh, tyreLow;
    };
    Coefficients k_;
    std::array<Rng, kNoiseSourceCount> white_;
    Pink hissPink_, tyrePink_;
    float rumbleLow_ = 0, rumbleHigh_ = 0, rumblePrev_ = 0;
    float hissLow_ = 0;
    float tyreHigh_ = 0, tyrePrev_ = 0, tyreLow_ = 0;
};

// The hum: 100 Hz with its second and third harmonics; one cycle is 480 samples.
class Hum {
public:
    static constexpr std::size_t kCycle = 480;
    explicit Hum(std::uint64_t seed);
    float at(std::int64_t sampleIndex) const;

private:
    std::array<float, kCycle> cycle_{};
};

// Audio of the scene in the calibrated unit, in which 10 log10 of a mean square is the
// level in dB. Sample index 0 is the start of the session; rendering may start anywhere,
// and the noise then depends on the seed and on that start.
class AudioSynth {
public:
    AudioSynth(const SoundScene& scene, const SourceResponse& response, std::uint64_t seed,
               std::int64_t firstSample);
    // The next `count` samples.
    void render(float* out, std::size_t count);

private:
    // Amplitude of each source at gain node j (every 10 ms).
    SourcePowers gainsAt(std::int64_t node) const;

    const SoundScene& scene_;
    SourceResponse response_;
    NoiseBank noise_;
    Hum hum_;
    std::int64_t next_;
    std::int64_t node_;
    SourcePowers gain0_{}, gain1_{};
};

// The 100 ms powers of the scene without audio: each period's A power is the sum of the
// sources' target powers at its middle and the hum, its C power follows from the measured
// response, both with a random fluctuation like that of 100 ms of noise; the F-weighted
// powers follow the exponential average of the period powers. The peak sample is
// estimated as 4.5 times the C-weighted RMS.
class LevelModel {
public:
    LevelModel(const SoundScene& scene, const SourceResponse& response, std::uint64_t seed);
    // Powers of period `record` (time record / 10 s), continuing the F-weighted averages
    // from the period before, whichever way that was computed.
    PeriodPowers next(std::int64_t record, double& peakEstimate);
    // Continues from powers measured on audio.
    void continueFrom(const PeriodPowers& last);

private:
    const SoundScene& scene_;
    SourceResponse response_;
    std::uint64_t seed_;
    bool started_ = false;
    double fA_ = 0.0, fC_ = 0.0;
};

}  // namespace orv_demo
