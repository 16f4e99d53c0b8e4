// The files of a logger session in the logger's own layouts: the information file, the
// hourly level data files and the names of its wave files.
#pragma once

#include <cstdint>
#include <string>
#include <vector>

#include "civil_time.h"

namespace orv_demo {

struct SessionInfo {
    std::string name;
    CivilTime start, end;
    std::string calibration;  // as written, e.g. "20.00"
    bool triggered = false;
    unsigned preRecordSeconds = 0;
};

// "KEY: value" lines ending in CR LF; dates as dd/mm/yyyy hh:mm:ss.
std::string infoFileText(const SessionInfo& info);

// The value a reader of the information file takes from a decimal text: digits
// accumulated in single precision, as the logger's tools read it.
float readDecimalAsLogger(const std::string& text);

// Wave file name of a recording whose name time is `t`: "YYYYMMDD_HHMMSS.wav" for the
// first file, "YYYYMMDD_HHMMSS_NNN.wav" for continuation part NNN (1, 2, ...), which sorts
// after the first file and before the next recording.
std::string waveFileName(const CivilTime& t, unsigned part);

// One 100 ms record of a level data file.
struct LevelRow {
    float splA = 0, splC = 0, leqA = 0, leqC = 0;
    unsigned condition = 0;
    float battery = 0;
};

// Writes consecutive 100 ms records into hourly files dataDir/YYYYMMDD_HH.csv, each with
// the six header lines; a file holds the records of its hour that were added.
class HourlyLevelWriter {
public:
    // firstRecordTenths: time stamp of the first record, tenths of a second since 1970.
    HourlyLevelWriter(std::string dataDir, std::string title, std::string serialNumber,
                      std::int64_t firstRecordTenths, std::uint64_t seed);
    // The next record; throws std::runtime_error when a file cannot be written.
    void add(const LevelRow& row);
    // Writes the last file.
    void finish();
    // Names of the files written, in time order.
    const std::vector<std::string>& fileNames() const { return fileNames_; }

private:
    void startHour(std::int64_t hourIndex);
    void writeHour();

    std::string dataDir_, title_, serial_;
    std::uint64_t seed_;
    std::int64_t nextTenth_;  // tenths of a second since 1970 of the next record
    std::int64_t hour_ = -1;  // hours since 1970 of the open file; -1 before the first
    std::string name_, text_;
    std::vector<std::string> fileNames_;
};

}  // namespace orv_demo
