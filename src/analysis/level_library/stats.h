// Statistics of a sequence of 100 ms levels: energy-mean Leq, extremes and exceedance levels.
#pragma once

#include <cstddef>
#include <cstdint>
#include <vector>

#include "leq.h"
#include "level_histogram.h"

namespace SlmLibrary {

// Result of one statistics interval. Callers read lmin (first), lmax (second) and the
// overload mark (seventh word); battery is a field a caller may fill.
struct structResult {
    float lmin = 0.0F;
    float lmax = 0.0F;
    float leq = 0.0F;  // dB, 0.0 when empty
    float lpeak = 0.0F;
    float temperature = 0.0F;
    float battery = 0.0F;
    std::uint32_t overload = 0;
};

class Stats {
public:
    Stats() = default;

    void reset();
    // Pools the energy of a Leq into the interval Leq (and its overload mark).
    void addSample(const Leq& leq);
    // Enters one level (dB) into the distribution and the extremes.
    void addSample(float levelDb);

    void setUpPercentiles(const float* percents, std::size_t n);
    // Writes min(n, configured) levels into out; returns how many were written, 0 when
    // no level was entered since reset.
    int getPercentiles(float* out, std::size_t n) const;
    structResult getGenResults() const;
    // Mean power of the pooled energy; NaN when empty.
    float getLeq() const { return energy_.GetLeq(); }

    std::uint64_t levelCount() const { return histogram_.count(); }

private:
    Leq energy_;
    LevelHistogram histogram_;
    std::vector<float> percents_;
};

}  // namespace SlmLibrary
