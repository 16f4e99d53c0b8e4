// The state of one run of the tool: everything that lives from start-up to exit. Each run
// (and each test) creates its own.
#pragma once

#include "config/processing_settings.h"
#include "platform/console.h"
#include "results/result_files.h"
#include "sessions/search_paths.h"
#include "sessions/session_record.h"

namespace orv {

struct RunState {
    explicit RunState(platform::Console& console) : out(console), results(console) {}

    platform::Console& out;
    RunResults results;  // result file names taken, and whether any result was lost
    ProcessingSettings settings;
    SearchPathList searchPaths;
    SessionTable sessions;
};

// Exit statuses of a run.
inline constexpr int kExitOk = 0;
inline constexpr int kExitRefused = -1;     // command line refused, or no percentile storage
inline constexpr int kExitNoMemory = 1;     // work tables could not be allocated
inline constexpr int kExitResultsLost = 2;  // a result file could not be created or written

// One whole run: start-up, command line, session search, every session, summary.
// `vectorStartupStatus` is the vector-kernel start-up status (20: generic code path).
int runOrvCmd(int argc, const char* const* argv, platform::Console& out, int vectorStartupStatus);

}  // namespace orv
