#include "leq.h"

#include <limits>

#include "dsp.h"

namespace SlmLibrary {

void Leq::AddSamples(const float* values, std::size_t n, bool isDb) {
    for (std::size_t i = 0; i < n; ++i) {
        energy_ += isDb ? Dsp::dbToPower(values[i]) : static_cast<double>(values[i]);
        duration_ += 1.0;
    }
}

void Leq::AddSamples(const std::vector<Leq>& list) {
    for (const Leq& l : list) add(l);
}

void Leq::add(const Leq& other) {
    energy_ += other.energy_;
    duration_ += other.duration_;
    overload_ = overload_ || other.overload_;
}

double Leq::meanPower() const {
    if (duration_ <= 0.0) return std::numeric_limits<double>::quiet_NaN();
    return energy_ / duration_;
}

float Leq::GetLeq() const { return static_cast<float>(meanPower()); }

void Leq::Reset() {
    energy_ = 0.0;
    duration_ = 0.0;
    overload_ = false;
}

}  // namespace SlmLibrary
