// The generic kernels (what a processor without AVX2 runs) against the AVX2 ones on the same
// data: this machine runs only one table through the meter, so each path checks the other.
#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <cstdint>
#include <stdexcept>
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
        const std::size_t blocks = 8 * 64 / IirBlockPlan::kBlock;
        for (int decimate = 0; decimate < 2; ++decimate) {
            std::vector<float> a(8 * 64), b(8 * 64);
            double sa[8] = {}, sb[8] = {};
            (decimate ? gen.iirDecimate : gen.iir)[k - 1](plan, sa, in, blocks, a.data());
            (decimate ? avx2->iirDecimate : avx2->iir)[k - 1](plan, sb, in, blocks, b.data());
            expectClose(a, b, "cascade ");
            for (std::size_t i = 0; i < 2 * k; ++i) EXPECT_NEAR(sa[i], sb[i], 1e-9);
            if (decimate == 0) continue;
            // Decimation in single precision follows the double one on both paths.
            for (const KernelTable* table : {&gen, avx2}) {
                std::vector<float> c(8 * 64);
                float sc[8] = {};
                table->iirDecimateF(plan, sc, in, blocks, c.data());
                expectClose(c, b, "single-precision decimation ");
            }
        }
        // Eight lanes of k all-pole sections, half of them adding a pair of zeros to the input
        // of the last section.
        std::vector<float> coefF(2 * k * 8), gainF(8, 0.5F), zeroF(8), stateF(2 * k * 8);
        for (std::size_t l = 0; l < 8; ++l) {
            zeroF[l] = l % 2 == 0 && k > 1 ? 1.0F : 0.0F;
            for (std::size_t s = 0; s < k; ++s) {
                const double r = 0.9, theta = 0.1 + 0.3 * static_cast<double>(l + s) / 8.0;
                coefF[2 * s * 8 + l] = static_cast<float>(-2.0 * r * std::cos(theta));
                coefF[(2 * s + 1) * 8 + l] = static_cast<float>(r * r);
            }
        }
        const std::vector<double> coefD(coefF.begin(), coefF.end()), gainD(8, 0.5),
            zeroD(zeroF.begin(), zeroF.end()), xd(in, in + 512);
        std::vector<float> a(512 * 8), b(512 * 8);
        std::vector<float> sa = stateF, sb = stateF;
        gen.lanesF[k - 1](in, 512, a.data(), coefF.data(), gainF.data(), zeroF.data(), sa.data());
        avx2->lanesF[k - 1](in, 512, b.data(), coefF.data(), gainF.data(), zeroF.data(), sb.data());
        expectClose(a, b, "float lanes ");
        // Unused lanes (gain zero, as SosLanes leaves them) read zero; the generic path skips
        // a part of them.
        std::fill(gainF.begin() + 4, gainF.end(), 0.0F);
        gen.lanesF[k - 1](in, 512, a.data(), coefF.data(), gainF.data(), zeroF.data(), sa.data());
        avx2->lanesF[k - 1](in, 512, b.data(), coefF.data(), gainF.data(), zeroF.data(), sb.data());
        expectClose(a, b, "float lanes, four unused ");
        for (std::size_t i = 4; i < 512 * 8; i += (i % 8 == 7 ? 5 : 1)) {
            ASSERT_EQ(a[i], 0.0F) << i;
        }
        std::vector<double> da(2 * k * 8), db(2 * k * 8);
        gen.lanesD[k - 1](xd.data(), 512, a.data(), coefD.data(), gainD.data(), zeroD.data(),
                          da.data());
        avx2->lanesD[k - 1](xd.data(), 512, b.data(), coefD.data(), gainD.data(), zeroD.data(),
                            db.data());
        expectClose(a, b, "double lanes ");
        // The band zeros (1 - z^-2)^k.
        std::vector<float> za(509), zb(509);
        gen.zerosF[k - 1](in, za.size(), za.data());
        avx2->zerosF[k - 1](in, zb.size(), zb.data());
        expectClose(za, zb, "zeros ");
    }
}

