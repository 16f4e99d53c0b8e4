// Time weighting of a squared signal (IEC 61672-1) and its name tables.
//
// F and S are exponential averages of the squared signal with time constants 0.125 s and
// 1 s: y[k] = y[k-1] + alpha (x[k] - y[k-1]), alpha = 1 - exp(-1 / (tau * rate)), which is
// the exact sampled response of the analog averager to a signal held over each sample, so
// the decay is 34.7 dB/s (F) and 4.3 dB/s (S) at any rate. The state is double precision:
// with S at 48000 Hz alpha is 2e-5, too small a step for a float state.
//
// N has no exponential averaging: the level is the equivalent level of consecutive 100 ms
// periods, counted from construction or reset. Each output sample holds the mean square of
// its period so far, so the last sample of every period holds that period's level.
//
// Impulse (code I) is not provided.
#pragma once

#include <cstddef>

namespace SlmLibrary {

class TWeight {
public:
    // N: no exponential averaging; I: impulse (never selected by the tool); F: 125 ms; S: 1 s.
    enum TWeightEnum : unsigned { N = 0, I = 1, F = 2, S = 3 };

    // sampleRate: rate of the audio; inputRate: rate of the squared samples given to
    // Process, lower than sampleRate when they come from a decimated band signal. The time
    // constants and the 100 ms period are applied at inputRate. Throws
    // std::invalid_argument for Impulse, an unknown code, or a rate that is not positive,
    // and for N when 100 ms is not a whole number of input samples.
    TWeight(unsigned code, double sampleRate, double inputRate);
    virtual ~TWeight() = default;
    TWeight(const TWeight&) = default;
    TWeight& operator=(const TWeight&) = default;

    // Back to the state after construction: zero, start of a 100 ms period.
    virtual void reset();
    // Time-weights n squared samples in place; state is kept between calls.
    virtual void Process(float* data, std::size_t n);

    // Sets the exponential average as if the signal had had this mean square for ever
    // (F and S only).
    void prime(double meanSquare) { state_ = meanSquare; }
    double state() const { return state_; }
    unsigned code() const { return code_; }

    // Time constant in seconds (0 for N).
    static double timeConstant(unsigned code);

    // Short texts for file names ("F"), long texts for headers and messages ("Fast").
    // A code outside the table gives "?".
    static const char* shortName(unsigned code);
    static const char* longName(unsigned code);

private:
    unsigned code_;
    double alpha_ = 0.0;             // F, S
    std::size_t periodSamples_ = 0;  // N
    double state_ = 0.0;             // F, S: average; N: sum of the period so far
    std::size_t phase_ = 0;          // N: samples of the current period so far
};

}  // namespace SlmLibrary
