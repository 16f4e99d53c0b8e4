// Distribution of levels in 0.1 dB classes, with exact extremes, for exceedance levels Ln.
#pragma once

#include <cstddef>
#include <cstdint>
#include <vector>

namespace SlmLibrary {

class LevelHistogram {
public:
    // Classes are centred on multiples of 0.1 dB from minDb to maxDb; a level outside the
    // range is counted in the nearest end class (its exact value still sets Lmin/Lmax).
    explicit LevelHistogram(float minDb = -100.0F, float maxDb = 250.0F);

    void add(float db);
    // The same as add(Dsp::powerToDb(power)) for the classes and the count, mostly without a
    // logarithm. minimum() and maximum() are kept by add only: a histogram is fed by one of
    // the two.
    void addPower(double power);
    // addPower(powers[i]) on histograms[i] for every i < n with take[i]: the levels of
    // several histograms at once, which is faster than one after the other.
    static void addPowers(LevelHistogram* histograms, const double* powers, const bool* take,
                          std::size_t n);
    void reset();

    std::uint64_t count() const { return count_; }
    float minimum() const { return min_; }  // 0.0 when empty
    float maximum() const { return max_; }  // 0.0 when empty

    // Ln: the level reached or exceeded by n % of the entries (n = 10 gives L10, which is
    // at or above L90). n <= 0 gives the highest class, n >= 100 the lowest. Fractional n
    // is allowed. Returns 0.0 when empty.
    float exceedanceLevel(double percent) const;
    // Several at once in a single walk; `percents` in any order.
    void exceedanceLevels(const float* percents, std::size_t n, float* out) const;

private:
    std::size_t classOf(float db) const;
    // addPower, with quick the power's level in tenths of a dB (within 1e-8).
    void addPower(double power, double quick);
    float levelOfClass(std::size_t index) const;

    int firstClass_;  // class index of the lowest class, in tenths of a dB
    std::vector<std::uint32_t> counts_;
    std::uint64_t count_ = 0;
    float min_ = 0.0F;
    float max_ = 0.0F;
};

}  // namespace SlmLibrary
