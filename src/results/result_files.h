// Names of a session's result files in the two layouts, and their creation.
#pragma once

#include <cstdint>
#include <string>

#include "config/processing_settings.h"
#include "platform/console.h"
#include "platform/files.h"
#include "sessions/session_record.h"

namespace orv {

enum class LeqFileKind { AllPass = 0, Octave = 1 };

// "ERR", "LPF", "HPF", "BPF", "BSF", "IIR", "APF" by filter type.
const char* filterName(std::uint32_t type);
// "3OCT" for 36 bands, else "1OCT".
const char* octaveLabel(std::uint32_t bandCount);

// Builds the result file names of one session. In the flat layout every file lies in the
// output directory with the session name as prefix; in the sub-directory layout (-bin) the
// files lie in <output>/<session name>/ with names that spell out weightings and intervals.
class ResultNaming {
public:
    // The longest path a result file may have.
    static constexpr std::size_t kMaxPathLength = 259;

    ResultNaming(const ProcessingSettings& settings, const SessionRecord& session,
                 std::uint32_t generalTimeWeighting)
        : settings_(settings), session_(session), generalTimeWeighting_(generalTimeWeighting) {}

    std::string general() const;
    std::string leq(LeqFileKind kind, std::uint32_t octaveBandCount) const;
    std::string octaveBand(std::uint32_t band, std::uint32_t bandCount) const;
    std::string filtered() const;
    // The name of roll-over part `part` (> 0) of a Leq file: ".csv" replaced by "_<part>.csv".
    static std::string leqPart(const std::string& name, std::uint32_t part);

    // The per-session directory of the sub-directory layout, created when missing (errors
    // are left to the file creation that follows). Empty in the flat layout.
    std::string prepareSessionDirectory() const;
    // Where the session's files go: the output directory (flat) or the session directory,
    // ending with the path separator.
    std::string directory() const;

private:
    const ProcessingSettings& settings_;
    const SessionRecord& session_;
    std::uint32_t generalTimeWeighting_;
};

// Deletes any file of the name and creates it anew. On failure (including a path longer than
// ResultNaming::kMaxPathLength) prints "Unable to open %s : %u" with the path and the
// system's error code, and returns an invalid file.
platform::File createResultFile(const std::string& path, platform::Console& out);

}  // namespace orv
