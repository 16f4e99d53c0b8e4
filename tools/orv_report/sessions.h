// The sessions in an output directory of orv_cmd: which result files belong to which session,
// in the flat layout (every file in the directory, named after its session) and in the
// sub-directory layout of -bin (one directory per session), or any mix of both.
#pragma once

#include <optional>
#include <string>
#include <vector>

#include "result_files.h"

namespace orv_report {

struct SessionFiles {
    std::string name;  // the session's name: file prefix (flat) or directory name (-bin)
    std::string id;    // unique in the run, safe as a file name: the page is <id>.html
    bool binLayout = false;
    std::optional<ResultFile> general;
    std::vector<ResultFile> leq;        // the Leq file and its roll-over parts, in part order
    std::vector<ResultFile> octaveLeq;  // likewise for the octave Leq file
    std::vector<ResultFile> bands;      // one per band, low to high
    std::optional<ResultFile> filtered;
    std::vector<ResultFile> raw;      // hourly level files computed from the audio
    std::vector<std::string> unused;  // files of the session with other settings, not shown
    // The header block the session's figures refer to: the general file's, else the first
    // result file's that has one.
    const ResultHeader* header() const;
};

struct Catalogue {
    std::vector<SessionFiles> sessions;    // flat-layout sessions first, each part by name
    std::vector<std::string> unusedFiles;  // files that belong to no session found
};

// Lists and classifies the files of resultsDir and of its sub-directories (except skipDir,
// where the report goes). Reads only the first lines of each file.
Catalogue findSessions(const std::string& resultsDir, const std::string& skipDir,
                       std::vector<Problem>& problems);

// Reads the rows of every file of the session.
void readSessionRows(SessionFiles& session, std::vector<Problem>& problems);

}  // namespace orv_report
