// Hourly raw level files: the 100 ms levels computed from the audio, one file per hour in the
// layout of the logger's own level data files, so that the level file reader reads them.
#pragma once

#include <cstdint>
#include <set>
#include <string>
#include <vector>

#include "input/level_data.h"
#include "platform/civil_time.h"
#include "results/result_files.h"

namespace orv {

// One 100 ms period of audio.
struct RawLevelRecord {
    platform::SystemTime time;  // of the level record: date, hour, minute, second, tenth x 100 ms
    float splA = 0.0F;          // dB: F-time-weighted level at the end of the period
    float leqA = 0.0F;          // dB: the period's equivalent level
    float splC = 0.0F;
    float leqC = 0.0F;
    std::uint32_t condition = 0;  // 3 overload, 1 other gain range, else 0
    float battery = 0.0F;
};

class HourlyRawFiles {
public:
    // `directory` ends with the path separator. `written` holds the paths written so far in
    // the run: a name already used gets "_1", "_2", ... before ".csv", so no session's hour
    // replaces another's.
    HourlyRawFiles(std::string directory, std::set<std::string>& written, RunResults& run)
        : directory_(std::move(directory)), written_(written), run_(run) {}

    // Writes one hour's file: the header of the hour's level data file, then the records.
    bool write(const DataFileHeader& header, const std::vector<RawLevelRecord>& records);

    static std::string fileName(const DataFileHeader& header);  // YYYYMMDD_HH.csv
    static std::string fileText(const DataFileHeader& header,
                                const std::vector<RawLevelRecord>& records);

private:
    std::string directory_;
    std::set<std::string>& written_;
    RunResults& run_;
};

}  // namespace orv
