// orv_report: reads an output directory of orv_cmd and writes the session report into
// REPORT_DIR: index.html, one <session>.html per session and report.json.
#pragma once

#include <string>
#include <vector>

#include "figures.h"

namespace orv_report {

struct Options {
    std::string resultsDir;
    std::string reportDir;  // empty: resultsDir/report
    Thresholds thresholds;
};

struct ParsedArgs {
    Options options;
    bool help = false;
    std::string error;
};

ParsedArgs parseArgs(const std::vector<std::string>& args);
std::string usageText();

struct Outcome {
    bool written = false;          // index.html, report.json and every session page
    std::string reportDir, error;  // error: why nothing (or not all) could be written
    std::size_t sessions = 0;
    std::vector<std::string> problems;  // input problems, "file:line: message"
};

// Reads every session and writes the report; the figures also go to `report` when given.
Outcome writeReport(const Options& options, Report* report = nullptr);

}  // namespace orv_report
