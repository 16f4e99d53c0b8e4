// The run of one session over its level data files.
#pragma once

#include "config/processing_settings.h"
#include "ipc/progress_pipe.h"
#include "platform/console.h"
#include "sessions/session_record.h"

namespace orv {

// Processes sessions one after another. Everything a session needs is set up afresh for
// it; only features switched off for the run (settings) carry over.
class SessionProcessor {
public:
    SessionProcessor(ProcessingSettings& settings, platform::Console& out)
        : settings_(settings), out_(out) {}

    void processSession(SessionRecord& session, ProgressPipe& pipe);

private:
    ProcessingSettings& settings_;
    platform::Console& out_;
};

}  // namespace orv
