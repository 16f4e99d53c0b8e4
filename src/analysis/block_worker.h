// The analysis work item: one audio block analysed on a worker thread, its results entered
// into the session's pending results, its failures reported on the console.
#pragma once

#include <atomic>
#include <chrono>
#include <set>
#include <string>

#include "analysis/band_analysis.h"
#include "platform/console.h"
#include "processing/audio_block.h"
#include "results/band_results.h"

namespace orv {

// What the audio analysis keeps for the whole run.
struct AnalysisRunState {
    // A meter set-up failure is explained once per run.
    std::atomic<bool> filterErrorShown{false};
    // Pause after the explanation, so that it can be read before the run goes on.
    std::chrono::milliseconds filterErrorPause{1000};
    // Hourly raw level files written so far (driver thread only).
    std::set<std::string> rawFilesWritten;
};

class BlockWorker {
public:
    BlockWorker(BandAnalysisSettings settings, PendingIntervalMap& pending,
                AnalysisRunState& runState, platform::Console& out)
        : settings_(std::move(settings)), pending_(pending), runState_(runState), out_(out) {}

    // Analyses the block and enters its results (or its failure) under its sequence number.
    void operator()(const AudioBlock& block) const;

    const BandAnalysisSettings& settings() const { return settings_; }

private:
    BandAnalysisSettings settings_;
    PendingIntervalMap& pending_;
    AnalysisRunState& runState_;
    platform::Console& out_;
};

}  // namespace orv
