// Builders of logger sessions on disk for tests: information files, level data files in the
// logger's hourly layout, and whole session trees.
#pragma once

#include <cstddef>
#include <cstdint>
#include <functional>
#include <string>
#include <vector>

namespace testing_support {

// The settings of an information file. Empty strings leave their line out.
struct InfoFields {
    std::string sessionName = "Session1";
    std::string sessionStart = "17/09/2020 08:00:00";
    std::string sessionEnd = "17/09/2020 10:00:00";
    std::string timeWeighting = "125";  // TWEIGHT: 125 (Fast) or seconds
    std::string calibration = "94.0";
    std::string rangeMultiplier = "1.0";
    std::string trigSetting = "OFF";
    std::string trigPreRecLength;
};

struct LevelFileHeader {
    std::string sessionTitle = "Session1";
    std::string serialNumber = "S/N 4711";
    unsigned day = 17, month = 9, year = 2020, hour = 8;
    float temperature = 21.5F;
};

// One 100 ms row; the defaults are a quiet, healthy record.
struct LevelRow {
    unsigned minute = 0, second = 0, tenth = 0;
    float splA = 45.2F, splC = 58.7F, leqA = 44.9F, leqC = 58.1F;
    unsigned condition = 0;
    float battery = 12.6F;
};

// `count` rows from the 100 ms slot `firstSlot` of the hour on (slot 0 is 0:0.0, slot 35999
// is 59:59.9); `fill`, when given, sets the levels of each row from its slot.
std::vector<LevelRow> makeRows(std::size_t count, std::size_t firstSlot = 0,
                               const std::function<void(std::size_t slot, LevelRow&)>& fill = {});
// A whole hour: 36,000 rows from 0:0.0 to 59:59.9.
std::vector<LevelRow> makeHour(const std::function<void(std::size_t slot, LevelRow&)>& fill = {});

// The file text in the logger's hourly layout (six header lines, then one row per record,
// every line ending in CR LF).
std::string levelFileText(const LevelFileHeader& header, const std::vector<LevelRow>& rows);

struct LevelFileLayout {
    std::string dataDir = "data.000";
    std::string name;  // empty: the logger's name for the header's hour, yyyymmdd_hh.csv
    LevelFileHeader header;
    std::vector<LevelRow> rows = makeRows(10);
};

// A session directory. Written by writeSession as dir/<infName> ("KEY: value" lines with CR LF
// ends, in the order of InfoFields), dir/<dataDir>/<level file> and an empty file for every
// wave file path.
struct SessionLayout {
    bool writeInfo = true;
    std::string infName;  // empty: "<last part of dir>.inf"
    InfoFields info;
    std::vector<LevelFileLayout> levelFiles = {LevelFileLayout{}};
    std::vector<std::string> waveFiles;  // paths relative to the session, e.g. data.000/x.wav
    std::vector<std::string> extraDirs;  // empty directories, relative to the session
};

// A session named `name`: its information file names it, its level files carry it as title.
SessionLayout namedSession(const std::string& name);

// Writes the session into `dir` (created as needed) and returns `dir`.
std::string writeSession(const std::string& dir, const SessionLayout& layout);

}  // namespace testing_support
