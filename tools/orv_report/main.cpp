// orv_report: a self-contained HTML report of the sessions in an output directory of orv_cmd.
#include <chrono>
#include <cstdio>
#include <string>
#include <vector>

#include "report.h"

int main(int argc, char** argv) {
    const std::vector<std::string> args(argv + 1, argv + argc);
    const orv_report::ParsedArgs parsed = orv_report::parseArgs(args);
    if (parsed.help) {
        std::fputs(orv_report::usageText().c_str(), stdout);
        return 0;
    }
    if (!parsed.error.empty()) {
        std::fprintf(stderr, "orv_report: %s\n%s", parsed.error.c_str(),
                     orv_report::usageText().c_str());
        return 2;
    }
    const auto began = std::chrono::steady_clock::now();
    const orv_report::Outcome r = orv_report::writeReport(parsed.options);
    for (const std::string& p : r.problems) std::fprintf(stderr, "orv_report: %s\n", p.c_str());
    if (!r.written) {
        std::fprintf(stderr, "orv_report: %s\n", r.error.c_str());
        return 1;
    }
    const double seconds =
        std::chrono::duration<double>(std::chrono::steady_clock::now() - began).count();
    std::printf("%zu session(s), %zu input problem(s); %.2f s\nReport: %s/index.html\n", r.sessions,
                r.problems.size(), seconds, r.reportDir.c_str());
    return 0;
}
