// Conversions between power (mean square) and level (dB).
//
// Power and level never share a variable: energy is pooled as power (Leq, Stats) and only
// turned into dB for output. A power that is zero, negative or not a number has no level;
// it reads as 0.0 dB, the value the result files use for "no level".
#pragma once

#include <cstddef>

namespace SlmLibrary {

class Dsp {
public:
    // 10*log10 of one power value (0.0 for a power <= 0 or NaN).
    static float powerToDb(double power);
    // The power of a level in dB.
    static double dbToPower(float db);

    // In place: mean squares -> dB.
    static void GetdB_I(float* data, std::size_t n);
    // Powers from Leq::GetLeq -> dB.
    static void GetPwrdB(const float* in, float* out, std::size_t n);
    static void GetPwrdB_I(float* data, std::size_t n);
};

}  // namespace SlmLibrary
