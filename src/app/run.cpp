#include <new>

#include "app/run_state.h"
#include "config/command_line.h"
#include "config/settings.h"
#include "ipc/progress_pipe.h"
#include "platform/console.h"
#include "processing/session_driver.h"
#include "sessions/session_search.h"

namespace orv {

namespace {

int run(RunState& state, int argc, const char* const* argv) {
    platform::Console& out = state.out;
    if (initDefaults(state.settings, state.searchPaths, state.sessions,
                     state.env.vectorStartupStatus, out) == 0) {
        return kExitRefused;
    }
    platform::makeStdoutUnbuffered();
    if (parseCommandLine(argc, argv, state.settings, state.searchPaths, out) == 0) {
        printUsage(out);
        return kExitRefused;
    }

    ProgressPipe pipe(state.settings.pipeName);
    pipe.open();

    out.print("Finding Sessions...\r\n");
    const std::uint32_t found =
        findSessions(state.searchPaths, state.settings, state.sessions, out);
    out.print("Found %u Session(s)\r\n", found);

    std::uint32_t processed = 0;
    {
        SessionProcessor processor(state.settings, state.results, state.analysis, state.env.audio);
        for (std::uint32_t i = 0; i < found; ++i) {
            if (i < state.sessions.count()) {
                processor.processSession(state.sessions.entries[i], pipe);
            }
            processed = i + 1;
        }
    }

    out.print("\r\n");
    out.print("Processed %u out of %u sessions\r\n", processed, found);
    int status = processed == found ? kExitOk : kExitRefused;
    if (status == kExitOk && state.results.lost()) status = kExitResultsLost;
    pipe.close();
    return status;
}

}  // namespace

int runOrvCmd(int argc, const char* const* argv, platform::Console& out,
              const RunEnvironment& environment) {
    RunState state(out, environment);
    int status = kExitNoMemory;
    try {
        status = run(state, argc, argv);
    } catch (const std::bad_alloc&) {
        // Work tables that cannot be allocated end the run at once, without a message.
        status = kExitNoMemory;
    }
    releaseLists(state.settings, state.searchPaths, state.sessions);
    return status;
}

}  // namespace orv
