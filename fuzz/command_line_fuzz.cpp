// The command line: any list of arguments (the input split at NUL bytes). A line that is
// accepted must leave settings the rest of the run can rely on.
#include <unistd.h>

#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <string>
#include <vector>

#include "config/command_line.h"
#include "config/settings.h"
#include "fuzz_support.h"
#include "platform/console.h"
#include "sessions/search_paths.h"
#include "sessions/session_record.h"

namespace {

bool oneOf(std::uint32_t v, std::initializer_list<std::uint32_t> values) {
    return std::find(values.begin(), values.end(), v) != values.end();
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
    // -d creates its directory: run in the scratch directory, and keep every argument free
    // of '/', so that nothing can be created anywhere else.
    static const bool inScratch = ::chdir(fuzz::scratchDirectory().c_str()) == 0;
    FUZZ_CHECK(inScratch);
    std::vector<std::string> args{"orv_cmd"};
    std::string arg;
    for (std::size_t i = 0; i <= size && args.size() < 64; ++i) {
        if (i == size || data[i] == 0) {
            args.push_back(arg);
            arg.clear();
        } else {
            arg.push_back(data[i] == '/' ? '_' : static_cast<char>(data[i]));
        }
    }
    std::vector<const char*> argv;
    for (const std::string& a : args) argv.push_back(a.c_str());

    orv::ProcessingSettings s;
    orv::SearchPathList paths;
    orv::SessionTable table;
    std::string console;
    platform::Console out(&console);
    FUZZ_CHECK(orv::initDefaults(s, paths, table, 0, out) == 1);
    const int ok = orv::parseCommandLine(static_cast<int>(argv.size()), argv.data(), s, paths, out);
    if (ok != 0) {
        FUZZ_CHECK(oneOf(s.statsIntervalMin, {0, 1, 2, 3, 4, 5, 10, 15, 20, 30}));
        FUZZ_CHECK(oneOf(s.leqInterval, {0, 1, 2, 4, 10, 20, 30, 99}));
        FUZZ_CHECK(oneOf(s.generalWeighting, {1, 2}));
        FUZZ_CHECK(oneOf(s.octaveBandCount, {0, 12, 36}));
        FUZZ_CHECK(oneOf(s.auxFilterType, {0, 1, 2, 3, 4, 6}));
        FUZZ_CHECK(!s.percentiles.empty() &&
                   std::is_sorted(s.percentiles.begin(), s.percentiles.end()));
        FUZZ_CHECK(!paths.paths.empty() && paths.paths.size() == paths.comparable.size());
        FUZZ_CHECK(s.outputDirValid == 1);
        FUZZ_CHECK(s.outputDir.empty() || s.outputDir.back() == '/');
    }
    orv::releaseLists(s, paths, table);
    fuzz::emptyDirectory(fuzz::scratchDirectory());
    return 0;
}
