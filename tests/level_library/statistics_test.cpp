// The value types the rest of the tool relies on: Leq pooling, dB conversion, the
// distribution of levels and the interval statistics of 100 ms levels.
#include <gtest/gtest.h>

#include <cmath>
#include <cstdint>
#include <limits>
#include <vector>

#include "dsp.h"
#include "leq.h"
#include "level_histogram.h"
#include "stats.h"

namespace SlmLibrary {
namespace {

TEST(LeqPooling, PoolsEnergyWeightedByDurationAndCarriesOverload) {
    Leq empty(0.0, 0.0, false);
    EXPECT_TRUE(std::isnan(empty.GetLeq()));

    Leq a;
    const float levels[2] = {60.0F, 70.0F};
    a.AddSamples(levels, 2, true);
    EXPECT_NEAR(Dsp::powerToDb(a.meanPower()), 10.0 * std::log10((1e6 + 1e7) / 2.0), 1e-4);
    EXPECT_DOUBLE_EQ(a.duration(), 2.0);

    // A 3-unit Leq at 80 dB outweighs the two 1-unit levels.
    Leq b = Leq::fromMeanSquare(1e8, 3.0);
    b.setOverload(true);
    Leq pooled;
    pooled.AddSamples(std::vector<Leq>{a, b});
    EXPECT_NEAR(Dsp::powerToDb(pooled.meanPower()), 10.0 * std::log10((1e6 + 1e7 + 3e8) / 5.0),
                1e-4);
    EXPECT_TRUE(pooled.overload());

    pooled.Reset();
    EXPECT_TRUE(std::isnan(pooled.GetLeq()));
    EXPECT_FALSE(pooled.overload());

    const float powers[2] = {2.0F, 4.0F};
    Leq p;
    p.AddSamples(powers, 2, false);
    EXPECT_FLOAT_EQ(p.GetLeq(), 3.0F);
}

TEST(DbConversion, NoPowerReadsZeroDecibels) {
    EXPECT_EQ(Dsp::powerToDb(0.0), 0.0F);
    EXPECT_EQ(Dsp::powerToDb(-1.0), 0.0F);
    EXPECT_EQ(Dsp::powerToDb(std::numeric_limits<double>::quiet_NaN()), 0.0F);
    EXPECT_FLOAT_EQ(Dsp::powerToDb(1e7), 70.0F);
    float data[3] = {100.0F, 0.0F, 1.0F};
    Dsp::GetdB_I(data, 3);
    EXPECT_FLOAT_EQ(data[0], 20.0F);
    EXPECT_EQ(data[1], 0.0F);
    EXPECT_EQ(data[2], 0.0F);
}

TEST(LevelDistribution, LnIsTheClassReachedOrExceededByNPercent) {
    LevelHistogram h;
    for (int i = 0; i < 50; ++i) h.add(60.0F);
    for (int i = 0; i < 50; ++i) h.add(70.0F);
    EXPECT_FLOAT_EQ(h.exceedanceLevel(10.0), 70.0F);
    EXPECT_FLOAT_EQ(h.exceedanceLevel(50.0), 70.0F);
    EXPECT_FLOAT_EQ(h.exceedanceLevel(90.0), 60.0F);
    // A fractional percentile just beyond the upper half falls to the lower class.
    EXPECT_FLOAT_EQ(h.exceedanceLevel(50.1), 60.0F);

    LevelHistogram constant;
    for (int i = 0; i < 7; ++i) constant.add(63.4F);
    for (const double n : {1.0, 33.3, 50.0, 99.0})
        EXPECT_FLOAT_EQ(constant.exceedanceLevel(n), 63.4F);

    // Out of range: counted in the end class, exact extremes kept.
    LevelHistogram narrow(0.0F, 100.0F);
    narrow.add(150.25F);
    narrow.add(-5.0F);
    EXPECT_FLOAT_EQ(narrow.maximum(), 150.25F);
    EXPECT_FLOAT_EQ(narrow.minimum(), -5.0F);
    EXPECT_FLOAT_EQ(narrow.exceedanceLevel(1.0), 100.0F);
    // Any float lands in an end class, however far out (no integer holds its tenths).
    constexpr float kInf = std::numeric_limits<float>::infinity();
    for (const float far : {1e20F, 3e38F, kInf, -1e20F, -kInf, std::nanf("")}) {
        LevelHistogram two;
        two.add(60.0F);
        two.add(far);
        EXPECT_FLOAT_EQ(two.exceedanceLevel(0.0), far > 0.0F ? 250.0F : 60.0F) << far;
        EXPECT_FLOAT_EQ(two.exceedanceLevel(100.0), far > 0.0F ? 60.0F : -100.0F) << far;
    }

    EXPECT_EQ(LevelHistogram().exceedanceLevel(50.0), 0.0F);
}

// addPower finds classes mostly without a logarithm: it must put every power where
// add(powerToDb) does, at class edges too (levels k.k5 dB, just below and above), across the
// range and beyond it, and for powers with no level.
TEST(LevelDistribution, PowersLandInTheClassOfTheirLevel) {
    std::vector<double> powers = {0.0,
                                  -1.0,
                                  1e-310,
                                  1e-300,
                                  1e300,
                                  std::numeric_limits<double>::infinity(),
                                  std::numeric_limits<double>::quiet_NaN()};
    for (int k = -1005; k <= 2505; ++k) {
        const double edge = std::pow(10.0, (k + 0.5) / 100.0);
        for (double f : {1.0 - 1e-6, 1.0 - 1e-12, 1.0, 1.0 + 1e-12, 1.0 + 1e-6, 1.0 + 0.01}) {
            powers.push_back(edge * f);
        }
    }
    std::uint32_t seed = 99;
    for (int i = 0; i < 20000; ++i) {
        seed = seed * 1664525U + 1013904223U;
        powers.push_back(std::pow(10.0, -12.0 + 30.0 * static_cast<double>(seed) / 4294967296.0));
    }
    LevelHistogram byLevel, byPower;
    for (const double p : powers) {
        byLevel.reset();
        byPower.reset();
        byLevel.add(Dsp::powerToDb(p));
        byPower.addPower(p);
        ASSERT_EQ(byPower.count(), 1U);
        ASSERT_EQ(byPower.exceedanceLevel(50.0), byLevel.exceedanceLevel(50.0)) << p;
    }
}

TEST(IntervalStatistics, ReportsLeqExtremesAndPercentilesOfTheEnteredLevels) {
    Stats s;
    const float percents[3] = {90.0F, 10.0F, 33.3F};
    s.setUpPercentiles(percents, 3);
    float out[3] = {-1.0F, -1.0F, -1.0F};
    EXPECT_EQ(s.getPercentiles(out, 3), 0);  // nothing entered yet
    EXPECT_TRUE(std::isnan(s.getLeq()));

    for (int i = 0; i < 10; ++i) {
        const float level = 50.0F + static_cast<float>(i);
        Leq one;
        one.AddSamples(&level, 1, true);
        if (i == 4) one.setOverload(true);
        s.addSample(one);
        s.addSample(level);
    }
    EXPECT_EQ(s.getPercentiles(out, 3), 3);
    EXPECT_FLOAT_EQ(out[0], 51.0F);  // L90, in the order asked for
    EXPECT_FLOAT_EQ(out[1], 59.0F);  // L10
    EXPECT_FLOAT_EQ(out[2], 56.0F);  // L33.3
    const structResult r = s.getGenResults();
    EXPECT_FLOAT_EQ(r.lmin, 50.0F);
    EXPECT_FLOAT_EQ(r.lmax, 59.0F);
    EXPECT_EQ(r.overload, 1U);
    double energy = 0.0;
    for (int i = 0; i < 10; ++i) energy += std::pow(10.0, (50.0 + i) / 10.0);
    EXPECT_NEAR(r.leq, 10.0 * std::log10(energy / 10.0), 1e-4);

    s.reset();
    EXPECT_EQ(s.getPercentiles(out, 3), 0);
    EXPECT_EQ(s.getGenResults().overload, 0U);
}

}  // namespace
}  // namespace SlmLibrary
