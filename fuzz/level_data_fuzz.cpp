// A level data file as the session run takes it: header checks and record decoding, then
// every record through the continuity check, the short Leq and the general statistics,
// with both result files written. No level may come out as inf or nan.
#include <cstddef>
#include <cstdint>
#include <string>
#include <vector>

#include "config/settings.h"
#include "fuzz_support.h"
#include "input/input_file.h"
#include "platform/console.h"
#include "platform/files.h"
#include "processing/record_statistics.h"
#include "results/general_results.h"
#include "results/leq_results.h"
#include "sessions/search_paths.h"
#include "sessions/session_record.h"

namespace {

std::string readBack(const std::string& path) {
    std::vector<char> bytes;
    platform::readRegularFile(path, bytes, 64 << 20);
    return {bytes.begin(), bytes.end()};
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
    const std::vector<char> bytes(data, data + size);
    std::string console;
    platform::Console out(&console);
    orv::DataFileHeader header;
    orv::LevelRecordQueue records;
    const orv::LevelFileLoad load =
        orv::decodeLevelDataFile("level.csv", bytes, header, records, out);
    FUZZ_CHECK(load != orv::LevelFileLoad::Skipped);
    FUZZ_CHECK(load == orv::LevelFileLoad::Loaded || records.empty());
    for (const orv::LevelRecord& r : records.records) {
        for (const float level : {r.splA, r.splC, r.leqA, r.leqC})
            FUZZ_CHECK(level >= 0.0F && level <= orv::kMaxLevelDb);
        FUZZ_CHECK(r.battery - r.battery == 0.0F);  // finite
    }

    // Short intervals, so that a small input closes some; the first byte picks the weighting.
    orv::ProcessingSettings settings;
    orv::SearchPathList paths;
    orv::SessionTable table;
    std::string startup;
    platform::Console quiet(&startup);
    orv::initDefaults(settings, paths, table, 0, quiet);
    settings.statsIntervalMin = 1;
    settings.leqInterval = 1;
    settings.generalWeighting = size > 0 && (data[0] & 1) != 0 ? 2 : 1;
    orv::RunResults run(out);
    orv::GeneralResultsWriter general(run);
    orv::LeqResultsWriter leq(run);
    const std::string dir = fuzz::scratchDirectory();
    FUZZ_CHECK(general.open(dir + "/general.csv"));
    FUZZ_CHECK(leq.open(orv::LeqFileKind::AllPass, dir + "/leq.csv"));
    {
        orv::RecordStatistics statistics(settings, false, general, &leq);
        for (const orv::LevelRecord& r : records.records) {
            statistics.sequenceCheck(r, header);
            statistics.stepShortLeq(r, header);
            if (!statistics.stepGeneralStatistics(r, header)) break;
            statistics.takeDispatchRequest();
        }
        statistics.finishSession();
    }
    general.close();
    leq.close(orv::LeqFileKind::AllPass);
    FUZZ_CHECK(!run.lost());
    for (const char* name : {"/general.csv", "/leq.csv"}) {
        const std::string text = readBack(dir + name);
        FUZZ_CHECK(text.find("inf") == std::string::npos && text.find("nan") == std::string::npos);
    }
    return 0;
}
