// The hourly raw level export: every dispatched block's audio turned into one record per
// 100 ms period (A- and C-weighted, F-time-weighted level at the period's end and the
// period's Leq), written hour by hour as each hour's records are complete.
#pragma once

#include <cstdint>
#include <vector>

#include "fweight.h"
#include "platform/console.h"
#include "processing/session_audio.h"
#include "results/hourly_raw_files.h"
#include "tweight.h"

namespace orv {

// One per session, on the driver's thread. The weightings run on across the blocks of one
// continuous recording and start afresh, primed, at the first block of each recording.
class RawLevelExport : public BlockObserver {
public:
    RawLevelExport(float calibrationGain, float rangeMultiplier, HourlyRawFiles& files,
                   platform::Console& out);

    // Conditions, weights and records the block, in pieces of at most one minute; writes
    // every hour that a later hour's record completes.
    void onDispatch(const AudioBlock& block) override;
    // End of the session: writes the hour in progress.
    void finish();

private:
    void prime(const float* x, std::size_t n);
    void addRecord(const RawLevelRecord& record, const DataFileHeader& header);

    float gain_;
    float range_;
    HourlyRawFiles& files_;
    platform::Console& out_;
    SlmLibrary::FWeight weighting_;
    SlmLibrary::TWeight timeA_;
    SlmLibrary::TWeight timeC_;
    bool started_ = false;  // the weightings hold the state of the last block's end
    std::vector<std::int16_t> raw_;
    std::vector<float> x_, a_, c_;
    std::vector<RawLevelRecord> hour_;  // records of the hour in progress
    DataFileHeader hourHeader_;
};

}  // namespace orv
