// The hot loops of the level library, compiled twice: for the baseline x86-64 instruction
// set (the generic code path, also every other processor) and for AVX2 with fused
// multiply-add. The processor is asked once, at first use, which one it runs; the choice is
// a table of function pointers that never changes afterwards, so meters on different
// threads share nothing mutable. Building with -DORV_GENERIC_KERNELS keeps the generic table
// on every processor (to measure or test that path).
//
// Kernels:
// - iir / iirDecimate: one signal through a cascade of up to four second-order sections,
//   sixteen samples at a time as a state-space step (state of the sections' transposed
//   direct form II, see sos.h), every output or every second one; the generic path runs
//   the sections sample by sample instead (the step costs four times its vector work on
//   two-double registers without fused multiply-add), with the same state; decimation also
//   in single precision (anti-alias filters), one eight-float vector for the whole state;
// - zeros and lanes: up to eight band filters side by side, all-pole sections behind an
//   input that already holds their zeros (see sos.h), float or double;
// - levels: squares, energy, exponential time weighting and its extremes of four or eight
//   lanes, and where the magnitudes reach thresholds for the peak search (band_levels.h).
// The generic table takes its lanes, statistics and single-precision decimation from
// kernel_narrow.h, written for its 16-byte registers; the rest of both tables comes from
// kernel_bodies.h.
#pragma once

#include <cstddef>
#include <cstdint>

namespace SlmLibrary {

// Sixteen-sample state-space step of a cascade of up to four sections (state size 2K <= 8),
// all arrays column by column, padded with zeros: next state = p s + q u, outputs
// y = o s + t u, for the state s at the start of the block and its inputs u; od and td are
// the rows of o and t of the odd outputs (1, 3, .., 15), for decimation.
struct IirBlockPlan {
    static constexpr std::size_t kBlock = 16;
    static constexpr std::size_t kMaxOrder = 8;
    alignas(32) double p[kMaxOrder][kMaxOrder];    // p[k]: column k (state k -> next state)
    alignas(32) double q[kBlock][kMaxOrder];       // q[i]: column i (input i -> next state)
    alignas(32) double o[kMaxOrder][kBlock];       // o[k]: column k (state k -> outputs)
    alignas(32) double t[kBlock][kBlock];          // t[i]: column i (input i -> outputs)
    alignas(32) double od[kMaxOrder][kBlock / 2];  // o[k][2j + 1]
    alignas(32) double td[kBlock][kBlock / 2];     // t[i][2j + 1]
    // The same for decimation in single precision (state too).
    alignas(32) float pf[kMaxOrder][kMaxOrder];
    alignas(32) float qf[kBlock][kMaxOrder];
    alignas(32) float odf[kMaxOrder][kBlock / 2];
    alignas(32) float tdf[kBlock][kBlock / 2];
    double sos[4][5];  // the sections (b0 b1 b2 a1 a2), for kernels that run them directly
};

// Running state of the statistics of eight lanes (band_levels.h), in and out of a kernel:
// lanes 0 .. lanes - 1 are computed (4 or 8), the others left alone. For the peak search,
// the kernel also lists the stretches of up to eight frames (first, count: frame numbers
// from the start of its frames) where a lane's magnitude reaches `reach`.
struct LevelRun {
    double* energy;
    double* tw;
    double* maxima;
    double* minima;
    float* magnitude;  // largest magnitude, max with what is there (all eight lanes)
    double alpha;
    const double* weights;      // a (1 - a)^(7 - j) for j = 0 .. 7, then (1 - a)^8
    const float* weightsF;      // the first eight as floats
    const float* reach;         // eight thresholds (+inf: no search)
    std::uint32_t* candidates;  // pairs first, count; room for one per eight frames and one
    std::size_t* candidateCount;
    unsigned lanes;
};

struct KernelTable {
    const char* name;
    // `blocks` blocks of kBlock samples: out receives kBlock per block (iir) or the odd
    // samples, kBlock / 2 per block (iirDecimate). in and out may be the same array.
    // Indexed by order / 2 - 1.
    void (*iir[4])(const IirBlockPlan& plan, double* state, const float* in, std::size_t blocks,
                   float* out);
    void (*iirDecimate[4])(const IirBlockPlan& plan, double* state, const float* in,
                           std::size_t blocks, float* out);
    // iirDecimate in single precision, any order (state: eight floats).
    void (*iirDecimateF)(const IirBlockPlan& plan, float* state, const float* in,
                         std::size_t blocks, float* out);
    // n frames of eight lanes on one input u: all-pole sections (coef: per section a1[8],
    // a2[8]; state: per section w1[8], w2[8]) and the gain (gain[8]); lanes with zero[l] = 1
    // apply (1 - z^-2) to the input of their last section (zero null: none; at least two
    // sections where given). Indexed by the number of sections - 1.
    void (*lanesF[4])(const float* u, std::size_t n, float* out, const float* coef,
                      const float* gain, const float* zero, float* state);
    void (*lanesD[4])(const double* u, std::size_t n, float* out, const double* coef,
                      const double* gain, const double* zero, double* state);
    // (1 - z^-2)^order of x (x[-8] .. x[-1] readable), n outputs; indexed by order - 1.
    void (*zerosF[4])(const float* x, std::size_t n, float* out);
    void (*zerosD[4])(const float* x, std::size_t n, double* out);
    // Statistics of n frames of eight floats (see LevelRun).
    void (*levels)(const float* frames, std::size_t n, const LevelRun& state);
};

// The generic table, the AVX2 table (null where this processor or build has none), and the
// one in use.
const KernelTable& genericKernels();
const KernelTable* avx2Kernels();
const KernelTable& kernels();

}  // namespace SlmLibrary
