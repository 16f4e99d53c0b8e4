// Processing states of second-order-section cascades.
//
// The coefficients come from filter_design.h; the states here hold nothing else, so every
// channel owns its own small copy and nothing mutable is shared between meters. The loops
// themselves are in kernels.h.
#pragma once

#include <array>
#include <cstddef>
#include <memory>
#include <vector>

#include "filter_design.h"
#include "kernels.h"

namespace SlmLibrary {

// The block matrices of a cascade of up to four sections (kernels.h).
IirBlockPlan makeIirBlockPlan(const SosList& sos);

// One signal through a cascade of up to four sections, double precision (used where poles
// sit close to z = 1 at the full rate: frequency weighting, filtered channel), or for
// decimation in single precision (anti-alias filters). The cascade runs in blocks of sixteen
// samples counted from reset: each block is one state-space step (the state of the
// sections' transposed direct form II at the block start, times fixed matrices, plus the
// block's inputs times fixed matrices, computed once from the sections), which turns a chain
// of dependent multiply-adds per sample into independent vector operations. The outputs of
// a block that a call leaves unfinished come from the same step with its missing inputs
// zero (they do not reach earlier outputs), and the block is finished by the next call:
// results do not depend on how the signal is cut into calls.
class SosCascade {
public:
    enum class Precision { Double, Single };

    SosCascade() = default;
    // decimation: the precision of processDecimate. Single (state and block matrices in
    // float) suits filters whose poles stay well inside the unit circle, such as the
    // anti-alias filters of the octave bank: their rounding noise stays near that of the
    // float samples themselves. Throws std::invalid_argument for more than four sections.
    explicit SosCascade(const SosList& sos, Precision decimation = Precision::Double);

    void reset();
    // in and out may be the same array.
    void process(const float* in, float* out, std::size_t n);
    // Filters n samples and keeps every second output (the odd ones, counting from the
    // first sample since reset), so that output k ends at input 2k+1. Returns the number
    // of outputs written. in and out may be the same array.
    std::size_t processDecimate(const float* in, std::size_t n, float* out);

    std::size_t sections() const { return sections_; }

private:
    template <typename S>
    using Kernel = void (*)(const IirBlockPlan&, S*, const float*, std::size_t, float*);
    template <bool Decimate, typename S>
    std::size_t run(Kernel<S> kernel, std::array<S, IirBlockPlan::kMaxOrder>& state,
                    const float* in, std::size_t n, float* out);

    std::size_t sections_ = 0;
    bool single_ = false;
    std::shared_ptr<const IirBlockPlan> plan_;  // read-only, shared by copies
    // At the block start, double or single precision.
    alignas(32) std::array<double, IirBlockPlan::kMaxOrder> state_{};
    alignas(32) std::array<float, IirBlockPlan::kMaxOrder> stateF_{};
    std::array<float, IirBlockPlan::kBlock> pending_{};  // inputs of the unfinished block
    std::size_t pendingCount_ = 0;
    bool odd_ = false;  // decimation phase (no sections)
};

// The zeros of a band-pass made by the bilinear transform, n at z = 1 and n at z = -1:
// (1 - z^-2)^n, applied to a signal in double precision and kept for the band filters of
// SosLanes. Order 4 at most; the last eight input samples are kept between calls.
class BandZeros {
public:
    // Throws std::invalid_argument for an order above 4.
    explicit BandZeros(unsigned order = 0);
    unsigned order() const { return order_; }
    void reset() { last_.fill(0.0F); }
    // out[i] for in[i], i < n; T is float or double.
    template <typename T>
    void process(const float* in, std::size_t n, T* out);

private:
    unsigned order_;
    std::array<float, 8> last_{};  // the last eight input samples
};

// Up to kLaneWidth band-pass filters fed with the same signal, run side by side: each lane
// is one band. A band-pass of n sections has the zeros (1 - z^-2)^n, which BandZeros applies
// once for every lane: the lanes then run all-pole sections (two multiply-adds per section
// and sample, one of them on the recursion) and their gain. Lanes with fewer sections than
// others get pass-through sections. The input holds the zeros of the lanes with the fewest
// sections; lanes with one section more apply their last (1 - z^-2) themselves, to the input
// of their last section (the bands next to a stage's Nyquist frequency, where that pair
// costs no precision).
inline constexpr std::size_t kLaneWidth = 8;

template <typename T>
class SosLanes {
public:
    static constexpr std::size_t kMaxSections = 4;

    SosLanes() = default;
    // sos[l] is the cascade of lane l (empty for an unused lane, which reads 0); at most
    // kMaxSections sections per lane, each lane's numerator a multiple of (1 - z^-2)^n with
    // n its number of sections, and the numbers of sections of the lanes at most one apart
    // (throws std::invalid_argument otherwise).
    explicit SosLanes(const std::vector<SosList>& sos);

    void reset();
    // The zero order of the input (the fewest sections of a lane).
    unsigned order() const { return order_; }
    // u: the band signal through BandZeros of order(); out receives n frames of kLaneWidth
    // floats (lane-interleaved).
    void process(const T* u, std::size_t n, float* out);
    std::size_t sections() const { return sections_; }

private:
    std::size_t sections_ = 0;
    unsigned order_ = 0;
    std::vector<T> coef_;   // [section][a1 a2][lane]
    std::vector<T> gain_;   // [lane]
    std::vector<T> zero_;   // [lane]: 1 where the last section adds a pair of zeros
    bool extra_ = false;    // some lane does
    std::vector<T> state_;  // [section][w1 w2][lane]
};

extern template class SosLanes<float>;
extern template class SosLanes<double>;

}  // namespace SlmLibrary
