#include "analysis/band_analysis.h"

#include <algorithm>
#include <cmath>
#include <exception>

#include "dsp.h"
#include "platform/error_text.h"
#include "results/result_header.h"
#include "slm.h"

namespace orv {
namespace {

constexpr std::size_t kChunkPeriods = 600;             // one minute
constexpr std::size_t kStepSamples = kWaveSampleRate;  // one second
constexpr std::size_t kChunkSamples = kChunkPeriods * kPeriodSamples;

std::string readError(const std::string& file, int code) {
    return file + " : " + (code != 0 ? platform::errorText(code) : "unexpected end of file");
}

void setUpMeter(SlmLibrary::Slm& slm, const BandAnalysisSettings& s) {
    if (s.bandCount == 36) {
        slm.initThirdOct(s.octaveTimeWeighting, s.octaveFreqWeighting, 0, 35, kWaveSampleRate, 0);
    } else if (s.bandCount == 12) {
        slm.initFullOct(s.octaveTimeWeighting, s.octaveFreqWeighting, 0, 11, kWaveSampleRate, 0);
    }
    if (s.auxFilterType != 0) {
        const float corners[2] = {s.auxFreq1, s.auxFreq2};
        slm.initAuxCh(s.auxFilterType, corners, s.auxTimeWeighting, s.auxFreqWeighting,
                      kWaveSampleRate);
    }
}

BandIntervalResult blockDefaults(const AudioBlock& block, std::size_t percentileCount) {
    BandIntervalResult r;
    r.battery = block.minBattery;
    r.overload = block.statusFlags;
    r.temperature = block.temperature;
    r.percentileLevels.assign(percentileCount, 0.0F);
    return r;
}

}  // namespace

float calibrationToGain(float calibrationDb) {
    return static_cast<float>(std::pow(10.0, static_cast<double>(0.05F * calibrationDb)));
}

BandAnalysisSettings BandAnalysisSettings::from(const ProcessingSettings& settings,
                                                const SessionRecord& session) {
    BandAnalysisSettings s;
    s.bandCount = settings.octaveBandCount;
    s.octaveFreqWeighting = settings.octaveFreqWeighting;
    s.octaveTimeWeighting = settings.octaveTimeWeighting;
    s.auxFilterType = settings.auxFilterType;
    s.auxFreq1 = settings.auxFreq1;
    s.auxFreq2 = settings.auxFreq2;
    s.auxFreqWeighting = settings.auxFreqWeighting;
    s.auxTimeWeighting = settings.auxTimeWeighting;
    for (float p : settings.percentiles) {
        s.percentiles.push_back(static_cast<float>(truncatePercentile(p)));
    }
    if (settings.leqOn()) s.leqSeconds = displayInterval(settings.leqInterval);
    s.calibrationGain = calibrationToGain(session.calibration);
    s.rangeMultiplier = session.rangeMultiplier;
    return s;
}

float BandAnalysisSettings::overloadThreshold() const {
    // The range multiplier as the conditioning applies it: 0 or less counts as 1.
    const float range = rangeMultiplier > 0.0F ? rangeMultiplier : 1.0F;
    return 27600.0F * range * calibrationGain;
}

unsigned BandAnalysisSettings::preRollSeconds() const {
    // The slowest warm-up (third-octave 6.3 Hz band) is 2.6 s with F and about 3.4 s with S;
    // an S average also remembers 13 % of what came more than 2 s before.
    const bool slow = (bandCount != 0 && octaveTimeWeighting == SlmLibrary::TWeight::S) ||
                      (auxFilterType != 0 && auxTimeWeighting == SlmLibrary::TWeight::S);
    return slow ? 8 : 3;
}

BlockFailure analyseBlock(const AudioBlock& block, const BandAnalysisSettings& s,
                          BlockResult& result, std::string& error) {
    result = BlockResult{};
    result.time = block.time;
    SlmLibrary::Slm slm(kWaveSampleRate, 1, kStepSamples);
    try {
        setUpMeter(slm, s);
    } catch (const std::exception& e) {
        error = e.what();
        return BlockFailure::SetUp;
    }
    slm.setPercentiles(s.percentiles);
    slm.resetAll();

    // Buffers for the longest piece: a chunk, or all of a shorter block or its pre-roll.
    const auto longest = static_cast<std::size_t>(std::min<std::uint64_t>(
        kChunkSamples, std::max(block.sampleCount(), block.preRoll.samples())));
    std::vector<std::int16_t> raw(longest);
    std::vector<float> x(longest);
    std::string failedFile;
    int code = 0;

    // The audio of the recording before the block: the meter's filters and time weightings
    // run through it without counting it, so the block reads as a stretch of one
    // continuous analysis.
    const auto preRoll =
        static_cast<std::size_t>(std::min<std::uint64_t>(block.preRoll.samples(), kChunkSamples));
    if (preRoll > 0) {
        const std::uint64_t skip = block.preRoll.samples() - preRoll;
        if (!block.preRoll.read(skip, preRoll, raw.data(), &failedFile, &code)) {
            error = readError(failedFile, code);
            return BlockFailure::Read;
        }
        const std::uint32_t* marks = block.preRollMarks.data() + skip / kPeriodSamples;
        SlmLibrary::Slm::preCondition(raw.data(), x.data(), marks, preRoll, s.rangeMultiplier,
                                      s.calibrationGain);
        slm.preRoll(x.data(), preRoll);
    }

    // One-minute chunks, the odd part first; one-second steps, the odd part first, so that
    // every one-second Leq after the first is a whole second and the last ends at the block
    // time.
    const std::size_t periods = block.periodCount();
    const float threshold = s.overloadThreshold();
    std::vector<std::uint32_t> overloadFlags;
    for (std::size_t first = 0; first < periods;) {
        const std::size_t odd = periods % kChunkPeriods;
        const std::size_t count = first == 0 && odd != 0 ? odd : kChunkPeriods;
        const std::size_t n = count * kPeriodSamples;
        if (!block.audio.read(std::uint64_t{first} * kPeriodSamples, n, raw.data(), &failedFile,
                              &code)) {
            error = readError(failedFile, code);
            return BlockFailure::Read;
        }
        SlmLibrary::Slm::preCondition(raw.data(), x.data(), block.marks.data() + first, n,
                                      s.rangeMultiplier, s.calibrationGain);
        for (std::size_t pos = 0; pos < n;) {
            const std::size_t oddStep = n % kStepSamples;
            const std::size_t step = pos == 0 && oddStep != 0 ? oddStep : kStepSamples;
            const float* data = x.data() + pos;
            slm.addSamples(data, step, step / 10, s.leqSeconds != 0 ? step : 0);
            if (s.leqSeconds != 0) {
                float peak = 0.0F;
                for (std::size_t i = 0; i < step; ++i) peak = std::max(peak, std::fabs(data[i]));
                overloadFlags.push_back(peak > threshold ? 1U : 0U);
            }
            pos += step;
        }
        first += count;
    }

    // Statistics of every band, then the filtered channel.
    const std::size_t percentileCount = s.percentiles.size();
    for (std::uint32_t b = 0; b < s.bandCount; ++b) {
        BandIntervalResult r = blockDefaults(block, percentileCount);
        slm.getStatistics(b, &r.leq, &r.lmin, &r.lmax, r.percentileLevels.data(), &r.lpeak, nullptr,
                          nullptr);
        result.bands.push_back(std::move(r));
    }
    if (s.auxFilterType != 0) {
        BandIntervalResult r = blockDefaults(block, percentileCount);
        slm.getAuxStatistics(&r.leq, &r.lmin, &r.lmax, r.percentileLevels.data(), &r.lpeak, nullptr,
                             nullptr);
        result.bands.push_back(std::move(r));
    }

    // Octave short-Leq rows: the bands' levels, then the filtered channel's.
    platform::FileTime blockTime = 0;
    const std::size_t m = s.bandCount != 0 ? slm.getShortLeq(0).size() : 0;
    if (s.leqSeconds != 0 && m > 0 && platform::systemTimeToFileTime(block.time, blockTime)) {
        result.leqRows.resize((m + s.leqSeconds - 1) / s.leqSeconds);
        for (LeqRow& row : result.leqRows) row.levels.assign(s.bandCount, 0.0F);
        for (std::uint32_t b = 0; b < s.bandCount; ++b) {
            buildLeqRows(s.leqSeconds, b, blockTime, slm.getShortLeq(b), overloadFlags,
                         result.leqRows);
        }
        if (s.auxFilterType != 0) {
            buildLeqRows(s.leqSeconds, s.bandCount, blockTime, slm.getAuxShortLeq(), overloadFlags,
                         result.leqRows);
        }
        for (LeqRow& row : result.leqRows) {
            SlmLibrary::Dsp::GetPwrdB_I(row.levels.data(), row.levels.size());
        }
    }
    result.analysed = true;
    return BlockFailure::None;
}

void buildLeqRows(std::uint32_t leqSeconds, std::size_t bandIndex, platform::FileTime blockTime,
                  const std::vector<SlmLibrary::Leq>& shortLeqs,
                  const std::vector<std::uint32_t>& overloadFlags, std::vector<LeqRow>& rows) {
    const std::size_t m = shortLeqs.size();
    const platform::FileTime span = m * platform::kTicksPerSecond;
    if (leqSeconds == 0 || m == 0 || rows.empty() || blockTime < span) return;
    platform::FileTime t = blockTime - span;
    std::size_t index = 0;
    std::size_t length = m % leqSeconds != 0 ? m % leqSeconds : leqSeconds;
    for (LeqRow& row : rows) {
        if (index >= m) break;
        length = std::min(length, m - index);
        SlmLibrary::Leq pooled(0.0, 0.0, false);
        std::uint32_t overload = 0;
        for (std::size_t k = index; k < index + length; ++k) {
            pooled.add(shortLeqs[k]);
            if (k < overloadFlags.size()) overload += overloadFlags[k];
        }
        row.overload = overload;
        t += length * platform::kTicksPerSecond;
        if (bandIndex < row.levels.size()) {
            row.levels[bandIndex] = pooled.GetLeq();
        } else {
            row.levels.push_back(pooled.GetLeq());
        }
        platform::fileTimeToSystemTime(t, row.time);
        row.time.milliseconds = 0;
        index += length;
        length = leqSeconds;
    }
}

}  // namespace orv
