// What the analysis of one audio block gives the result files: the statistics of every
// band and of the filtered channel, and the block's octave short-Leq rows.
#pragma once

#include <cstdint>
#include <vector>

#include "platform/civil_time.h"
#include "results/leq_results.h"

namespace orv {

// The statistics of one band (or of the filtered channel) over one block.
struct BandIntervalResult {
    float lmin = 0.0F;  // dB
    float lmax = 0.0F;
    float leq = 0.0F;
    float battery = 0.0F;  // the block's lowest battery reading
    float lpeak = 0.0F;
    std::uint32_t overload = 0;           // the block's status flags
    std::vector<float> percentileLevels;  // one per percentile, in order
    float temperature = 0.0F;
};

// What a block gives the result files.
struct BlockResult {
    bool analysed = false;  // false: the block gave no results (its failure was reported)
    platform::SystemTime time;
    // The bank's bands in band order, then the filtered channel when it is on.
    std::vector<BandIntervalResult> bands;
    std::vector<LeqRow> leqRows;  // octave short-Leq rows, levels in dB
};

}  // namespace orv
