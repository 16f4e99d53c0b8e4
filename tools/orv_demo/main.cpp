// orv_demo: writes a demo logger session (see demo_options.cpp for the command line).
#include <chrono>
#include <cstdio>
#include <exception>
#include <string>
#include <vector>

#include "demo_options.h"
#include "demo_session.h"

int main(int argc, char** argv) {
    const std::vector<std::string> args(argv + 1, argv + argc);
    const orv_demo::ParsedCommandLine cl = orv_demo::parseCommandLine(args);
    if (cl.help) {
        std::fputs(orv_demo::usageText().c_str(), stdout);
        return 0;
    }
    if (!cl.error.empty()) {
        std::fprintf(stderr, "orv_demo: %s\n%s", cl.error.c_str(), orv_demo::usageText().c_str());
        return 2;
    }
    const auto began = std::chrono::steady_clock::now();
    try {
        const orv_demo::DemoSummary s = orv_demo::generateDemoSession(cl.options);
        const double seconds =
            std::chrono::duration<double>(std::chrono::steady_clock::now() - began).count();
        std::size_t waveFiles = 0;
        for (const orv_demo::Recording& r : s.plan.recordings) waveFiles += r.parts.size();
        std::printf(
            "Session %s: %lld records of 100 ms in %zu level file(s), %zu wave file(s) "
            "with %lld s of audio, %zu pass-by(s), %lld overloaded record(s); %.2f s\n",
            s.plan.sessionDir.c_str(), static_cast<long long>(s.plan.recordCount),
            s.levelFiles.size(), waveFiles, static_cast<long long>(s.audioSeconds), s.passBys,
            static_cast<long long>(s.overloadedRecords), seconds);
    } catch (const std::exception& e) {
        std::fprintf(stderr, "orv_demo: %s\n", e.what());
        return 1;
    }
    return 0;
}
