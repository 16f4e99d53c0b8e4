#include "report.h"

#include <cmath>
#include <cstdlib>

#include "html_pages.h"
#include "platform/directory.h"
#include "platform/files.h"
#include "report_json.h"
#include "sessions.h"

namespace orv_report {
namespace {

bool parseNumber(const std::string& text, double& out) {
    char* end = nullptr;
    out = std::strtod(text.c_str(), &end);
    return !text.empty() && end == text.c_str() + text.size() && std::isfinite(out);
}

bool writeText(const std::string& path, const std::string& text, std::string& error) {
    int code = 0;
    platform::File f = platform::createResultFile(path, &code);
    if (f.valid() && f.write(text, &code) == text.size()) return true;
    error = "cannot write " + path + " (error " + std::to_string(code) + ")";
    return false;
}

}  // namespace

std::string usageText() {
    return "usage: orv_report RESULTS_DIR [-o REPORT_DIR] [options]\n"
           "Reads the result files that orv_cmd wrote into RESULTS_DIR (flat or -bin layout)\n"
           "and writes index.html, one page per session and report.json into REPORT_DIR\n"
           "(default RESULTS_DIR/report).\n"
           "  -o DIR                  where the report goes\n"
           "  --min-coverage PERCENT  periods covered less are flagged (default 75)\n"
           "  --battery-low VOLTS     battery readings below are flagged (default 11.5)\n"
           "  --temperature LOW HIGH  temperatures outside are flagged (default -10 50)\n"
           "  --audio-tolerance DB    audio and logger hourly Leq may differ this much (default "
           "1)\n"
           "  --help                  this text\n";
}

ParsedArgs parseArgs(const std::vector<std::string>& args) {
    ParsedArgs r;
    Options& o = r.options;
    Thresholds& t = o.thresholds;
    for (std::size_t i = 0; i < args.size() && r.error.empty(); ++i) {
        const std::string& a = args[i];
        const auto value = [&](double& out, double lo, double hi) {
            if (i + 1 >= args.size() || !parseNumber(args[i + 1], out) || out < lo || out > hi)
                r.error = "bad or missing value for " + a;
            ++i;
        };
        if (a == "--help" || a == "-h")
            r.help = true;
        else if (a == "-o" && i + 1 < args.size())
            o.reportDir = args[++i];
        else if (a == "--min-coverage")
            value(t.minCoverage, 0, 100);
        else if (a == "--battery-low")
            value(t.batteryLow, 0, 100);
        else if (a == "--temperature") {
            value(t.temperatureLow, -100, 100);
            if (r.error.empty()) value(t.temperatureHigh, t.temperatureLow, 100);
        } else if (a == "--audio-tolerance")
            value(t.audioTolerance, 0, 100);
        else if (!a.empty() && a[0] != '-' && o.resultsDir.empty())
            o.resultsDir = a;
        else
            r.error = a == "-o" ? "-o needs a directory" : "unknown argument " + a;
    }
    if (r.error.empty() && !r.help && o.resultsDir.empty()) r.error = "no results directory given";
    return r;
}

Outcome writeReport(const Options& options, Report* out) {
    Outcome result;
    if (!platform::isDirectory(options.resultsDir)) {
        result.error = options.resultsDir + " is not a directory";
        return result;
    }
    result.reportDir = options.reportDir.empty() ? platform::joinPath(options.resultsDir, "report")
                                                 : options.reportDir;
    if (platform::makeDirectory(result.reportDir) == platform::MakeDirResult::Failed) {
        result.error = "cannot create the report directory " + result.reportDir;
        return result;
    }
    Report report;
    report.resultsDir = options.resultsDir;
    report.thresholds = options.thresholds;
    std::vector<Problem> problems;
    Catalogue cat = findSessions(options.resultsDir, result.reportDir, problems);
    for (const Problem& p : problems) report.problems.push_back(describe(p));
    report.unusedFiles = cat.unusedFiles;
    for (SessionFiles& s : cat.sessions) {
        std::vector<Problem> sessionProblems;
        readSessionRows(s, sessionProblems);
        report.sessions.push_back(analyseSession(s, options.thresholds, sessionProblems));
        for (const Problem& p : sessionProblems) problems.push_back(p);
        s = SessionFiles{};  // the rows are no longer needed
    }
    for (const Problem& p : problems) result.problems.push_back(describe(p));
    result.sessions = report.sessions.size();

    // Each page is written even when another cannot be.
    bool ok = true;
    for (const SessionReport& s : report.sessions)
        ok &= writeText(platform::joinPath(result.reportDir, s.id + ".html"),
                        sessionPage(s, report), result.error);
    ok &= writeText(platform::joinPath(result.reportDir, "report.json"), reportJson(report),
                    result.error);
    ok &= writeText(platform::joinPath(result.reportDir, "index.html"), indexPage(report),
                    result.error);
    result.written = ok;
    if (out) *out = std::move(report);
    return result;
}

}  // namespace orv_report