// A cascade gives the same outputs whatever the sizes of the calls it is fed in (blocks
// left unfinished by a call), plain or decimating, in either precision.
TEST(Cascades, OutputsDoNotDependOnHowTheSignalIsCut) {
    const std::vector<float> x = level_library_test::whiteNoise(3000, 11);
    const SosList sos = design::toSos(
        design::bilinear(design::lowpassToLowpass(design::chebyshev2Prototype(8, 80.0),
                                                  design::prewarp(0.25, 1.0)),
                         1.0),
        0.0, 1.0, 1.0);
    for (const auto precision : {SosCascade::Precision::Double, SosCascade::Precision::Single}) {
        for (int decimate = 0; decimate < 2; ++decimate) {
            if (precision == SosCascade::Precision::Single && decimate == 0) continue;
            auto run = [&](std::initializer_list<std::size_t> cuts) {
                SosCascade cascade(sos, precision);
                std::vector<float> out(x.size());
                std::size_t pos = 0, written = 0;
                for (std::size_t cut : cuts) {
                    const std::size_t n = std::min(cut, x.size() - pos);
                    if (decimate) {
                        written += cascade.processDecimate(x.data() + pos, n, out.data() + written);
                    } else {
                        cascade.process(x.data() + pos, out.data() + pos, n);
                        written += n;
                    }
                    pos += n;
                }
                out.resize(written);
                return out;
            };
            const std::vector<float> whole = run({3000});
            EXPECT_EQ(whole.size(), decimate ? 1500U : 3000U);
            EXPECT_EQ(run({1, 2, 5, 13, 16, 17, 31, 7, 3000}), whole);
            EXPECT_EQ(run({15, 15, 15, 15, 3000}), whole);
        }
    }
}

// Band-passes as lanes on one input with the zeros of the shortest lanes: a lane with one
// section more adds its last pair of zeros itself. Each lane follows its cascade run on its
// own, in float and double lanes.
TEST(Lanes, EachLaneIsItsBandPass) {
    const double fs = 24000.0;
    auto bandpass = [&](int order, double f1, double f2) {
        const double w1 = design::prewarp(f1, fs), w2 = design::prewarp(f2, fs);
        return design::toSos(
            design::bilinear(design::lowpassToBandpass(design::butterworthPrototype(order),
                                                       std::sqrt(w1 * w2), w2 - w1),
                             fs),
            std::sqrt(f1 * f2), fs, 1.0);
    };
    const std::vector<SosList> bands = {bandpass(3, 900, 1130),
                                        bandpass(4, 7000, 8800),
                                        {},
                                        bandpass(3, 3500, 4400),
                                        bandpass(4, 9000, 11000)};
    const std::vector<float> x = level_library_test::whiteNoise(4000, 3);
    BandZeros zeros(3);
    std::vector<float> uF(x.size());
    std::vector<double> uD(x.size());
    zeros.process(x.data(), x.size(), uF.data());
    zeros.reset();
    zeros.process(x.data(), x.size(), uD.data());
    SosLanes<float> lanesF(bands);
    SosLanes<double> lanesD(bands);
    ASSERT_EQ(lanesF.order(), 3U);
    std::vector<float> outF(x.size() * kLaneWidth), outD(x.size() * kLaneWidth);
    lanesF.process(uF.data(), x.size(), outF.data());
    lanesD.process(uD.data(), x.size(), outD.data());
    for (std::size_t l = 0; l < kLaneWidth; ++l) {
        std::vector<float> ref(x.size(), 0.0F);
        if (l < bands.size() && !bands[l].empty()) {
            SosCascade(bands[l]).process(x.data(), ref.data(), x.size());
        }
        float scale = 1e-30F;
        for (float v : ref) scale = std::max(scale, std::fabs(v));
        for (std::size_t i = 0; i < x.size(); ++i) {
            ASSERT_NEAR(outF[i * kLaneWidth + l], ref[i], 2e-4F * scale) << "float lane " << l;
            ASSERT_NEAR(outD[i * kLaneWidth + l], ref[i], 1e-5F * scale) << "double lane " << l;
        }
    }
    EXPECT_THROW(SosLanes<float>({bandpass(2, 900, 1130), bandpass(4, 7000, 8800)}),
                 std::invalid_argument);
}

