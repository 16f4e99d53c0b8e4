#include "dsp.h"

#include <cmath>

namespace SlmLibrary {

float Dsp::powerToDb(double power) {
    if (!(power > 0.0)) return 0.0F;  // also catches NaN
    return static_cast<float>(10.0 * std::log10(power));
}

double Dsp::dbToPower(float db) { return std::pow(10.0, static_cast<double>(db) / 10.0); }

void Dsp::GetdB_I(float* data, std::size_t n) {
    for (std::size_t i = 0; i < n; ++i) data[i] = powerToDb(data[i]);
}

void Dsp::GetPwrdB(const float* in, float* out, std::size_t n) {
    for (std::size_t i = 0; i < n; ++i) out[i] = powerToDb(in[i]);
}

void Dsp::GetPwrdB_I(float* data, std::size_t n) { GetPwrdB(data, data, n); }

}  // namespace SlmLibrary
