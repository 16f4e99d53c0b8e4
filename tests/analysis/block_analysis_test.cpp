// The analysis of one block: a block with its pre-roll reads as the same stretch of one
// continuous analysis, and the work item reports what went wrong.
#include <gtest/gtest.h>

#include <cmath>

#include "analysis/block_worker.h"
#include "slm.h"
#include "support/test_support.h"
#include "support/wave_builder.h"

namespace {

using namespace testing_support;

constexpr std::size_t kPeriod = 4800;

// Noise whose level jumps every 0.7 s over 30 dB, with a rumble at 7 Hz that comes and goes:
// the lowest bands and every statistic move.
std::vector<std::int16_t> unsteadyNoise(std::size_t count) {
    std::vector<std::int16_t> out = markedSamples(11, count);
    const auto rumble = toneSamples(7.0, 6000.0, count);
    for (std::size_t i = 0; i < count; ++i) {
        const std::size_t step = i / 33600;
        const double gain = std::pow(10.0, -static_cast<double>(step * 7 % 31) / 20.0) / 8.0;
        const double low = (step / 3) % 2 == 0 ? rumble[i] : 0.0;
        out[i] = static_cast<std::int16_t>(std::lround(out[i] * gain + low));
    }
    return out;
}

class BlockAnalysis : public ::testing::Test {
protected:
    void SetUp() override {
        writeWaveFile(dir_ / "a.wav", audio_);
        source_ = std::make_shared<orv::WaveSource>();
        source_->name = "a.wav";
        source_->file = platform::openForRead(dir_ / "a.wav");
    }
    // A block of the periods [first, last) with `preRoll` periods before it.
    orv::AudioBlock block(std::size_t first, std::size_t last, std::size_t preRoll) const {
        orv::AudioBlock b;
        b.audio.append(source_, 44 + first * kPeriod * 2, (last - first) * kPeriod);
        b.marks.assign(last - first, 0);
        b.preRoll.append(source_, 44 + (first - preRoll) * kPeriod * 2, preRoll * kPeriod);
        b.preRollMarks.assign(preRoll, 0);
        b.time = {2020, 9, 0, 17, 8, 0, 40, 0};
        return b;
    }

    TempDir dir_;
    std::vector<std::int16_t> audio_ = unsteadyNoise(40 * 48000);
    std::shared_ptr<orv::WaveSource> source_;
};

TEST_F(BlockAnalysis, BlockWithPreRollReadsAsOneContinuousAnalysis) {
    for (unsigned tw : {SlmLibrary::TWeight::F, SlmLibrary::TWeight::S}) {
        orv::BandAnalysisSettings s;
        s.bandCount = 36;
        s.octaveTimeWeighting = tw;
        s.octaveFreqWeighting = SlmLibrary::FWeight::Z;
        s.percentiles = {1, 10, 50, 90, 99};
        // Every band's warm-up ends inside the pre-roll.
        SlmLibrary::Slm probe;
        probe.initThirdOct(tw, SlmLibrary::FWeight::Z, 0, 35, 48000, 0);
        for (unsigned b = 0; b < 36; ++b) EXPECT_LT(probe.settlingSeconds(b), s.preRollSeconds());

        // The reference: one meter over 40 s, its statistics cleared at 20 s.
        SlmLibrary::Slm whole;
        whole.initThirdOct(tw, SlmLibrary::FWeight::Z, 0, 35, 48000, 0);
        whole.setPercentiles(s.percentiles);
        whole.resetAll();
        std::vector<float> x(audio_.size());
        SlmLibrary::Slm::preCondition(audio_.data(), x.data(), nullptr, x.size(), 1.0F, 1.0F);
        for (std::size_t pos = 0; pos < x.size(); pos += 48000) {
            if (pos == 20 * 48000) whole.resetStatistics();
            whole.addSamples(x.data() + pos, 48000, 4800, 0);
        }

        orv::BlockResult result;
        std::string error;
        ASSERT_EQ(orv::analyseBlock(block(200, 400, s.preRollSeconds() * 10), s, result, error),
                  orv::BlockFailure::None);
        ASSERT_EQ(result.bands.size(), 36U);
        for (unsigned b = 0; b < 36; ++b) {
            float leq, lmin, lmax, lpeak;
            std::vector<float> levels(5);
            whole.getStatistics(b, &leq, &lmin, &lmax, levels.data(), &lpeak, nullptr, nullptr);
            const orv::BandIntervalResult& r = result.bands[b];
            EXPECT_NEAR(r.leq, leq, 0.2) << tw << " band " << b;
            EXPECT_NEAR(r.lmin, lmin, 0.2) << tw << " band " << b;
            EXPECT_NEAR(r.lmax, lmax, 0.2) << tw << " band " << b;
            for (std::size_t p = 0; p < levels.size(); ++p) {
                EXPECT_NEAR(r.percentileLevels[p], levels[p], 0.2) << tw << " band " << b;
            }
        }
    }
}

TEST_F(BlockAnalysis, FailuresAreReportedAndLeaveNoRows) {
    orv::BandAnalysisSettings s;
    s.bandCount = 12;
    s.octaveTimeWeighting = SlmLibrary::TWeight::I;  // refused by the meter
    std::string printed;
    platform::Console console(&printed);
    orv::RunResults run(console);
    orv::BandResultsWriter writer(run);
    orv::PendingIntervalMap pending(writer, nullptr);
    orv::AnalysisRunState state;
    state.filterErrorPause = std::chrono::milliseconds(0);
    const orv::BlockWorker refused(s, pending, state, console);
    refused(block(10, 20, 0));
    refused(block(20, 30, 0));
    s.octaveTimeWeighting = SlmLibrary::TWeight::F;
    orv::AudioBlock beyond = block(10, 20, 0);
    beyond.audio.append(source_, 44 + 400 * kPeriod * 2, kPeriod);  // past the end of the file
    beyond.marks.push_back(0);
    orv::BlockWorker(s, pending, state, console)(beyond);
    EXPECT_EQ(printed,
              "\r\nUnable to configure filters - impulse time weighting is not supported\r\n"
              "Error Allocating Memory\r\n"
              "Error Allocating Memory\r\n"
              "ERR: Unable to read a.wav : unexpected end of file\r\n");
}

}  // namespace
