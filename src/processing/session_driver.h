// The run of one session over its level data files: result files, the record steps, the
// audio analysis, progress, and the end of the session.
#pragma once

#include <cstdint>
#include <memory>
#include <vector>

#include "analysis/block_worker.h"
#include "config/processing_settings.h"
#include "input/level_data.h"
#include "ipc/progress_pipe.h"
#include "platform/console.h"
#include "platform/thread_pool.h"
#include "results/result_files.h"
#include "results/result_header.h"
#include "sessions/session_record.h"

namespace orv {

// How the run schedules its audio analysis. Zero values are taken from the machine.
struct AudioRunOptions {
    unsigned workerThreads = 0;      // threads of the analysis pool; 0: one per logical processor
    unsigned workerLimit = 0;        // 0: from the processor counts (1 with 60-minute intervals)
    bool reverseBlockOrder = false;  // blocks finish last first (tests of the result order)
};

// Processes sessions one after another. Everything a session needs is set up afresh for
// it; only what the run switched off in the settings (a result kind whose file could not be
// created) carries over to later sessions.
class SessionProcessor {
public:
    SessionProcessor(ProcessingSettings& settings, RunResults& results,
                     AnalysisRunState& analysisState, const AudioRunOptions& audioOptions)
        : settings_(settings),
          results_(results),
          out_(results.out),
          analysisState_(analysisState),
          audioOptions_(audioOptions) {}

    void processSession(const SessionRecord& session, ProgressPipe& pipe);

    // The time weighting the session's general results are labelled with: F for a 125 ms
    // logger setting, S otherwise.
    static std::uint32_t generalTimeWeighting(const SessionRecord& session);

private:
    ResultHeaderInfo headerInfo(const SessionRecord& session, const DataFileHeader& header) const;
    platform::ThreadPool& pool();
    unsigned workerLimit() const;

    ProcessingSettings& settings_;
    RunResults& results_;
    platform::Console& out_;
    AnalysisRunState& analysisState_;
    AudioRunOptions audioOptions_;
    std::unique_ptr<platform::ThreadPool> pool_;  // made when the first session needs it
    // Reused from file to file: the bytes of one data file and its decoded records.
    std::vector<char> fileBytes_;
    LevelRecordQueue records_;
};

}  // namespace orv
