// The run of one session over its level data files: result files, the record steps,
// progress, and the end of the session.
#pragma once

#include <cstdint>
#include <vector>

#include "config/processing_settings.h"
#include "input/level_data.h"
#include "ipc/progress_pipe.h"
#include "platform/console.h"
#include "results/result_files.h"
#include "results/result_header.h"
#include "sessions/session_record.h"

namespace orv {

// Processes sessions one after another. Everything a session needs is set up afresh for
// it; only what the run switched off in the settings (a result kind whose file could not be
// created) carries over to later sessions.
class SessionProcessor {
public:
    SessionProcessor(ProcessingSettings& settings, RunResults& results)
        : settings_(settings), results_(results), out_(results.out) {}

    void processSession(const SessionRecord& session, ProgressPipe& pipe);

    // The time weighting the session's general results are labelled with: F for a 125 ms
    // logger setting, S otherwise.
    static std::uint32_t generalTimeWeighting(const SessionRecord& session);

private:
    ResultHeaderInfo headerInfo(const SessionRecord& session, const DataFileHeader& header) const;

    ProcessingSettings& settings_;
    RunResults& results_;
    platform::Console& out_;
    // Reused from file to file: the bytes of one data file and its decoded records.
    std::vector<char> fileBytes_;
    LevelRecordQueue records_;
};

}  // namespace orv
