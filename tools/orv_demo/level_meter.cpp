#include "level_meter.h"

#include "wave_writer.h"

namespace orv_demo {

LevelMeter::LevelMeter()
    : weighting_(kSampleRate),
      timeA_(SlmLibrary::TWeight::F, kSampleRate, kSampleRate),
      timeC_(SlmLibrary::TWeight::F, kSampleRate, kSampleRate) {
    weighting_.init(SlmLibrary::FWeight::All, kSampleRate);
}

void LevelMeter::process(const float* samples, std::size_t count, std::vector<PeriodPowers>& out) {
    c_.resize(count);
    a_.resize(count);
    weighting_.ProcessAll(samples, nullptr, c_.data(), a_.data(), count);
    for (std::size_t i = 0; i < count; ++i) {
        c_[i] *= c_[i];
        a_[i] *= a_[i];
    }
    for (std::size_t first = 0; first + kPeriodSamples <= count; first += kPeriodSamples) {
        float* a = a_.data() + first;
        float* c = c_.data() + first;
        double sumA = 0.0, sumC = 0.0;
        for (std::size_t i = 0; i < kPeriodSamples; ++i) {
            sumA += a[i];
            sumC += c[i];
        }
        timeA_.Process(a, kPeriodSamples);
        timeC_.Process(c, kPeriodSamples);
        PeriodPowers p;
        p.leqA = sumA / kPeriodSamples;
        p.leqC = sumC / kPeriodSamples;
        p.splA = a[kPeriodSamples - 1];
        p.splC = c[kPeriodSamples - 1];
        out.push_back(p);
    }
}

}  // namespace orv_demo