// The statistics kernel on every path this processor has, against the definition in double
// precision applied to band frames (from float and double lanes), four or eight lanes, the
// frames in pieces of odd sizes: the kernel sums blocks of eight squares in float, within
// 1e-7 (5e-7 dB). For the peak search it lists stretches of at most eight frames that hold
// every frame where a lane reaches its threshold, and only such stretches.
TEST(Kernels, StatisticsFollowTheirDefinition) {
    const std::vector<float> x = level_library_test::whiteNoise(8 * 64 + 8, 7);
    const float* in = x.data() + 8;
    constexpr std::size_t kFrames = 300;
    std::vector<float> coef(2 * 8), gain(8, 0.5F);
    for (std::size_t l = 0; l < 8; ++l) {
        coef[l] = static_cast<float>(-1.8 * std::cos(0.1 + 0.05 * static_cast<double>(l)));
        coef[8 + l] = 0.81F;
    }
    const std::vector<double> coefD(coef.begin(), coef.end()), gainD(gain.begin(), gain.end()),
        xd(in, in + kFrames);
    const double alpha = 0.01;
    double weights[9];
    float weightsF[8];
    for (int j = 0; j <= 8; ++j) {
        weights[j] = (j < 8 ? alpha : 1.0) * std::pow(1.0 - alpha, j < 8 ? 7 - j : 8);
        if (j < 8) weightsF[j] = static_cast<float>(weights[j]);
    }
    for (const KernelTable* table : {&genericKernels(), avx2Kernels()}) {
        if (table == nullptr) continue;
        for (int precision = 0; precision < 2; ++precision) {
            std::vector<float> frames(kFrames * 8);
            std::vector<float> stateF(16, 0.0F);
            std::vector<double> stateD(16, 0.0);
            if (precision == 0) {
                table->lanesF[0](in, kFrames, frames.data(), coef.data(), gain.data(), nullptr,
                                 stateF.data());
            } else {
                table->lanesD[0](xd.data(), kFrames, frames.data(), coefD.data(), gainD.data(),
                                 nullptr, stateD.data());
            }
            float top = 0.0F;
            for (float v : frames) top = std::max(top, std::fabs(v));
            const float reach[8] = {0.8F * top, 0.9F * top,  0.7F * top, top,
                                    0.6F * top, 0.95F * top, 2 * top,    0.85F * top};
            for (unsigned lanes : {4U, 8U}) {
                double e[8] = {}, y[8], mx[8], mn[8];
                float mag[8] = {};
                std::fill(y, y + 8, 0.5);
                std::fill(mx, mx + 8, -1.0);
                std::fill(mn, mn + 8, 1e9);
                std::vector<std::uint32_t> stretches;
                LevelRun run{e,       y,        mx,    mn,      mag,     alpha,
                             weights, weightsF, reach, nullptr, nullptr, lanes};
                for (std::size_t i = 0, piece = 5; i < kFrames; i += piece, piece += 59) {
                    const std::size_t n = std::min(piece, kFrames - i);
                    std::vector<std::uint32_t> found(2 * (n / 8 + 1));
                    std::size_t count = 0;
                    run.candidates = found.data();
                    run.candidateCount = &count;
                    table->levels(frames.data() + 8 * i, n, run);
                    for (std::size_t c = 0; c < count; ++c) {
                        stretches.push_back(found[2 * c] + static_cast<std::uint32_t>(i));
                        stretches.push_back(found[2 * c + 1]);
                    }
                }
                SCOPED_TRACE(testing::Message()
                             << table->name << " precision " << precision << " lanes " << lanes);
                std::vector<int> listed(kFrames, 0);
                for (std::size_t c = 0; c < stretches.size(); c += 2) {
                    ASSERT_LE(stretches[c + 1], 8U);
                    bool reaches = false;
                    for (std::size_t i = stretches[c]; i < stretches[c] + stretches[c + 1]; ++i) {
                        ++listed[i];
                        for (std::size_t l = 0; l < 8; ++l)
                            reaches = reaches || std::fabs(frames[i * 8 + l]) >= reach[l];
                    }
                    EXPECT_TRUE(reaches) << "stretch at " << stretches[c];
                }
                for (std::size_t i = 0; i < kFrames; ++i) {
                    for (std::size_t l = 0; l < 8; ++l) {
                        if (std::fabs(frames[i * 8 + l]) >= reach[l]) {
                            EXPECT_EQ(listed[i], 1) << i;
                        }
                    }
                }
                for (std::size_t l = 0; l < 8; ++l) {
                    double re = 0.0, ry = 0.5, rmax = -1.0, rmin = 1e9;
                    float rmag = 0.0F;
                    for (std::size_t i = 0; i < kFrames; ++i) {
                        const double v = frames[i * 8 + l];
                        re += v * v;
                        ry = (1.0 - alpha) * ry + alpha * v * v;
                        rmax = std::max(rmax, ry);
                        rmin = std::min(rmin, ry);
                        rmag = std::max(rmag, std::fabs(frames[i * 8 + l]));
                    }
                    SCOPED_TRACE(testing::Message() << "lane " << l);
                    EXPECT_EQ(mag[l], rmag);
                    if (l >= lanes) {
                        EXPECT_EQ(e[l], 0.0);  // left alone
                        continue;
                    }
                    EXPECT_NEAR(e[l], re, 1e-7 * re);
                    EXPECT_NEAR(y[l], ry, 1e-7 * re);
                    EXPECT_NEAR(mx[l], rmax, 1e-7 * re);
                    EXPECT_NEAR(mn[l], rmin, 1e-7 * re);
                }
            }
        }
    }
}

}  // namespace
}  // namespace SlmLibrary
