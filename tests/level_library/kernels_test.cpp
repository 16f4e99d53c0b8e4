// The generic kernels (what a processor without AVX2 runs) against the AVX2 ones on the same
// data: this machine runs only one table through the meter, so each path checks the other.
#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <vector>

#include "kernels.h"
#include "signals.h"
#include "sos.h"

namespace SlmLibrary {
namespace {

void expectClose(const std::vector<float>& a, const std::vector<float>& b, const char* what) {
    float scale = 0.0F;
    for (float v : b) scale = std::max(scale, std::fabs(v));
    for (std::size_t i = 0; i < a.size(); ++i) ASSERT_NEAR(a[i], b[i], 1e-5F * scale) << what << i;
}

TEST(Kernels, GenericAndAvx2PathsAgree) {
    const KernelTable* avx2 = avx2Kernels();
    if (avx2 == nullptr) GTEST_SKIP() << "no AVX2 on this processor or build";
    const KernelTable& gen = genericKernels();
    const std::vector<float> x = level_library_test::whiteNoise(8 * 64 + 8, 7);
    const float* in = x.data() + 8;  // eight readable samples before
    const SosList sos = design::toSos(
        design::bilinear(design::lowpassToLowpass(design::chebyshev2Prototype(8, 80.0),
                                                  design::prewarp(0.25, 1.0)),
                         1.0),
        0.0, 1.0, 1.0);
    for (std::size_t k = 1; k <= 4; ++k) {
        const IirBlockPlan plan = makeIirBlockPlan(SosList(sos.begin(), sos.begin() + k));
        for (int decimate = 0; decimate < 2; ++decimate) {
            std::vector<float> a(8 * 64), b(8 * 64);
            double sa[8] = {}, sb[8] = {};
            (decimate ? gen.iirDecimate : gen.iir)[k - 1](plan, sa, in, 64, a.data());
            (decimate ? avx2->iirDecimate : avx2->iir)[k - 1](plan, sb, in, 64, b.data());
            expectClose(a, b, "cascade ");
            for (std::size_t i = 0; i < 2 * k; ++i) EXPECT_NEAR(sa[i], sb[i], 1e-9);
        }
        // Eight lanes of k all-pole sections, half of them on a second input.
        std::vector<float> coefF(2 * k * 8), gainF(8, 0.5F), pickF(8), stateF(2 * k * 8);
        for (std::size_t l = 0; l < 8; ++l) {
            pickF[l] = l % 2 == 0 ? 1.0F : 0.0F;
            for (std::size_t s = 0; s < k; ++s) {
                const double r = 0.9, theta = 0.1 + 0.3 * static_cast<double>(l + s) / 8.0;
                coefF[2 * s * 8 + l] = static_cast<float>(-2.0 * r * std::cos(theta));
                coefF[(2 * s + 1) * 8 + l] = static_cast<float>(r * r);
            }
        }
        const std::vector<double> coefD(coefF.begin(), coefF.end()), gainD(8, 0.5),
            pickD(pickF.begin(), pickF.end()), xd(in, in + 512), xd2(in - 8, in + 504);
        std::vector<float> a(512 * 8), b(512 * 8);
        std::vector<float> sa = stateF, sb = stateF;
        gen.lanesF[k - 1](in, in - 8, 512, a.data(), coefF.data(), gainF.data(), pickF.data(),
                          sa.data());
        avx2->lanesF[k - 1](in, in - 8, 512, b.data(), coefF.data(), gainF.data(), pickF.data(),
                            sb.data());
        expectClose(a, b, "float lanes ");
        std::vector<double> da(2 * k * 8), db(2 * k * 8);
        gen.lanesD[k - 1](xd.data(), xd2.data(), 512, a.data(), coefD.data(), gainD.data(),
                          pickD.data(), da.data());
        avx2->lanesD[k - 1](xd.data(), xd2.data(), 512, b.data(), coefD.data(), gainD.data(),
                            pickD.data(), db.data());
        expectClose(a, b, "double lanes ");
        // The band zeros (1 - z^-2)^k.
        std::vector<float> za(509), zb(509);
        gen.zerosF[k - 1](in, za.size(), za.data());
        avx2->zerosF[k - 1](in, zb.size(), zb.data());
        expectClose(za, zb, "zeros ");
    }
    // Statistics of eight and of four lanes.
    for (auto levels : {&KernelTable::levels8, &KernelTable::levels4}) {
        double e[2][8] = {}, y[2][8] = {}, mx[2][8], mn[2][8];
        float mag[2][8] = {};
        std::fill(&mx[0][0], &mx[0][0] + 16, -1.0);
        std::fill(&mn[0][0], &mn[0][0] + 16, 1e9);
        for (int t = 0; t < 2; ++t) {
            const LevelRun run{e[t], y[t], mx[t], mn[t], mag[t], 0.01};
            ((t == 0 ? gen : *avx2).*levels)(in, 64, run);
        }
        for (std::size_t l = 0; l < 8; ++l) {
            EXPECT_NEAR(e[0][l], e[1][l], 1e-12 * e[1][l]);
            EXPECT_NEAR(y[0][l], y[1][l], 1e-12 * e[1][l]);
            EXPECT_NEAR(mx[0][l], mx[1][l], 1e-12 * e[1][l]);
            EXPECT_NEAR(mn[0][l], mn[1][l], 1e-12 * e[1][l]);
            EXPECT_EQ(mag[0][l], mag[1][l]);
        }
    }
}

}  // namespace
}  // namespace SlmLibrary
