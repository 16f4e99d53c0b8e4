// Equivalent continuous level: pooled energy over a duration, with an overload mark.
#pragma once

#include <cstddef>
#include <vector>

namespace SlmLibrary {

class Leq {
public:
    // energy: sum of power x duration; duration in any unit used consistently by the
    // entries that are pooled together (one unit per dB value added with AddSamples).
    explicit Leq(double energy = 0.0, double duration = 0.0, bool overload = false)
        : energy_(energy), duration_(duration), overload_(overload) {}

    // A Leq of `duration` units at mean square `meanSquare`.
    static Leq fromMeanSquare(double meanSquare, double duration) {
        return Leq(meanSquare * duration, duration);
    }

    // isDb true: each value is a level in dB worth one unit of duration.
    // isDb false: each value is a power (mean square) worth one unit of duration.
    void AddSamples(const float* values, std::size_t n, bool isDb);
    // Pools other Leqs: energies and durations add up, overload marks combine.
    void AddSamples(const std::vector<Leq>& list);
    void add(const Leq& other);

    // Mean power over the duration; NaN when nothing was added.
    float GetLeq() const;
    double meanPower() const;

    void Reset();

    bool overload() const { return overload_; }
    void setOverload(bool on) { overload_ = on; }
    double energy() const { return energy_; }
    double duration() const { return duration_; }

private:
    double energy_;
    double duration_;
    bool overload_;
};

}  // namespace SlmLibrary
