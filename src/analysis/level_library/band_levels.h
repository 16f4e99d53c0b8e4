// Levels and statistics of up to W band signals of one rate, side by side: squaring,
// time weighting, warm-up, and the statistics of one meter channel per lane.
//
// Per lane, over the samples entered since the statistics were reset:
// - Leq: mean square of every entered sample;
// - Lmax, Lmin: extremes of the time-weighted mean square over every lane sample (N: over
//   the 100 ms equivalent levels);
// - Ln: exceedance levels from a histogram of 0.1 dB classes of the time-weighted level
//   taken every 10 ms of entered audio (100 per second; N: each 100 ms level once, which
//   is the same distribution);
// - Lpeak: largest absolute value of the signal. For lanes whose content lies below a
//   quarter of their rate it is looked for between samples too: samples within 3 dB of the
//   running peak are interpolated at quarter-sample offsets (8-tap Lanczos), which finds
//   the crest within 0.2 dB (a plain sample peak can miss it by 20 log10(cos(pi f / rate)),
//   1.25 dB at a band's mid frequency). Other lanes take the largest sample;
// - short Leqs: one Leq per call that asks for it (beginCall / endCall).
//
// Warm-up. A lane counts every sample it is given, pre-roll included, from reset. For its
// first settleSamples the filters ahead of it are still settling: the time weighting is
// idle. Then the time weighting runs from zero while the mean square m of its input is
// collected, for primeSamples or, when pre-roll lasts longer, up to the end of the pre-roll;
// over k such samples, m * (1 - alpha)^k is then added to its state, which is exactly the
// result of having started the average at m instead of zero: m stands in for the unknown
// audio before. From then on the lane is settled. Only settled samples enter Lmax, Lmin, Ln and
// Lpeak; every entered sample enters Leq and the short Leqs. N has no priming: a 100 ms period
// counts only when it starts settled.
#pragma once

#include <algorithm>
#include <array>
#include <cstddef>
#include <cstdint>
#include <vector>

#include "leq.h"
#include "level_histogram.h"

namespace SlmLibrary {

template <std::size_t W>
class BandLevels {
public:
    struct LaneSetup {
        bool active = false;
        double settleSeconds = 0.0;
        double primeSeconds = 0.0;
        // The lane's content lies below a quarter of its rate: find crests between samples.
        bool interpolatePeak = false;
    };

    BandLevels() = default;
    // twCode: TWeight code (N, F or S); rate: lane sample rate (Hz, with 480 and 4800 input
    // samples at 48000 Hz whole numbers of lane samples).
    BandLevels(unsigned twCode, double rate, double inputRate,
               const std::array<LaneSetup, W>& lanes);

    // Everything back to the start: filters are reset by the owner at the same time.
    void reset();
    // Statistics and short Leqs cleared; time weighting and warm-up carry on.
    void resetStatistics();

    // count frames of W floats (lane-interleaved). entering false: pre-roll, runs the time
    // weighting and the warm-up only.
    void process(const float* frames, std::size_t count, bool entering);

    void beginCall();
    void endCall();  // appends one short Leq per lane

    bool settled(std::size_t lane) const;
    double leqPower(std::size_t lane) const;  // NaN when nothing was entered
    // Extremes as mean squares; false when no settled level was entered.
    bool extremes(std::size_t lane, double& minPower, double& maxPower) const;
    float peak(std::size_t lane) const { return std::max(peak_[lane], truePeak_[lane]); }
    void percentiles(std::size_t lane, const std::vector<float>& percents, float* out) const;
    std::uint64_t levelCount(std::size_t lane) const { return histogram_[lane].count(); }
    double seconds() const { return static_cast<double>(count_) / rate_; }
    const std::vector<Leq>& shortLeqs(std::size_t lane) const { return shortLeqs_[lane]; }

private:
    void processFast(const float* frames, std::size_t count);
    void processSlow(const float* frames, std::size_t count, bool entering);
    void finishPriming(std::size_t lane);
    // Interpolated peaks around the largest samples of settled frames.
    void refinePeaks(const float* frames, std::size_t count, const std::array<float, W>& magnitude);
    void tick();
    // The last kHistory frames seen, for interpolation across calls.
    void keepTail(const float* frames, std::size_t count);

    unsigned code_ = 0;
    double rate_ = 1.0;
    double alpha_ = 0.0;
    std::array<double, 9> weights_{};  // of eight frames (LevelRun)
    std::array<float, 8> weightsF_{};
    std::size_t tickSamples_ = 1;    // 10 ms
    std::size_t periodSamples_ = 1;  // 100 ms (N)
    std::array<bool, W> active_{};
    std::array<bool, W> interpolate_{};
    bool anyInterpolated_ = false;
    bool lowHalfOnly_ = false;                  // lanes 4.. unused
    std::array<std::uint64_t, W> settleEnd_{};  // first sample after filter settling
    std::array<std::uint64_t, W> primeEnd_{};   // earliest first settled sample

    // Running state.
    std::uint64_t seen_ = 0;
    std::array<double, W> tw_{};
    std::array<double, W> primeSum_{};
    std::array<std::uint64_t, W> primeCount_{};
    std::array<bool, W> primed_{};
    bool allPrimed_ = false;
    std::size_t tickPhase_ = 0;
    std::size_t periodPhase_ = 0;
    std::array<double, W> periodSum_{};
    std::array<bool, W> periodValid_{};

    // Statistics.
    std::uint64_t count_ = 0;
    std::array<double, W> energy_{};
    std::array<float, W> peak_{};
    std::array<double, W> max_{};
    std::array<double, W> min_{};
    std::array<bool, W> hasExtremes_{};
    std::array<float, W> truePeak_{};
    // Stretches of a call's frames for the peak search: first, count (LevelRun).
    std::vector<std::uint32_t> candidates_;
    std::size_t candidateCount_ = 0;
    std::vector<LevelHistogram> histogram_;
    // Last frames of the previous call (for interpolation across calls).
    static constexpr std::size_t kHistory = 8;
    std::array<float, kHistory * W> tail_{};
    bool tailSettled_ = false;
    std::uint64_t callCount_ = 0;
    std::array<double, W> callEnergy_{};
    std::vector<std::vector<Leq>> shortLeqs_;
};

extern template class BandLevels<1>;
extern template class BandLevels<8>;

}  // namespace SlmLibrary
