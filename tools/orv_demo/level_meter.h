// The logger's 100 ms levels of a run of calibrated samples, computed with the level
// library: A and C frequency weighting, F time weighting of the squared weighted signals.
#pragma once

#include <cstddef>
#include <vector>

#include "fweight.h"
#include "tweight.h"

namespace orv_demo {

inline constexpr std::size_t kPeriodSamples = 4800;  // 100 ms at 48 kHz

// Mean squares (powers) of one 100 ms period, in the squared units of the calibrated signal.
struct PeriodPowers {
    double leqA = 0.0, leqC = 0.0;  // mean square of the period
    double splA = 0.0, splC = 0.0;  // F-time-weighted mean square at the period's last sample
};

class LevelMeter {
public:
    // Weighting filters and time weightings start from silence.
    LevelMeter();

    // Runs `count` samples (a whole number of periods) through the meter, keeping the
    // filter states for the next call, and appends one entry per period to `out`.
    void process(const float* samples, std::size_t count, std::vector<PeriodPowers>& out);

private:
    SlmLibrary::FWeight weighting_;
    SlmLibrary::TWeight timeA_, timeC_;
    std::vector<float> c_, a_;  // squared C- and A-weighted signals
};

}  // namespace orv_demo
