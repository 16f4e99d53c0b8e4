// The octave and third-octave banks against IEC 61260-1 class 1 (reference/), measured on the
// implemented multirate bank with sine tones, and the band levels the meter reads from them.
#include <gtest/gtest.h>

#include <cmath>
#include <string>

#include "octave_filter.h"
#include "reference_csv.h"
#include "signals.h"
#include "slm.h"

namespace SlmLibrary {
namespace {

using level_library_test::feed;
using level_library_test::kFs;
using level_library_test::readBand;
using level_library_test::readReference;

struct MaskPoint {
    double omega;
    double minDb;
    double maxDb;
    bool edge;  // the band edge: the limits of both sides apply
};

// The standard's breakpoints for b bands per octave; at the band edge both sides' limits.
std::vector<MaskPoint> maskPoints(bool third) {
    const auto t = readReference("filter_mask_iec61260_class1.csv");
    std::vector<MaskPoint> points;
    for (std::size_t r = 0; r < t.rows.size(); ++r) {
        const double omega = t.number(r, third ? "omega_third_octave" : "omega_octave");
        const double lo = t.number(r, "class1_min_attenuation_db");
        const double hi = t.number(r, "class1_max_attenuation_db");
        if (!points.empty() && std::abs(points.back().omega - omega) < 1e-9) {
            points.back().minDb = std::max(points.back().minDb, lo);
            points.back().maxDb = std::min(points.back().maxDb, hi);
            points.back().edge = true;
        } else {
            points.push_back({omega, lo, hi, false});
        }
    }
    return points;
}

void checkBankMask(OctaveFilter::Bank kind) {
    const bool third = kind == OctaveFilter::Bank::Third;
    const std::vector<MaskPoint> points = maskPoints(third);
    const OctaveFilter bank(kind);
    double worst = 1e9;
    for (unsigned b = 0; b < OctaveFilter::bandCount(kind); ++b) {
        const double fm = OctaveFilter::midBandFrequency(kind, b);
        const double settle = bank.settleSeconds(b, 60.0) + 0.01;
        const double measure = std::max(0.02, 4.0 / fm);
        for (const MaskPoint& p : points) {
            for (const double f : {fm * p.omega, fm / p.omega}) {
                if (f >= 0.499 * kFs || (p.omega == 1.0 && f < fm)) continue;
                const double attenuation =
                    -OctaveFilter::toneResponseDb(kind, f, settle, measure)[b];
                EXPECT_GE(attenuation, p.minDb)
                    << OctaveFilter::bandName(kind, b) << " at " << f << " Hz";
                EXPECT_LE(attenuation, p.maxDb)
                    << OctaveFilter::bandName(kind, b) << " at " << f << " Hz";
                worst = std::min({worst, attenuation - p.minDb, p.maxDb - attenuation});
                // The library's own table of limits agrees with the reference figures.
                if (p.edge) continue;
                const OctaveFilter::Limits lim = OctaveFilter::class1Limits(kind, f / fm);
                EXPECT_NEAR(lim.minAttenuationDb, p.minDb, 0.01);  // omega rounded in the table
                if (std::isfinite(p.maxDb)) {
                    EXPECT_NEAR(lim.maxAttenuationDb, p.maxDb, 0.01);
                }
            }
        }
    }
    ::testing::Test::RecordProperty("worst_margin_db", std::to_string(worst));
}

TEST(OctaveBank, EveryThirdOctaveBandIsInsideTheClass1MaskWithDecimation) {
    checkBankMask(OctaveFilter::Bank::Third);
}
TEST(OctaveBank, EveryOctaveBandIsInsideTheClass1MaskWithDecimation) {
    checkBankMask(OctaveFilter::Bank::Full);
}

TEST(OctaveBank, MidBandFrequenciesAreBase10AndNamedLowToHigh) {
    EXPECT_NEAR(OctaveFilter::midBandFrequency(OctaveFilter::Bank::Third, 0), 6.30957, 1e-4);
    EXPECT_NEAR(OctaveFilter::midBandFrequency(OctaveFilter::Bank::Third, 22), 1000.0, 1e-9);
    EXPECT_NEAR(OctaveFilter::midBandFrequency(OctaveFilter::Bank::Third, 35), 19952.62, 1e-2);
    EXPECT_NEAR(OctaveFilter::midBandFrequency(OctaveFilter::Bank::Full, 0), 7.943282, 1e-5);
    EXPECT_NEAR(OctaveFilter::midBandFrequency(OctaveFilter::Bank::Full, 11), 15848.93, 1e-2);
    EXPECT_STREQ(OctaveFilter::getThirdName(22), "1kHz");
    EXPECT_STREQ(OctaveFilter::getFullName(0), "8Hz");
    EXPECT_STREQ(OctaveFilter::getThirdName(36), "?");
}

// A tone at a band's mid frequency reads its own level in that band.
void checkMidBandLevels(bool third) {
    const OctaveFilter::Bank kind = third ? OctaveFilter::Bank::Third : OctaveFilter::Bank::Full;
    for (unsigned b = 0; b < OctaveFilter::bandCount(kind); ++b) {
        const double fm = OctaveFilter::midBandFrequency(kind, b);
        Slm slm = level_library_test::bandMeter(third, TWeight::F, b, b);
        const auto preRoll =
            static_cast<std::size_t>(std::ceil(slm.settlingSeconds(b) * kFs / 32.0)) * 32;
        const auto measure =
            static_cast<std::size_t>(std::lround(std::ceil(4.0 * fm) / fm * kFs / 32.0)) * 32;
        const std::vector<float> x = level_library_test::sine(fm, 2.0, preRoll + measure);
        slm.preRoll(x.data(), preRoll);
        feed(slm, x.data() + preRoll, measure);
        EXPECT_NEAR(readBand(slm, b).leq, 20.0 * std::log10(2.0 / std::sqrt(2.0)), 0.1)
            << OctaveFilter::bandName(kind, b);
    }
}

TEST(BandLevels, ASineAtMidBandReadsItsLevelInEveryThirdOctaveBand) { checkMidBandLevels(true); }
TEST(BandLevels, ASineAtMidBandReadsItsLevelInEveryOctaveBand) { checkMidBandLevels(false); }

// The band powers of broadband noise add up to the power of the noise.
TEST(BandLevels, BandPowersOfWhiteAndPinkNoiseSumToTheBroadbandPower) {
    const std::size_t n = 30 * 48000;
    for (const bool pink : {false, true}) {
        std::vector<float> x =
            pink ? level_library_test::pinkNoise(n, 99) : level_library_test::whiteNoise(n, 7);
        level_library_test::bandLimit(x, 12.0, 18000.0);
        const double broadband = level_library_test::meanSquareDb(x, 4 * 48000);
        for (const bool third : {false, true}) {
            const unsigned last = third ? 35 : 11;
            Slm slm = level_library_test::bandMeter(third, TWeight::F, 0, last);
            slm.preRoll(x.data(), 4 * 48000);
            feed(slm, x.data() + 4 * 48000, n - 4 * 48000);
            double sum = 0.0;
            for (unsigned b = 0; b <= last; ++b) sum += std::pow(10.0, readBand(slm, b).leq / 10.0);
            EXPECT_NEAR(10.0 * std::log10(sum), broadband, 0.3)
                << (pink ? "pink" : "white") << (third ? " third octaves" : " octaves");
        }
    }
}

}  // namespace
}  // namespace SlmLibrary
