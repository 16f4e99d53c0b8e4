// Throughput of the level meter, single-threaded: 60 s of noise through the A-weighted,
// F-time-weighted third-octave (36 bands) and octave (12 bands) analysis with statistics,
// in the work item's steps of one second. Rates are per second of CPU time of the one
// thread (immune to other load on the machine); "x_realtime" is seconds of audio per second.
#include <benchmark/benchmark.h>

#include <cstdint>
#include <vector>

#include "slm.h"

namespace {

using SlmLibrary::FWeight;
using SlmLibrary::Slm;
using SlmLibrary::TWeight;

constexpr std::size_t kRate = 48000;
constexpr std::size_t kSeconds = 60;

const std::vector<float>& noise() {
    static const std::vector<float> samples = [] {
        std::vector<float> x(kRate * kSeconds);
        std::uint32_t seed = 2463534242U;
        for (float& v : x) {
            seed ^= seed << 13;
            seed ^= seed >> 17;
            seed ^= seed << 5;
            v = static_cast<float>(static_cast<double>(seed) / 4294967296.0 - 0.5) * 2000.0F;
        }
        return x;
    }();
    return samples;
}

void analyse(benchmark::State& state, bool third) {
    const std::vector<float>& x = noise();
    for (auto _ : state) {
        Slm slm(48000, 1, 48000);
        if (third) {
            slm.initThirdOct(TWeight::F, FWeight::A, 0, 35, 48000, 0);
        } else {
            slm.initFullOct(TWeight::F, FWeight::A, 0, 11, 48000, 0);
        }
        slm.setPercentiles({10.0F, 50.0F, 90.0F});
        slm.resetAll();
        for (std::size_t pos = 0; pos < x.size(); pos += kRate) {
            slm.addSamples(x.data() + pos, kRate, kRate / 10, kRate);
        }
        float leq = 0.0F;
        float levels[3] = {};
        slm.getStatistics(third ? 22 : 7, &leq, nullptr, nullptr, levels, nullptr, nullptr,
                          nullptr);
        benchmark::DoNotOptimize(leq);
        benchmark::DoNotOptimize(levels);
    }
    const double samples = static_cast<double>(state.iterations()) * static_cast<double>(x.size());
    state.counters["samples_per_s"] = benchmark::Counter(samples, benchmark::Counter::kIsRate);
    state.counters["x_realtime"] =
        benchmark::Counter(samples / static_cast<double>(kRate), benchmark::Counter::kIsRate);
}

void BM_ThirdOctave36Bands_A_F_60s(benchmark::State& state) { analyse(state, true); }
void BM_Octave12Bands_A_F_60s(benchmark::State& state) { analyse(state, false); }

BENCHMARK(BM_ThirdOctave36Bands_A_F_60s)->Unit(benchmark::kMillisecond);
BENCHMARK(BM_Octave12Bands_A_F_60s)->Unit(benchmark::kMillisecond);

}  // namespace

BENCHMARK_MAIN();
