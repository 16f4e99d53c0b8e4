#include "band_levels.h"

#include <algorithm>
#include <cmath>
#include <cstring>
#include <limits>
#include <numbers>

#include "dsp.h"
#include "kernels.h"
#include "tweight.h"

namespace SlmLibrary {
namespace {

// Lanczos (a = 4) interpolation at quarter-sample offsets t = 0.25, 0.5, 0.75 from the
// sample at tap 3 of eight consecutive samples; each kernel sums to one. For the six values
// around a sample j (after j - 1 and after j) from the nine samples j - 4 .. j + 4 at once:
// column m holds the weight of sample m in value 3 b + t (b = 0: around j - 1), zero where
// the sample is not one of its taps, so each value sums its taps in order as h would.
struct QuarterKernels {
    float h[3][8];
    alignas(16) float columns[9][8];
};

QuarterKernels makeQuarterKernels() {
    QuarterKernels k{};
    auto sinc = [](double x) {
        return x == 0.0 ? 1.0 : std::sin(std::numbers::pi * x) / (std::numbers::pi * x);
    };
    for (int t = 0; t < 3; ++t) {
        const double offset = 0.25 * (t + 1);
        double sum = 0.0;
        double taps[8];
        for (int i = 0; i < 8; ++i) {
            const double x = i - 3 - offset;
            taps[i] = sinc(x) * sinc(x / 4.0);
            sum += taps[i];
        }
        for (int i = 0; i < 8; ++i) k.h[t][i] = static_cast<float>(taps[i] / sum);
    }
    for (int m = 0; m < 9; ++m) {
        for (int b = 0; b < 2; ++b) {
            for (int t = 0; t < 3; ++t) {
                const int i = m - b;
                k.columns[m][3 * b + t] = i >= 0 && i < 8 ? k.h[t][i] : 0.0F;
            }
        }
    }
    return k;
}

const QuarterKernels& quarterKernels() {
    static const QuarterKernels kKernels = makeQuarterKernels();
    return kKernels;
}

}  // namespace

template <std::size_t W>
BandLevels<W>::BandLevels(unsigned twCode, double rate, double inputRate,
                          const std::array<LaneSetup, W>& lanes)
    : code_(twCode), rate_(rate) {
    const double factor = inputRate / rate;
    tickSamples_ = static_cast<std::size_t>(std::lround(0.01 * inputRate / factor));
    periodSamples_ = static_cast<std::size_t>(std::lround(0.1 * inputRate / factor));
    if (code_ != TWeight::N) alpha_ = -std::expm1(-1.0 / (TWeight::timeConstant(code_) * rate));
    double decay = 1.0;
    for (std::size_t j = 8; j-- > 0;) {
        weights_[j] = alpha_ * decay;
        decay *= 1.0 - alpha_;
    }
    weights_[8] = decay;
    for (std::size_t j = 0; j < 8; ++j) weightsF_[j] = static_cast<float>(weights_[j]);
    lowHalfOnly_ = true;
    for (std::size_t l = 0; l < W; ++l) {
        if (l >= 4 && lanes[l].active) lowHalfOnly_ = false;
        active_[l] = lanes[l].active;
        interpolate_[l] = lanes[l].active && lanes[l].interpolatePeak;
        anyInterpolated_ = anyInterpolated_ || interpolate_[l];
        settleEnd_[l] = static_cast<std::uint64_t>(std::ceil(lanes[l].settleSeconds * rate));
        const auto prime =
            code_ == TWeight::N
                ? 0U
                : static_cast<std::uint64_t>(std::ceil(lanes[l].primeSeconds * rate));
        primeEnd_[l] = settleEnd_[l] + prime;
    }
    candidates_.resize(256);  // calls of several hundred frames without allocation
    histogram_.reserve(W);
    for (std::size_t l = 0; l < W; ++l) {
        histogram_.emplace_back(active_[l] ? LevelHistogram() : LevelHistogram(0.0F, 0.0F));
    }
    shortLeqs_.resize(W);
    reset();
}

template <std::size_t W>
void BandLevels<W>::reset() {
    seen_ = 0;
    tw_.fill(0.0);
    primeSum_.fill(0.0);
    primeCount_.fill(0);
    tail_.fill(0.0F);
    tailSettled_ = false;
    for (std::size_t l = 0; l < W; ++l) primed_[l] = !active_[l] || code_ == TWeight::N;
    allPrimed_ = code_ != TWeight::N &&
                 std::all_of(primed_.begin(), primed_.end(), [](bool p) { return p; });
    periodSum_.fill(0.0);
    periodValid_.fill(false);
    periodPhase_ = 0;
    resetStatistics();
}

template <std::size_t W>
void BandLevels<W>::resetStatistics() {
    tickPhase_ = 0;
    count_ = 0;
    callCount_ = 0;
    energy_.fill(0.0);
    callEnergy_.fill(0.0);
    peak_.fill(0.0F);
    truePeak_.fill(0.0F);
    tailSettled_ = false;  // frames still waiting for interpolation belong to the old interval
    max_.fill(-std::numeric_limits<double>::infinity());
    min_.fill(std::numeric_limits<double>::infinity());
    hasExtremes_.fill(false);
    for (LevelHistogram& h : histogram_) h.reset();
    for (std::vector<Leq>& s : shortLeqs_) s.clear();
    if (code_ == TWeight::N) {
        // A new statistics interval starts a new 100 ms period.
        periodPhase_ = 0;
        periodSum_.fill(0.0);
    }
}

template <std::size_t W>
void BandLevels<W>::tick() {
    std::array<bool, W> take{};
    for (std::size_t l = 0; l < W; ++l) take[l] = active_[l] && primed_[l];
    LevelHistogram::addPowers(histogram_.data(), tw_.data(), take.data(), W);
}

template <std::size_t W>
void BandLevels<W>::process(const float* frames, std::size_t count, bool entering) {
    while (count > 0) {
        if (entering && allPrimed_) {
            processFast(frames, count);
            return;
        }
        // Sample by sample up to the last lane's end of priming (never during pre-roll,
        // which extends the priming), then the fast path.
        std::size_t slow = count;
        if (entering && code_ != TWeight::N) {
            std::uint64_t until = 0;
            for (std::size_t l = 0; l < W; ++l) {
                if (!primed_[l]) until = std::max(until, std::max(primeEnd_[l], seen_) - seen_ + 1);
            }
            slow = static_cast<std::size_t>(std::min<std::uint64_t>(count, until));
        }
        processSlow(frames, slow, entering);
        frames += slow * W;
        count -= slow;
        allPrimed_ = code_ != TWeight::N &&
                     std::all_of(primed_.begin(), primed_.end(), [](bool p) { return p; });
    }
}

template <std::size_t W>
void BandLevels<W>::finishPriming(std::size_t l) {
    if (primeCount_[l] > 0) {
        const double k = static_cast<double>(primeCount_[l]);
        tw_[l] += std::pow(1.0 - alpha_, k) * primeSum_[l] / k;
    }
    primed_[l] = true;
}

template <std::size_t W>
void BandLevels<W>::processFast(const float* frames, std::size_t count) {
    std::array<float, W> magnitude{};  // largest magnitude per lane in this call
    // The peak search looks at no sample below 0.7 of the lane's peak so far: the kernel lists
    // the stretches of frames that reach it.
    std::array<float, W> reach{};
    for (std::size_t l = 0; l < W; ++l) {
        reach[l] = interpolate_[l] ? 0.7F * std::max(truePeak_[l], peak_[l])
                                   : std::numeric_limits<float>::infinity();
    }
    const std::size_t room = 2 * (count / 8 + count / tickSamples_ + 2);
    if (candidates_.size() < room) candidates_.resize(room);
    candidateCount_ = 0;
    // Groups whose lanes 4..7 are unused need half the work.
    LevelRun run{energy_.data(),     tw_.data(),       max_.data(),
                 min_.data(),        magnitude.data(), alpha_,
                 weights_.data(),    weightsF_.data(), reach.data(),
                 candidates_.data(), &candidateCount_, lowHalfOnly_ ? 4U : 8U};
    std::size_t i = 0;
    while (i < count) {
        const std::size_t n = std::min(count - i, tickSamples_ - tickPhase_);
        const float* f = frames + i * W;
        if constexpr (W == 8) {
            const std::size_t before = candidateCount_;
            run.candidates = candidates_.data() + 2 * before;
            std::size_t added = 0;
            run.candidateCount = &added;
            kernels().levels(f, n, run);
            for (std::size_t c = 0; c < added; ++c) candidates_[2 * (before + c)] += i;
            candidateCount_ = before + added;
        } else {
            const double a = alpha_;
            for (std::size_t k = 0; k < n; ++k) {
                for (std::size_t l = 0; l < W; ++l) {
                    const float v = f[k * W + l];
                    const double p = static_cast<double>(v) * static_cast<double>(v);
                    energy_[l] += p;
                    magnitude[l] = std::max(magnitude[l], std::fabs(v));
                    tw_[l] = (1.0 - a) * tw_[l] + a * p;
                    max_[l] = std::max(max_[l], tw_[l]);
                    min_[l] = std::min(min_[l], tw_[l]);
                }
            }
        }
        for (std::size_t l = 0; l < W; ++l) hasExtremes_[l] = hasExtremes_[l] || active_[l];
        seen_ += n;
        count_ += n;
        i += n;
        tickPhase_ += n;
        if (tickPhase_ == tickSamples_) {
            tickPhase_ = 0;
            tick();
        }
    }
    for (std::size_t l = 0; l < W; ++l) peak_[l] = std::max(peak_[l], magnitude[l]);
    if (anyInterpolated_) refinePeaks(frames, count, magnitude);
}

template <std::size_t W>
void BandLevels<W>::refinePeaks(const float* frames, std::size_t count,
                                const std::array<float, W>& magnitude) {
    // Frames -8 .. -1 from the previous call (tail_), then this call's. A sample is
    // interpolated once four frames after it are known; the last four wait for the next call.
    const std::size_t total = kHistory + count;
    std::size_t begin = tailSettled_ ? kHistory - 4 : kHistory;
    const std::size_t end = total - 4;
    const QuarterKernels& k = quarterKernels();
    auto x = [&](std::size_t j, std::size_t l) {
        return j < kHistory ? tail_[j * W + l] : frames[(j - kHistory) * W + l];
    };
    // The crest is within half a sample of a sample at least cos(pi / 4) of it for content
    // below a quarter of the rate: samples under 0.7 of the running peak need no look.
    std::array<float, W> best{};
    std::array<float, W> threshold{};
    for (std::size_t l = 0; l < W; ++l) {
        best[l] = std::max(truePeak_[l], peak_[l]);
        threshold[l] = interpolate_[l] ? 0.7F * best[l] : std::numeric_limits<float>::infinity();
    }
    auto interpolateAround = [&](std::size_t j, std::size_t l) {
        using V4f = float __attribute__((vector_size(16)));
        V4f s[2] = {};
        for (std::size_t m = 0; m < 9; ++m) {
            const float w = x(j - 4 + m, l);
            for (std::size_t h = 0; h < 2; ++h) {
                V4f c;
                std::memcpy(&c, &k.columns[m][4 * h], sizeof c);
                s[h] += c * w;
            }
        }
        for (std::size_t i = 0; i < 6; ++i) best[l] = std::max(best[l], std::fabs(s[i / 4][i % 4]));
        best[l] = std::max(best[l], std::fabs(x(j, l)));
        threshold[l] = 0.7F * best[l];
    };
    // Only lanes whose largest magnitude reaches the threshold need a look at the frames:
    // the call's own frames (measured by the statistics kernel) and the ones waiting from
    // the previous call. Each lane sees its frames in order, the threshold rising as crests
    // are found.
    std::array<float, W> largest = magnitude;
    for (std::size_t j = begin; j < kHistory; ++j) {
        for (std::size_t l = 0; l < W; ++l) largest[l] = std::max(largest[l], std::fabs(x(j, l)));
    }
    bool any = false;
    for (std::size_t l = 0; l < W; ++l)
        any = any || (interpolate_[l] && largest[l] >= threshold[l]);
    if (!any) begin = end;
    auto visit = [&](std::size_t j) {
        for (std::size_t l = 0; l < W; ++l) {
            if (std::fabs(x(j, l)) >= threshold[l]) interpolateAround(j, l);
        }
    };
    std::size_t j = begin;
    for (; j < std::min(end, kHistory); ++j) visit(j);
    if constexpr (W == 8) {
        // The call's frames: only the stretches the statistics kernel found reaching the
        // threshold the call started with (the threshold only rises).
        for (std::size_t c = 0; c < candidateCount_ && j < end; ++c) {
            const std::size_t first = kHistory + candidates_[2 * c];
            const std::size_t last = std::min(end, first + candidates_[2 * c + 1]);
            for (j = std::max(j, first); j < last; ++j) visit(j);
        }
    } else {
        for (; j < end; ++j) visit(j);
    }
    for (std::size_t l = 0; l < W; ++l) {
        if (interpolate_[l]) truePeak_[l] = best[l];
    }
    keepTail(frames, count);
    tailSettled_ = true;
}

template <std::size_t W>
void BandLevels<W>::processSlow(const float* frames, std::size_t count, bool entering) {
    for (std::size_t k = 0; k < count; ++k) {
        for (std::size_t l = 0; l < W; ++l) {
            if (!active_[l]) continue;
            const float v = frames[k * W + l];
            const double p = static_cast<double>(v) * static_cast<double>(v);
            if (entering) energy_[l] += p;
            if (code_ == TWeight::N) {
                if (!entering) continue;
                // A period counts only when it starts settled.
                if (periodPhase_ == 0) periodValid_[l] = seen_ >= settleEnd_[l];
                if (seen_ >= settleEnd_[l]) peak_[l] = std::max(peak_[l], std::fabs(v));
                periodSum_[l] += p;
                continue;
            }
            if (seen_ < settleEnd_[l]) continue;
            if (!primed_[l]) {
                if (entering && seen_ >= primeEnd_[l]) {
                    finishPriming(l);
                } else {
                    tw_[l] += alpha_ * (p - tw_[l]);
                    primeSum_[l] += p;
                    ++primeCount_[l];
                    continue;
                }
            }
            tw_[l] += alpha_ * (p - tw_[l]);
            if (entering) {
                peak_[l] = std::max(peak_[l], std::fabs(v));
                max_[l] = std::max(max_[l], tw_[l]);
                min_[l] = std::min(min_[l], tw_[l]);
                hasExtremes_[l] = true;
            }
        }
        ++seen_;
        if (!entering) continue;
        ++count_;
        if (code_ == TWeight::N) {
            if (++periodPhase_ == periodSamples_) {
                periodPhase_ = 0;
                for (std::size_t l = 0; l < W; ++l) {
                    if (!active_[l]) continue;
                    if (periodValid_[l]) {
                        const double level = periodSum_[l] / static_cast<double>(periodSamples_);
                        max_[l] = std::max(max_[l], level);
                        min_[l] = std::min(min_[l], level);
                        hasExtremes_[l] = true;
                        histogram_[l].addPower(level);
                    }
                    periodSum_[l] = 0.0;
                }
            }
        } else if (++tickPhase_ == tickSamples_) {
            tickPhase_ = 0;
            tick();
        }
    }
    // The history for interpolation restarts with the fast path.
    keepTail(frames, count);
    tailSettled_ = false;
}

template <std::size_t W>
void BandLevels<W>::keepTail(const float* frames, std::size_t count) {
    if (count >= kHistory) {
        std::copy(frames + (count - kHistory) * W, frames + count * W, tail_.begin());
    } else if (count > 0) {
        std::copy(tail_.begin() + static_cast<std::ptrdiff_t>(count * W), tail_.end(),
                  tail_.begin());
        std::copy(frames, frames + count * W, tail_.end() - static_cast<std::ptrdiff_t>(count * W));
    }
}

template <std::size_t W>
void BandLevels<W>::beginCall() {
    callCount_ = count_;
    callEnergy_ = energy_;
}

template <std::size_t W>
void BandLevels<W>::endCall() {
    const double samples = static_cast<double>(count_ - callCount_);
    for (std::size_t l = 0; l < W; ++l) {
        if (!active_[l]) continue;
        // energy = mean square x duration, duration in seconds.
        shortLeqs_[l].emplace_back((energy_[l] - callEnergy_[l]) / rate_, samples / rate_);
    }
}

template <std::size_t W>
bool BandLevels<W>::settled(std::size_t lane) const {
    return primed_[lane];
}

template <std::size_t W>
double BandLevels<W>::leqPower(std::size_t lane) const {
    if (count_ == 0) return std::numeric_limits<double>::quiet_NaN();
    return energy_[lane] / static_cast<double>(count_);
}

template <std::size_t W>
bool BandLevels<W>::extremes(std::size_t lane, double& minPower, double& maxPower) const {
    if (!hasExtremes_[lane]) return false;
    minPower = min_[lane];
    maxPower = max_[lane];
    return true;
}

template <std::size_t W>
void BandLevels<W>::percentiles(std::size_t lane, const std::vector<float>& percents,
                                float* out) const {
    histogram_[lane].exceedanceLevels(percents.data(), percents.size(), out);
}

template class BandLevels<1>;
template class BandLevels<8>;

}  // namespace SlmLibrary
