// Processing states of second-order-section cascades (transposed direct form II).
//
// The coefficients come from filter_design.h; the states here hold nothing else, so every
// channel owns its own small copy and nothing mutable is shared between meters.
#pragma once

#include <array>
#include <cstddef>
#include <vector>

#include "filter_design.h"

namespace SlmLibrary {

// One signal through a cascade, double precision state (used where poles sit close to
// z = 1 at the full rate: frequency weighting, filtered channel, anti-alias filters).
class SosCascade {
public:
    SosCascade() = default;
    explicit SosCascade(const SosList& sos);

    void reset();
    // in and out may be the same array.
    void process(const float* in, float* out, std::size_t n);
    double processSample(double x);
    // Filters n samples and keeps every second output (the odd ones, counting from the
    // first sample since reset), so that output k ends at input 2k+1. Returns the number
    // of outputs written.
    std::size_t processDecimate(const float* in, std::size_t n, float* out);

    std::size_t sections() const { return coeffs_.size(); }

private:
    std::vector<Sos> coeffs_;
    std::vector<std::array<double, 2>> state_;  // s1, s2 per section
    bool odd_ = false;                          // decimation phase
};

// Up to kLaneWidth band filters fed with the same input, run side by side: each lane is one
// band, every lane has the same number of sections (unused ones are pass-through), so the
// per-sample work is a few vector operations across lanes.
inline constexpr std::size_t kLaneWidth = 8;

template <typename T>
class SosLanes {
public:
    static constexpr std::size_t kMaxSections = 4;

    SosLanes() = default;
    // sos[l] is the cascade of lane l (empty for an unused lane); at most kMaxSections
    // sections per lane.
    explicit SosLanes(const std::vector<SosList>& sos);

    void reset();
    // out receives n frames of kLaneWidth floats (lane-interleaved).
    void process(const float* in, std::size_t n, float* out);
    std::size_t sections() const { return sections_; }

private:
    std::size_t sections_ = 0;
    std::vector<T> coef_;  // [section][b0 b1 b2 a1 a2][lane]
    std::vector<T> s1_;    // [section][lane]
    std::vector<T> s2_;
};

extern template class SosLanes<float>;
extern template class SosLanes<double>;

}  // namespace SlmLibrary
