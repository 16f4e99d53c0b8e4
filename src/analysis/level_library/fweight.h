// Frequency weighting A, C and Z (IEC 61672-1:2013) and its name tables.
//
// Accuracy at 48000 Hz (design response against the analog definition, 0 dB at 1 kHz):
// within 0.1 dB from 10 Hz to 10 kHz, within 0.5 dB to 16 kHz and inside the class 1
// acceptance limits up to 20 kHz (slm_selftest prints the table).
//
// How: the low-frequency poles (20.6 Hz double, 107.7 Hz, 737.9 Hz) and the zeros at 0 Hz go
// through the bilinear transform, whose frequency warping is negligible far below Nyquist.
// The double pole at 12194 Hz, where a plain bilinear transform loses 1.2 dB at 10 kHz and
// 6 dB at 16 kHz, is realised instead by a section with the poles of the impulse-invariant
// mapping, exp(-2 pi 12194 / fs), and a numerator fitted by least squares (relative error,
// 10 Hz to 20 kHz) to the analog magnitude divided by the rest of the digital cascade. The
// coefficients are computed once per sample rate in double precision; the filter state is
// double precision too (poles close to z = 1), input and output are float.
#pragma once

#include <cstddef>
#include <vector>

#include "sos.h"

namespace SlmLibrary {

class FWeight {
public:
    // Codes stored in settings and passed between modules. 5 selects the three outputs of
    // ProcessAll (Z, C and A of one input).
    enum FWeightEnum : unsigned { Z = 0, A = 1, C = 2, All = 5 };

    // A Z-weighting until init; the rate is the audio sample rate in Hz.
    explicit FWeight(double sampleRate = 48000.0);

    // Selects the weighting (Z, A, C or All) and clears the state. Throws
    // std::invalid_argument for another code or a rate below 8000 Hz.
    void init(unsigned code, double sampleRate);
    unsigned code() const { return code_; }
    double sampleRate() const { return fs_; }

    // The selected weighting of n samples; in mode All the A-weighted signal. in and out may
    // be the same array. State is kept between calls.
    void Process(const float* in, float* out, std::size_t n);
    // Z, C and A outputs of one input, whatever the selected code; any output pointer may be
    // null. Returns 1.
    int ProcessAll(const float* in, float* outZ, float* outC, float* outA, std::size_t n);
    // Clears the filter state (the next sample is processed as if after silence).
    void reset();

    // Response of the digital design and of the analog definition, dB re 1 kHz.
    static double designResponseDb(unsigned code, double f, double sampleRate);
    static double analogResponseDb(unsigned code, double f);
    // Time for the filter's slowest pole to decay by decayDb (0 for Z).
    static double settleSeconds(unsigned code, double sampleRate, double decayDb);

    // Name texts used in result file names ("A") and headers ("A"). A code outside the
    // table gives "?".
    static const char* shortName(unsigned code);
    static const char* longName(unsigned code);

private:
    unsigned code_ = Z;
    double fs_;
    // Each weighting as one cascade (one pass, the whole filter in double precision): the
    // 20.6 Hz double pole with two zeros at 0 Hz, then for A the 107.7 Hz, 737.9 Hz and
    // 12194 Hz poles, for C the 12194 Hz poles.
    SosCascade a_;
    SosCascade c_;
};

}  // namespace SlmLibrary
