// Frequency weighting against the IEC 61672-1 figures in reference/.
#include <gtest/gtest.h>

#include <cmath>
#include <numbers>
#include <vector>

#include "fweight.h"
#include "reference_csv.h"
#include "signals.h"

namespace SlmLibrary {
namespace {

using level_library_test::kFs;
using level_library_test::readReference;

// Level (dB re the input tone) of a steady sine after weighting, measured over whole
// periods after the filter has settled.
struct ToneResponse {
    double z, c, a;
};

ToneResponse measureTone(double f) {
    const std::size_t settle = 12000;
    const double periods = std::max(1.0, std::floor(0.25 * f));
    const auto measure = static_cast<std::size_t>(std::lround(periods * kFs / f));
    const std::vector<float> in = level_library_test::sine(f, 1.0, settle + measure);
    std::vector<float> z(in.size()), c(in.size()), a(in.size());
    FWeight w(kFs);
    w.init(FWeight::All, kFs);
    EXPECT_EQ(w.ProcessAll(in.data(), z.data(), c.data(), a.data(), in.size()), 1);
    auto levelOf = [&](const std::vector<float>& v) {
        double sum = 0.0, ref = 0.0;
        for (std::size_t i = settle; i < v.size(); ++i) {
            sum += static_cast<double>(v[i]) * v[i];
            ref += static_cast<double>(in[i]) * in[i];
        }
        return 10.0 * std::log10(sum / ref);
    };
    return {levelOf(z), levelOf(c), levelOf(a)};
}

TEST(FrequencyWeighting, FollowsAnalogDefinitionAndClass1LimitsAtEveryThirdOctave) {
    const auto table = readReference("weighting_iec61672_class1.csv");
    ASSERT_EQ(table.rows.size(), 34U);
    for (std::size_t r = 0; r < table.rows.size(); ++r) {
        const double f = table.number(r, "exact_hz");
        SCOPED_TRACE("f = " + table.text(r, "nominal_hz"));
        const double tolerance = f <= 10500.0 ? 0.1 : (f <= 16500.0 ? 0.5 : 1e9);
        const double upper = table.number(r, "class1_upper_db");
        const double lower = table.number(r, "class1_lower_db");
        const ToneResponse measured = measureTone(f);
        const double design[2] = {FWeight::designResponseDb(FWeight::A, f, kFs),
                                  FWeight::designResponseDb(FWeight::C, f, kFs)};
        const double got[2] = {measured.a, measured.c};
        const char* exact[2] = {"a_exact_db", "c_exact_db"};
        const char* goal[2] = {"a_nominal_db", "c_nominal_db"};
        for (int w = 0; w < 2; ++w) {
            // The processing realises the design...
            EXPECT_NEAR(got[w], design[w], 0.01) << exact[w];
            // ...which follows the analog definition...
            EXPECT_NEAR(got[w], table.number(r, exact[w]), tolerance) << exact[w];
            EXPECT_NEAR(FWeight::analogResponseDb(w == 0 ? FWeight::A : FWeight::C, f),
                        table.number(r, exact[w]), 1e-3);
            // ...and stays inside the class 1 limits around the tabulated design goal.
            const double deviation = got[w] - table.number(r, goal[w]);
            EXPECT_LE(deviation, upper) << goal[w];
            EXPECT_GE(deviation, lower) << goal[w];
        }
        EXPECT_NEAR(measured.z, 0.0, 1e-4);
    }
}

TEST(FrequencyWeighting, SingleOutputsMatchProcessAllAndKeepStateBetweenCalls) {
    const std::vector<float> in = level_library_test::whiteNoise(9000, 12345, 0.5);
    FWeight all(kFs);
    all.init(FWeight::All, kFs);
    std::vector<float> c(in.size()), a(in.size());
    all.ProcessAll(in.data(), nullptr, c.data(), a.data(), in.size());

    for (unsigned code : {FWeight::A, FWeight::C}) {
        FWeight single(kFs);
        single.init(code, kFs);
        std::vector<float> out(in.size());
        // Two calls of odd sizes, the second in place.
        single.Process(in.data(), out.data(), 4001);
        std::copy(in.begin() + 4001, in.end(), out.begin() + 4001);
        single.Process(out.data() + 4001, out.data() + 4001, in.size() - 4001);
        const std::vector<float>& ref = code == FWeight::A ? a : c;
        for (std::size_t i = 0; i < in.size(); ++i) ASSERT_EQ(out[i], ref[i]) << i;
    }
    FWeight z(kFs);
    std::vector<float> out(in.size());
    z.Process(in.data(), out.data(), in.size());
    EXPECT_EQ(out, in);
}

TEST(FrequencyWeighting, RefusesUnknownCodesAndRates) {
    FWeight w(kFs);
    EXPECT_THROW(w.init(3, kFs), std::invalid_argument);
    EXPECT_THROW(w.init(FWeight::A, 0.0), std::invalid_argument);
    EXPECT_STREQ(FWeight::shortName(FWeight::C), "C");
    EXPECT_STREQ(FWeight::shortName(7), "?");
}

}  // namespace
}  // namespace SlmLibrary
