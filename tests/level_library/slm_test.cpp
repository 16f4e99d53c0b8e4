// The meter's statistics on signals with known answers, its filtered channel, its scaling,
// and start-up: settling without pre-roll, and blocks with pre-roll against one continuous
// analysis.
#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <stdexcept>
#include <string>
#include <thread>

#include "dsp.h"
#include "signals.h"
#include "slm.h"

namespace SlmLibrary {
namespace {

using level_library_test::feed;
using level_library_test::kFs;
using level_library_test::readAux;
using level_library_test::readBand;
using level_library_test::sine;

const float kNoCorners[2] = {0.0F, 0.0F};

double db(double amplitude) { return 20.0 * std::log10(amplitude); }

// Filtered channel, all-pass, Z: the statistics of the plain signal.
Slm plainMeter(unsigned tw) {
    Slm slm(kFs, 1, 48000);
    slm.initAuxCh(kAllPass, kNoCorners, tw, FWeight::Z, kFs);
    slm.setPercentiles({10.0F, 50.0F, 90.0F});
    slm.resetAll();
    return slm;
}

TEST(MeterStatistics, LevelStepGivesExtremesPercentilesAndEnergyMean) {
    // 1 kHz tone, 5 s at 60 dB then 5 s at 80 dB (re 1).
    std::vector<float> x = sine(1000.0, std::sqrt(2.0) * 1000.0, 10 * 48000);
    for (std::size_t i = 5 * 48000; i < x.size(); ++i) x[i] *= 10.0F;
    for (const unsigned tw : {TWeight::F, TWeight::S, TWeight::N}) {
        SCOPED_TRACE(TWeight::longName(tw));
        Slm slm = plainMeter(tw);
        feed(slm, x.data(), x.size());
        const level_library_test::Reading r = readAux(slm);
        EXPECT_NEAR(r.leq, 10.0 * std::log10((1e6 + 1e8) / 2.0), 0.01);
        EXPECT_NEAR(r.lmax, 80.0, 0.05);
        EXPECT_NEAR(r.lmin, 60.0, 0.05);
        EXPECT_NEAR(r.levels[0], 80.0, 0.1);  // L10
        EXPECT_NEAR(r.levels[2], 60.0, 0.1);  // L90
        EXPECT_NEAR(r.lpeak, 80.0 + db(std::sqrt(2.0)), 0.01);
    }
}

TEST(MeterStatistics, CWeightedPeakOfSingleCyclesIsInsideClass1) {
    // IEC 61672-1 LCpeak - LC of the steady tone: one cycle of 8 kHz 3.4 dB (+-2.0), one
    // cycle of 500 Hz 3.5 dB (+-1.0), a positive or negative half cycle of 500 Hz 2.4 dB
    // (+-1.0).
    struct Case {
        double f, cycles, sign, expected, tolerance;
    };
    for (const Case c : {Case{8000.0, 1.0, 1.0, 3.4, 2.0}, Case{500.0, 1.0, 1.0, 3.5, 1.0},
                         Case{500.0, 0.5, 1.0, 2.4, 1.0}, Case{500.0, 0.5, -1.0, 2.4, 1.0}}) {
        Slm slm(kFs, 1, 48000);
        slm.initAuxCh(kAllPass, kNoCorners, TWeight::F, FWeight::C, kFs);
        slm.resetAll();
        std::vector<float> x(2 * 48000, 0.0F);  // 1 s of silence, the burst, silence
        const auto burst = static_cast<std::size_t>(std::lround(c.cycles * kFs / c.f));
        for (std::size_t i = 0; i < burst; ++i) {
            x[48000 + i] = static_cast<float>(
                c.sign * std::sin(2.0 * std::numbers::pi * c.f * static_cast<double>(i) / kFs));
        }
        feed(slm, x.data(), x.size());
        const double steady =
            db(1.0 / std::sqrt(2.0)) + FWeight::designResponseDb(FWeight::C, c.f, kFs);
        EXPECT_NEAR(readAux(slm).lpeak - steady, c.expected, c.tolerance)
            << c.f << " Hz x " << c.cycles;
    }
}

TEST(MeterStatistics, PercentilesFollowTheTimeSpentAboveEachLevel) {
    // N levels: 100 ms periods at 50, 51, ..., 69 dB, each level once per 2 s: Ln is the
    // level exceeded for n % of the time, to the 0.1 dB class.
    std::vector<float> x(40 * 4800);
    for (std::size_t p = 0; p < 40; ++p) {
        const double amplitude =
            std::sqrt(2.0) * std::pow(10.0, (50.0 + static_cast<double>(p % 20)) / 20.0);
        for (std::size_t i = 0; i < 4800; ++i) {
            x[p * 4800 + i] =
                static_cast<float>(amplitude * std::sin(2.0 * std::numbers::pi * 1000.0 *
                                                        static_cast<double>(i) / kFs));
        }
    }
    Slm slm = plainMeter(TWeight::N);
    slm.setPercentiles(std::vector<std::uint32_t>{5, 50, 95});
    feed(slm, x.data(), x.size());
    const level_library_test::Reading r = readAux(slm);
    EXPECT_NEAR(r.levels[0], 69.0, 0.06);
    EXPECT_NEAR(r.levels[1], 60.0, 0.06);
    EXPECT_NEAR(r.levels[2], 51.0, 0.06);
    EXPECT_NEAR(r.lmin, 50.0, 0.01);
    EXPECT_NEAR(r.lmax, 69.0, 0.01);
}

TEST(MeterStatistics, EmptyMeterReadsNoLevelAndUnknownChannelsAreRefused) {
    Slm slm(kFs, 1, 48000);
    slm.initThirdOct(TWeight::F, FWeight::A, 10, 20, kFs, 0);
    slm.setPercentiles({50.0F});
    slm.resetAll();
    float leq = 1.0F, lmin = 1.0F, level = 1.0F;
    EXPECT_TRUE(slm.getStatistics(10, &leq, &lmin, nullptr, &level, nullptr, nullptr, nullptr));
    EXPECT_EQ(leq, 0.0F);
    EXPECT_EQ(lmin, 0.0F);
    EXPECT_EQ(level, 0.0F);
    EXPECT_FALSE(slm.getStatistics(9, &leq, nullptr, nullptr, nullptr, nullptr, nullptr, nullptr));
    EXPECT_FALSE(slm.getStatistics(21, &leq, nullptr, nullptr, nullptr, nullptr, nullptr, nullptr));
    EXPECT_FALSE(slm.getAuxStatistics(&leq, nullptr, nullptr, nullptr, nullptr, nullptr, nullptr));
    EXPECT_TRUE(slm.getShortLeq(21).empty());
    EXPECT_TRUE(slm.getAuxShortLeq().empty());
}

TEST(MeterStatistics, ShortLeqHoldsExactlyEachCallsSamples) {
    Slm slm(kFs, 1, 48000);
    slm.initFullOct(TWeight::F, FWeight::Z, 0, 11, kFs, 0);
    slm.initAuxCh(kAllPass, kNoCorners, TWeight::F, FWeight::Z, kFs);
    slm.resetAll();
    // Three calls at 60, 70 and 80 dB, one without a short Leq, one of half a second.
    const std::size_t sizes[4] = {48000, 24000, 48000, 48000};
    const double levels[4] = {60.0, 70.0, 75.0, 80.0};
    const bool asked[4] = {true, true, false, true};
    for (int c = 0; c < 4; ++c) {
        const std::vector<float> x =
            sine(1000.0, std::sqrt(2.0) * std::pow(10.0, levels[c] / 20.0), sizes[c]);
        slm.addSamples(x.data(), sizes[c], sizes[c] / 10, asked[c] ? sizes[c] : 0);
    }
    const std::vector<Leq>& aux = slm.getAuxShortLeq();
    ASSERT_EQ(aux.size(), 3U);
    EXPECT_NEAR(Dsp::powerToDb(aux[0].meanPower()), 60.0, 0.01);
    EXPECT_NEAR(Dsp::powerToDb(aux[1].meanPower()), 70.0, 0.01);
    EXPECT_NEAR(Dsp::powerToDb(aux[2].meanPower()), 80.0, 0.01);
    EXPECT_DOUBLE_EQ(aux[1].duration(), 0.5);
    // Pooling weighs by duration.
    Leq pooled;
    pooled.AddSamples(aux);
    EXPECT_NEAR(Dsp::powerToDb(pooled.meanPower()), 10.0 * std::log10((1e6 + 0.5e7 + 1e8) / 2.5),
                0.01);
    // Every band gets one entry per asking call; the 1 kHz band follows the tone.
    for (unsigned b = 0; b <= 11; ++b) EXPECT_EQ(slm.getShortLeq(b).size(), 3U);
    EXPECT_NEAR(Dsp::powerToDb(slm.getShortLeq(7)[2].meanPower()), 80.0, 0.1);
}

TEST(MeterScaling, PreConditionAppliesCalibrationAndTheMarkedRange) {
    std::vector<std::int16_t> in(3 * 4800);
    for (std::size_t i = 0; i < in.size(); ++i)
        in[i] = static_cast<std::int16_t>(1000 - static_cast<int>(i % 7));
    const std::uint32_t marks[3] = {0, 1, 0};
    std::vector<float> out(in.size());
    Slm::preCondition(in.data(), out.data(), marks, in.size(), 8.0F, 0.5F);
    for (std::size_t i = 0; i < in.size(); ++i) {
        const float expected = static_cast<float>(in[i]) * 0.5F * (i / 4800 == 1 ? 8.0F : 1.0F);
        ASSERT_FLOAT_EQ(out[i], expected) << i;
    }
    Slm::preCondition(in.data(), out.data(), marks, in.size(), 0.0F, 2.0F);  // no range: x 1
    EXPECT_FLOAT_EQ(out[4800], static_cast<float>(in[4800]) * 2.0F);
    Slm::preCondition(in.data(), out.data(), nullptr, in.size(), 8.0F, 1.0F);
    EXPECT_FLOAT_EQ(out[4800], static_cast<float>(in[4800]));
}

// Level of a steady tone in the filtered channel, dB re the tone.
double auxResponse(unsigned type, float f1, float f2, double f) {
    Slm slm(kFs, 1, 48000);
    const float corners[2] = {f1, f2};
    slm.initAuxCh(type, corners, TWeight::F, FWeight::Z, kFs);
    slm.resetAll();
    const std::vector<float> x = sine(f, 1.0, 48000 + 9600);
    slm.preRoll(x.data(), 9600);
    slm.addSamples(x.data() + 9600, 48000, 4800, 0);
    return readAux(slm).leq - db(1.0 / std::sqrt(2.0));
}

TEST(FilteredChannel, ButterworthCornersAndSlopes) {
    const double fourthOrderOctave = -10.0 * std::log10(1.0 + 256.0);  // -24.1 dB
    EXPECT_NEAR(auxResponse(kLowPass, 1000.0F, 0.0F, 1000.0), -3.01, 0.02);
    EXPECT_NEAR(auxResponse(kLowPass, 1000.0F, 0.0F, 2000.0), fourthOrderOctave, 0.3);
    EXPECT_NEAR(auxResponse(kLowPass, 1000.0F, 0.0F, 100.0), 0.0, 0.01);
    EXPECT_NEAR(auxResponse(kHighPass, 1000.0F, 0.0F, 1000.0), -3.01, 0.02);
    EXPECT_NEAR(auxResponse(kHighPass, 1000.0F, 0.0F, 500.0), fourthOrderOctave, 0.3);
    EXPECT_NEAR(auxResponse(kHighPass, 1000.0F, 0.0F, 10000.0), 0.0, 0.01);
    EXPECT_NEAR(auxResponse(kBandPass, 500.0F, 2000.0F, 500.0), -3.01, 0.02);
    EXPECT_NEAR(auxResponse(kBandPass, 500.0F, 2000.0F, 2000.0), -3.01, 0.02);
    EXPECT_NEAR(auxResponse(kBandPass, 500.0F, 2000.0F, 1000.0), 0.0, 0.05);
    EXPECT_LT(auxResponse(kBandPass, 500.0F, 2000.0F, 8000.0), -40.0);
    EXPECT_NEAR(auxResponse(kBandStop, 500.0F, 2000.0F, 500.0), -3.01, 0.02);
    EXPECT_NEAR(auxResponse(kBandStop, 500.0F, 2000.0F, 2000.0), -3.01, 0.02);
    EXPECT_LT(auxResponse(kBandStop, 500.0F, 2000.0F, 1000.0), -40.0);
    EXPECT_NEAR(auxResponse(kAllPass, 0.0F, 0.0F, 37.0), 0.0, 0.01);
}

TEST(FilteredChannel, HasItsOwnFrequencyWeighting) {
    // A 100 Hz tone: A-weighted aux channel, Z-weighted bank.
    Slm slm(kFs, 1, 48000);
    slm.initThirdOct(TWeight::F, FWeight::Z, 12, 12, kFs, 0);
    slm.initAuxCh(kAllPass, kNoCorners, TWeight::F, FWeight::A, kFs);
    slm.resetAll();
    const std::vector<float> x = sine(100.0, std::sqrt(2.0), 2 * 48000);
    slm.preRoll(x.data(), 48000);
    slm.addSamples(x.data() + 48000, 48000, 4800, 0);
    EXPECT_NEAR(readAux(slm).leq, FWeight::analogResponseDb(FWeight::A, 100.0), 0.1);
    EXPECT_NEAR(readBand(slm, 12).leq, 0.0, 0.1);
}

TEST(MeterSetUp, RefusesBadValuesWithAReason) {
    Slm slm(kFs, 1, 48000);
    const float reversed[2] = {2000.0F, 500.0F};
    const float beyond[2] = {30000.0F, 0.0F};
    auto refused = [](auto&& call) {
        try {
            call();
        } catch (const std::invalid_argument& e) {
            return std::string(e.what()).size() > 10;
        }
        return false;
    };
    EXPECT_TRUE(refused([&] { slm.initAuxCh(kBandPass, reversed, TWeight::F, FWeight::A, kFs); }));
    EXPECT_TRUE(refused([&] { slm.initAuxCh(kLowPass, beyond, TWeight::F, FWeight::A, kFs); }));
    EXPECT_TRUE(refused([&] { slm.initAuxCh(5, reversed, TWeight::F, FWeight::A, kFs); }));
    EXPECT_TRUE(refused([&] { slm.initThirdOct(TWeight::I, FWeight::A, 0, 35, kFs, 0); }));
    EXPECT_TRUE(refused([&] { slm.initThirdOct(TWeight::F, 4, 0, 35, kFs, 0); }));
    EXPECT_TRUE(refused([&] { slm.initFullOct(TWeight::F, FWeight::A, 0, 12, kFs, 0); }));
    EXPECT_TRUE(refused([&] { slm.initFullOct(TWeight::F, FWeight::A, 0, 11, 44100.0, 0); }));
    EXPECT_TRUE(refused([] { Slm other(44100.0, 1, 48000); }));

    slm.initFullOct(TWeight::F, FWeight::A, 0, 11, kFs, 0);
    slm.resetAll();
    const std::vector<float> x(4800, 0.0F);
    slm.addSamples(x.data(), x.size(), 480, 0);
    EXPECT_THROW(slm.preRoll(x.data(), x.size()), std::logic_error);
    slm.resetAll();
    EXPECT_NO_THROW(slm.preRoll(x.data(), x.size()));
}

TEST(MeterThreads, MetersOnSeveralThreadsReadAsOneAlone) {
    const std::vector<float> x = level_library_test::pinkNoise(3 * 48000, 77);
    auto analyse = [&x](std::vector<level_library_test::Reading>& out) {
        Slm slm(kFs, 1, 48000);
        slm.initThirdOct(TWeight::F, FWeight::A, 0, 35, kFs, 0);
        const float corners[2] = {200.0F, 2000.0F};
        slm.initAuxCh(kBandPass, corners, TWeight::S, FWeight::C, kFs);
        slm.setPercentiles({10.0F, 90.0F});
        slm.resetAll();
        feed(slm, x.data(), x.size(), true);
        for (unsigned b = 0; b < kThirdOctaveBandCount; ++b) out.push_back(readBand(slm, b));
        out.push_back(readAux(slm));
    };
    std::vector<level_library_test::Reading> alone;
    analyse(alone);
    std::vector<std::vector<level_library_test::Reading>> together(3);
    std::vector<std::thread> threads;
    for (auto& r : together) threads.emplace_back(analyse, std::ref(r));
    for (std::thread& t : threads) t.join();
    for (const auto& r : together) {
        ASSERT_EQ(r.size(), alone.size());
        for (std::size_t i = 0; i < r.size(); ++i) {
            EXPECT_EQ(r[i].leq, alone[i].leq);
            EXPECT_EQ(r[i].lmax, alone[i].lmax);
            EXPECT_EQ(r[i].lpeak, alone[i].lpeak);
            EXPECT_EQ(r[i].levels, alone[i].levels);
        }
    }
}

// Peak-to-peak ripple (dB) of the exponentially averaged square of a steady sine.
double ownRipple(double f, unsigned tw) {
    const double tau = TWeight::timeConstant(tw);
    const double r = 1.0 / std::sqrt(1.0 + std::pow(2.0 * std::numbers::pi * 2.0 * f * tau, 2.0));
    return 10.0 * std::log10((1.0 + r) / (1.0 - r));
}

// First block of a recording: a steady tone switched on at the first sample.
void checkSettlingWithoutPreRoll(bool third, unsigned tw) {
    const OctaveFilter::Bank kind = third ? OctaveFilter::Bank::Third : OctaveFilter::Bank::Full;
    for (unsigned b = 0; b < OctaveFilter::bandCount(kind); ++b) {
        const double fm = OctaveFilter::midBandFrequency(kind, b);
        Slm slm = level_library_test::bandMeter(third, tw, b, b);
        const double seconds = slm.settlingSeconds(b) + 1.0;
        const std::vector<float> x = sine(fm, 1.0, static_cast<std::size_t>(seconds * kFs));
        feed(slm, x.data(), x.size());
        const level_library_test::Reading r = readBand(slm, b);
        EXPECT_LE(r.lmax - r.lmin, ownRipple(fm, tw) + 0.2) << OctaveFilter::bandName(kind, b);
        EXPECT_NEAR(r.lmax, -3.01, ownRipple(fm, tw) / 2.0 + 0.15)
            << OctaveFilter::bandName(kind, b);
        // The crest: interpolated between samples where the band lies below a quarter of its
        // rate, else the largest sample, which may be off the crest by half a sample.
        const OctaveFilter bank(kind);
        const double rate = bank.groups()[bank.groupOf(b)].rate;
        const double upperEdge = fm * std::pow(10.0, 0.15 / OctaveFilter::bandsPerOctave(kind));
        const double lowest =
            upperEdge <= 0.25 * rate ? -0.2 : db(std::cos(std::numbers::pi * fm / rate));
        EXPECT_LE(r.lpeak, 0.05) << OctaveFilter::bandName(kind, b);
        EXPECT_GE(r.lpeak, lowest - 0.05) << OctaveFilter::bandName(kind, b);
    }
}

TEST(MeterStartUp, ASteadyToneReadsSteadyFromTheFirstBlockInEveryBand) {
    for (const bool third : {true, false}) {
        checkSettlingWithoutPreRoll(third, TWeight::S);
        checkSettlingWithoutPreRoll(third, TWeight::F);
    }
}

// Audio from minute 2 on, analysed as a block of its own with pre-roll, reads as the same
// stretch of one continuous analysis. Stationary noise over a minute, or (swings) 10 s of
// pink noise whose level jumps at random within +-15 dB every quarter second, loudest in the
// block's first half second: the pre-roll differs from the audio before it, and a warm-up
// that outlasts the pre-roll (2.6 s for 6.3 Hz) would leave a share of the short block out of
// its statistics (Z weighting keeps the lowest bands loud).
void checkBlockAgainstContinuous(unsigned tw, double preRollSeconds, bool swings = false) {
    const std::size_t minute = 60 * 48000;
    std::vector<float> x = level_library_test::pinkNoise(2 * minute, 4242);
    std::uint32_t seed = 99;
    float gain = 1000.0F;
    for (std::size_t i = 0; i < x.size(); ++i) {
        if (swings && i % 12000 == 0) {
            seed = seed * 1664525U + 1013904223U;
            const double jump =
                i - minute < 24000 ? 1.0 : static_cast<double>(seed >> 8) / 16777216.0;
            gain = static_cast<float>(1000.0 * std::pow(10.0, 1.5 * jump - 0.75));
        }
        x[i] *= gain;
    }
    auto setUp = [&](Slm& slm) {
        slm.initThirdOct(tw, swings ? FWeight::Z : FWeight::A, 0, 35, kFs, 0);
        slm.setPercentiles({10.0F, 50.0F, 90.0F});
        slm.resetAll();
    };
    Slm continuous(kFs, 1, 48000);
    setUp(continuous);
    feed(continuous, x.data(), minute);
    continuous.resetStatistics();
    const std::size_t length = swings ? minute / 6 : minute;
    feed(continuous, x.data() + minute, length);

    Slm block(kFs, 1, 48000);
    setUp(block);
    const auto preRoll = static_cast<std::size_t>(preRollSeconds * kFs);
    block.preRoll(x.data() + minute - preRoll, preRoll);
    feed(block, x.data() + minute, length);

    for (unsigned b = 0; b < kThirdOctaveBandCount; ++b) {
        const level_library_test::Reading c = readBand(continuous, b);
        const level_library_test::Reading k = readBand(block, b);
        SCOPED_TRACE(OctaveFilter::getThirdName(b));
        EXPECT_NEAR(k.leq, c.leq, 0.2);
        EXPECT_NEAR(k.lmax, c.lmax, 0.2);
        EXPECT_NEAR(k.lmin, c.lmin, 0.2);
        for (std::size_t i = 0; i < 3; ++i) EXPECT_NEAR(k.levels[i], c.levels[i], 0.2);
    }
}

TEST(MeterStartUp, BlocksWithPreRollReadAsOneContinuousAnalysis) {
    // The S average remembers more: the lowest bands need about 8 s of history.
    checkBlockAgainstContinuous(TWeight::F, 2.0);
    checkBlockAgainstContinuous(TWeight::S, 8.0);
}

TEST(MeterStartUp, BlocksWithPreRollReadAsOneContinuousAnalysisOfSwingingNoise) {
    checkBlockAgainstContinuous(TWeight::F, 3.0, true);
    checkBlockAgainstContinuous(TWeight::N, 3.0, true);
    checkBlockAgainstContinuous(TWeight::S, 8.0, true);
}

}  // namespace
}  // namespace SlmLibrary
