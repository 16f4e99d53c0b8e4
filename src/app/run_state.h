// The state of one run of the tool: everything that lives from start-up to exit. Each run
// (and each test) creates its own.
#pragma once

#include "analysis/block_worker.h"
#include "config/processing_settings.h"
#include "platform/console.h"
#include "processing/session_driver.h"
#include "results/result_files.h"
#include "sessions/search_paths.h"
#include "sessions/session_record.h"

namespace orv {

// What a run takes from the machine it runs on; tests and benchmarks set it.
struct RunEnvironment {
    // The vector-kernel start-up status (20: generic code path).
    int vectorStartupStatus = 0;
    AudioRunOptions audio;
    std::chrono::milliseconds filterErrorPause{1000};
};

struct RunState {
    RunState(platform::Console& console, const RunEnvironment& environment)
        : out(console), env(environment), results(console) {
        analysis.filterErrorPause = environment.filterErrorPause;
    }

    platform::Console& out;
    RunEnvironment env;
    RunResults results;  // result file names taken, and whether any result was lost
    ProcessingSettings settings;
    SearchPathList searchPaths;
    SessionTable sessions;
    AnalysisRunState analysis;
};

// Exit statuses of a run.
inline constexpr int kExitOk = 0;
inline constexpr int kExitRefused = -1;     // command line refused, or no percentile storage
inline constexpr int kExitNoMemory = 1;     // work tables could not be allocated
inline constexpr int kExitResultsLost = 2;  // a result file could not be created or written

// One whole run: start-up, command line, session search, every session, summary.
int runOrvCmd(int argc, const char* const* argv, platform::Console& out,
              const RunEnvironment& environment);

}  // namespace orv
