// Time weighting: decay rates, tone bursts (IEC 61672-1 figures in reference/), N periods.
#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <numbers>
#include <vector>

#include "reference_csv.h"
#include "tweight.h"

namespace SlmLibrary {
namespace {

using level_library_test::readReference;
constexpr double kFs = 48000.0;

double db(double power) { return 10.0 * std::log10(power); }

TEST(TimeWeighting, DecayRatesAreInsideClass1) {
    struct Case {
        unsigned code;
        double rate, plus, minus;
    };
    for (const Case c : {Case{TWeight::F, 34.7, 3.8, 3.7}, Case{TWeight::S, 4.3, 0.8, 0.7}}) {
        TWeight tw(c.code, kFs, kFs);
        tw.prime(1.0);
        std::vector<float> silence(48000, 0.0F);
        tw.Process(silence.data(), silence.size());
        const double drop = -db(silence[23999]) + db(silence[47999]);  // over 0.5 s
        const double rate = -drop / 0.5;
        EXPECT_NEAR(rate, 10.0 * std::log10(std::numbers::e) / TWeight::timeConstant(c.code), 0.01);
        EXPECT_LE(rate, c.rate + c.plus);
        EXPECT_GE(rate, c.rate - c.minus);
    }
}

TEST(TimeWeighting, ToneBurstResponsesAreInsideClass1) {
    const auto table = readReference("time_weighting_iec61672_class1.csv");
    const double f = 4000.0;
    for (std::size_t r = 0; r < table.rows.size(); ++r) {
        const double tb = table.number(r, "tb_ms") / 1000.0;
        const auto burst = static_cast<std::size_t>(std::lround(tb * kFs));
        for (const char* w : {"f", "s"}) {
            const double reference = table.number(r, std::string(w) + "_reference_db");
            if (std::isnan(reference)) continue;
            SCOPED_TRACE(std::string(w) + " tb_ms=" + table.text(r, "tb_ms"));
            const unsigned code = w[0] == 'f' ? TWeight::F : TWeight::S;
            // Burst from silence, then silence long enough for the maximum to pass.
            std::vector<float> sq(burst + 4800, 0.0F);
            for (std::size_t i = 0; i < burst; ++i) {
                const double x =
                    std::sin(2.0 * std::numbers::pi * f * static_cast<double>(i) / kFs);
                sq[i] = static_cast<float>(x * x);
            }
            TWeight tw(code, kFs, kFs);
            tw.Process(sq.data(), sq.size());
            const double response = db(*std::max_element(sq.begin(), sq.end()) / 0.5);
            EXPECT_LE(response - reference, table.number(r, std::string(w) + "_upper_db"));
            EXPECT_GE(response - reference, table.number(r, std::string(w) + "_lower_db"));
            // The exponential averager is exact: the 0.1 dB rounding of the table is all.
            EXPECT_NEAR(response, db(-std::expm1(-tb / TWeight::timeConstant(code))), 0.06);
        }
    }
}

TEST(TimeWeighting, StateIsKeptBetweenCalls) {
    std::vector<float> sq(10000);
    for (std::size_t i = 0; i < sq.size(); ++i)
        sq[i] = static_cast<float>((i * 7919) % 101) / 100.0F;
    for (unsigned code : {TWeight::F, TWeight::S, TWeight::N}) {
        std::vector<float> whole = sq, parts = sq;
        TWeight a(code, kFs, kFs), b(code, kFs, kFs);
        a.Process(whole.data(), whole.size());
        b.Process(parts.data(), 3333);
        b.Process(parts.data() + 3333, parts.size() - 3333);
        EXPECT_EQ(whole, parts) << TWeight::shortName(code);
    }
}

TEST(TimeWeighting, NoneGivesTheEquivalentLevelOfEach100msPeriod) {
    // 100 ms at mean square 2, then 100 ms at mean square 4, at a decimated rate of 3000 Hz.
    TWeight tw(TWeight::N, kFs, 3000.0);
    std::vector<float> sq(600);
    for (std::size_t i = 0; i < 300; ++i) sq[i] = (i % 2 == 0) ? 1.0F : 3.0F;
    for (std::size_t i = 300; i < 600; ++i) sq[i] = 4.0F;
    tw.Process(sq.data(), sq.size());
    EXPECT_FLOAT_EQ(sq[299], 2.0F);
    EXPECT_FLOAT_EQ(sq[599], 4.0F);
    EXPECT_FLOAT_EQ(sq[300], 4.0F);  // a new period starts from nothing
    tw.reset();
    float one = 5.0F;
    tw.Process(&one, 1);
    EXPECT_FLOAT_EQ(one, 5.0F);
}

TEST(TimeWeighting, RefusesImpulseAndUnknownCodes) {
    EXPECT_THROW(TWeight(TWeight::I, kFs, kFs), std::invalid_argument);
    EXPECT_THROW(TWeight(9, kFs, kFs), std::invalid_argument);
    EXPECT_THROW(TWeight(TWeight::N, kFs, 1234.5), std::invalid_argument);
    EXPECT_STREQ(TWeight::longName(TWeight::S), "Slow");
}

}  // namespace
}  // namespace SlmLibrary
