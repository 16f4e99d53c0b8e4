// Prints the conformance of the level library at 48000 Hz: A and C weighting against the
// IEC 61672-1 class 1 limits, and every octave and third-octave band against the
// IEC 61260-1 class 1 mask, measured with sine tones on the implemented multirate bank.
//
// Usage: slm_selftest [--summary]   (--summary: one line per band instead of every point)
// Exit status 0 when everything is inside the limits, 1 otherwise.
#include <algorithm>
#include <cmath>
#include <cstdio>
#include <cstring>
#include <vector>

#include "analysis/level_library/fweight.h"
#include "analysis/level_library/octave_filter.h"

namespace {

using SlmLibrary::FWeight;
using SlmLibrary::OctaveFilter;

constexpr double kFs = 48000.0;
constexpr double kInf = 1e300;

// IEC 61672-1:2013 class 1 acceptance limits (upper, lower) at the nominal third-octave
// frequencies 10 Hz .. 20 kHz (x = -20 .. 13, f = 1000 * 10^(x/10)).
struct WeightingLimit {
    const char* nominal;
    double upper;
    double lower;  // -kInf: no lower limit
};
constexpr WeightingLimit kWeightingLimits[] = {
    {"10", 3.0, -kInf},    {"12.5", 2.5, -kInf},  {"16", 2.0, -4.0},    {"20", 2.0, -2.0},
    {"25", 2.0, -1.5},     {"31.5", 1.5, -1.5},   {"40", 1.0, -1.0},    {"50", 1.0, -1.0},
    {"63", 1.0, -1.0},     {"80", 1.0, -1.0},     {"100", 1.0, -1.0},   {"125", 1.0, -1.0},
    {"160", 1.0, -1.0},    {"200", 1.0, -1.0},    {"250", 1.0, -1.0},   {"315", 1.0, -1.0},
    {"400", 1.0, -1.0},    {"500", 1.0, -1.0},    {"630", 1.0, -1.0},   {"800", 1.0, -1.0},
    {"1000", 0.7, -0.7},   {"1250", 1.0, -1.0},   {"1600", 1.0, -1.0},  {"2000", 1.0, -1.0},
    {"2500", 1.0, -1.0},   {"3150", 1.0, -1.0},   {"4000", 1.0, -1.0},  {"5000", 1.5, -1.5},
    {"6300", 1.5, -2.0},   {"8000", 1.5, -2.5},   {"10000", 2.0, -3.0}, {"12500", 2.0, -5.0},
    {"16000", 2.5, -16.0}, {"20000", 3.0, -kInf},
};

const char* limitText(double v, char* buffer, std::size_t size) {
    if (std::abs(v) >= kInf) {
        std::snprintf(buffer, size, "%s", v > 0 ? "+inf" : "-inf");
    } else {
        std::snprintf(buffer, size, "%+.1f", v);
    }
    return buffer;
}

// Returns the worst margin (dB; negative = outside).
double printWeighting(unsigned code) {
    std::printf("\n%s weighting (IEC 61672-1:2013, class 1), dB re 1 kHz\n",
                FWeight::longName(code));
    std::printf("%9s %10s %10s %8s %8s %8s %8s\n", "f [Hz]", "design", "analog", "error", "upper",
                "lower", "margin");
    double worst = kInf;
    for (int x = -20; x <= 13; ++x) {
        const WeightingLimit& lim = kWeightingLimits[x + 20];
        const double f = 1000.0 * std::pow(10.0, x / 10.0);
        const double design = FWeight::designResponseDb(code, f, kFs);
        const double analog = FWeight::analogResponseDb(code, f);
        const double error = design - analog;
        const double margin = std::min(lim.upper - error, error - lim.lower);
        worst = std::min(worst, margin);
        char up[16];
        char lo[16];
        std::printf("%9s %10.3f %10.3f %+8.3f %8s %8s %8.2f%s\n", lim.nominal, design, analog,
                    error, limitText(lim.upper, up, sizeof up), limitText(lim.lower, lo, sizeof lo),
                    margin, margin < 0 ? "  OUTSIDE" : "");
    }
    std::printf("worst margin %.2f dB\n", worst);
    return worst;
}

double printBank(OctaveFilter::Bank kind, bool summary) {
    const bool third = kind == OctaveFilter::Bank::Third;
    std::printf("\n%s bank (IEC 61260-1:2014, class 1), measured with tones at 48000 Hz,\n",
                third ? "1/3-octave" : "1/1-octave");
    std::printf("relative attenuation in dB (positive = attenuated)\n");
    if (!summary) {
        std::printf("%8s %11s %8s %10s %8s %8s %8s\n", "band", "f [Hz]", "f/fm", "atten.", "min",
                    "max", "margin");
    } else {
        std::printf("%8s %12s %8s %12s\n", "band", "fm [Hz]", "margin", "at f/fm");
    }
    const OctaveFilter bank(kind);
    const std::vector<double> breakpoints = OctaveFilter::maskBreakpoints(kind);
    double worstAll = kInf;
    for (unsigned b = 0; b < OctaveFilter::bandCount(kind); ++b) {
        const double fm = OctaveFilter::midBandFrequency(kind, b);
        const double settle = bank.settleSeconds(b, 60.0) + 0.01;
        const double measure = std::max(0.02, 4.0 / fm);
        double worst = kInf;
        double worstAt = 1.0;
        std::vector<double> omegas;
        for (auto it = breakpoints.rbegin(); it != breakpoints.rend(); ++it) {
            if (*it > 1.0) omegas.push_back(1.0 / *it);
        }
        omegas.insert(omegas.end(), breakpoints.begin(), breakpoints.end());
        for (const double omega : omegas) {
            const double f = fm * omega;
            if (f >= 0.499 * kFs) continue;
            const double attenuation = -OctaveFilter::toneResponseDb(kind, f, settle, measure)[b];
            const OctaveFilter::Limits lim = OctaveFilter::class1Limits(kind, omega);
            const double margin =
                std::min(attenuation - lim.minAttenuationDb, lim.maxAttenuationDb - attenuation);
            if (margin < worst) {
                worst = margin;
                worstAt = omega;
            }
            if (!summary) {
                char hi[16];
                std::printf("%8s %11.2f %8.4f %10.2f %8.1f %8s %8.2f%s\n",
                            OctaveFilter::bandName(kind, b), f, omega, attenuation,
                            lim.minAttenuationDb,
                            std::isinf(lim.maxAttenuationDb)
                                ? "+inf"
                                : limitText(lim.maxAttenuationDb, hi, sizeof hi),
                            margin, margin < 0 ? "  OUTSIDE" : "");
            }
        }
        if (summary)
            std::printf("%8s %12.3f %8.2f %12.4f\n", OctaveFilter::bandName(kind, b), fm, worst,
                        worstAt);
        worstAll = std::min(worstAll, worst);
    }
    std::printf("worst margin %.2f dB\n", worstAll);
    return worstAll;
}

}  // namespace

int main(int argc, char** argv) {
    const bool summary = argc > 1 && std::strcmp(argv[1], "--summary") == 0;
    std::printf("Level library conformance at 48000 Hz\n");
    double worst = printWeighting(FWeight::A);
    worst = std::min(worst, printWeighting(FWeight::C));
    worst = std::min(worst, printBank(OctaveFilter::Bank::Full, summary));
    worst = std::min(worst, printBank(OctaveFilter::Bank::Third, summary));
    std::printf("\n%s: worst margin over all tables %.2f dB\n", worst >= 0 ? "PASS" : "FAIL",
                worst);
    return worst >= 0 ? 0 : 1;
}
