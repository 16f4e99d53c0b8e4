// The analysis of one audio block: a level meter over the block's audio (1/1- or
// 1/3-octave bands and the filtered channel), giving each band's statistics and the
// octave short-Leq rows of the block.
#pragma once

#include <atomic>
#include <cstdint>
#include <string>
#include <vector>

#include "analysis/band_interval_result.h"
#include "config/processing_settings.h"
#include "leq.h"
#include "platform/console.h"
#include "processing/audio_block.h"
#include "sessions/session_record.h"

namespace orv {

// What the analysis of a session's blocks needs, fixed for the session.
struct BandAnalysisSettings {
    std::uint32_t bandCount = 0;  // 0 (no bank), 12 or 36
    std::uint32_t octaveFreqWeighting = 0;
    std::uint32_t octaveTimeWeighting = 0;
    std::uint32_t auxFilterType = 0;  // 0: no filtered channel
    float auxFreq1 = 0.0F;
    float auxFreq2 = 0.0F;
    std::uint32_t auxFreqWeighting = 0;
    std::uint32_t auxTimeWeighting = 0;
    std::vector<float> percentiles;  // whole numbers, truncated from the settings
    std::uint32_t leqSeconds = 0;    // length of the octave short Leq; 0: off
    float calibrationGain = 1.0F;    // linear
    float rangeMultiplier = 1.0F;

    static BandAnalysisSettings from(const ProcessingSettings& settings,
                                     const SessionRecord& session);
    // A step of one second overloads when its largest conditioned sample is above this.
    float overloadThreshold() const;
    // Seconds of the recording before a block that the block needs to read as part of one
    // continuous analysis: every band's warm-up ends inside them.
    unsigned preRollSeconds() const;
};

// 10^(0.05 x calibration) as a linear gain: the product in single precision, the power in
// double precision, the result in single precision.
float calibrationToGain(float calibrationDb);

// Analyses a block. False when the meter could not be set up or the audio could not be
// read; `error` then says why (the exception text, or "<file> : <reason>").
enum class BlockFailure { None, SetUp, Read };
BlockFailure analyseBlock(const AudioBlock& block, const BandAnalysisSettings& settings,
                          BlockResult& result, std::string& error);

// The short-Leq rows of one band: the block's one-second Leqs (the last ends at the block
// time) pooled into rows of leqSeconds, the first row taking the odd part. The rows exist
// already (one per interval); this sets their time, overload count and the band's level
// (a power) at `bandIndex`.
void buildLeqRows(std::uint32_t leqSeconds, std::size_t bandIndex, platform::FileTime blockTime,
                  const std::vector<SlmLibrary::Leq>& shortLeqs,
                  const std::vector<std::uint32_t>& overloadFlags, std::vector<LeqRow>& rows);

}  // namespace orv
