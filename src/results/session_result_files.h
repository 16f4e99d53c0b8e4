// Every result file of one session: created at the session's set-up, given its header at
// the first data file, closed at the session's end.
#pragma once

#include <cstdint>

#include "config/processing_settings.h"
#include "platform/console.h"
#include "results/band_results.h"
#include "results/general_results.h"
#include "results/leq_results.h"
#include "results/result_files.h"

namespace orv {

class SessionResultFiles {
public:
    // `sessionFileName`: the name the session's files carry (RunResults::sessionFileName).
    SessionResultFiles(ProcessingSettings& settings, std::string sessionFileName,
                       std::uint32_t generalTimeWeighting, RunResults& run);

    // Creates the session's files. False when the general results file cannot be created:
    // the session is then skipped. A Leq file, a band file or the filtered channel file
    // that cannot be created switches its kind of result off in the settings, for this and
    // every later session of the run.
    bool create();
    // Header blocks and column lines, general file first; a failure stops the rest.
    void writeHeaders(const ResultHeaderInfo& info);
    void close();
    const ResultNaming& naming() const { return naming_; }

    GeneralResultsWriter general;
    LeqResultsWriter leq;
    BandResultsWriter bands;

private:
    ProcessingSettings& settings_;
    ResultNaming naming_;
    std::uint32_t generalTimeWeighting_;
};

}  // namespace orv
