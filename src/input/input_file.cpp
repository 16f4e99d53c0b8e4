#include "input/input_file.h"

#include <new>

#include "platform/civil_time.h"
#include "platform/error_text.h"

namespace orv {

bool reportRefusedFile(platform::ReadResult result, const std::string& path,
                       platform::Console& out) {
    switch (result) {
        case platform::ReadResult::NotRegular:
            out.print("ERR: %s is not a regular file - skipped\r\n", path.c_str());
            return true;
        case platform::ReadResult::TooLarge:
            out.print("ERR: %s is larger than %u MiB - skipped\r\n", path.c_str(),
                      static_cast<unsigned>(kMaxInputFileSize >> 20));
            return true;
        case platform::ReadResult::NoMemory:
            out.print("ERR: Not enough memory to read %s - skipped\r\n", path.c_str());
            return true;
        default:
            return false;
    }
}

namespace {

bool isCalendarHour(const DataFileHeader& h) {
    platform::SystemTime t;
    t.year = h.year;
    t.month = h.month;
    t.day = h.day;
    t.hour = h.hour;
    platform::FileTime unused = 0;
    return platform::systemTimeToFileTime(t, unused);
}

}  // namespace

LevelFileLoad decodeLevelDataFile(const std::string& path, const std::vector<char>& bytes,
                                  DataFileHeader& header, LevelRecordQueue& records,
                                  platform::Console& out) {
    if (bytes.empty()) {
        out.print("ERR: %s is empty - skipped\r\n", path.c_str());
        return LevelFileLoad::NoRecords;
    }
    std::size_t first = 0;
    if (!parseHeaderLines(bytes.data(), bytes.size(), header, first)) {
        out.print("ERR: %s has a cut or malformed header - skipped\r\n", path.c_str());
        return LevelFileLoad::NoRecords;
    }
    if (!isCalendarHour(header)) {
        out.print(
            "ERR: %s has an invalid date or hour in its header (%02u/%02u/%04u %02u) - "
            "skipped\r\n",
            path.c_str(), header.day, header.month, header.year, header.hour);
        return LevelFileLoad::NoRecords;
    }
    const DecodeReport report =
        decodeLevelRecords(bytes.data() + first, bytes.size() - first, records);
    if (report.badLines != 0) {
        // The six header lines come first.
        out.print("ERR: %s has malformed records - first at line %zu, %zu line(s) skipped\r\n",
                  path.c_str(), report.firstBadLine + 6, report.badLines);
    }
    return LevelFileLoad::Loaded;
}

LevelFileLoad loadLevelDataFile(const std::string& path, std::vector<char>& bytes,
                                DataFileHeader& header, LevelRecordQueue& records,
                                platform::Console& out) {
    records.clear();
    header = DataFileHeader{};
    int error = 0;
    const platform::ReadResult read =
        platform::readRegularFile(path, bytes, kMaxInputFileSize, &error);
    if (read != platform::ReadResult::Ok) {
        if (!reportRefusedFile(read, path, out)) {
            out.print("ERR: Unable to read %s : %s\r\n", path.c_str(),
                      platform::errorText(error).c_str());
        }
        return LevelFileLoad::Skipped;
    }
    LevelFileLoad load = LevelFileLoad::NoRecords;
    try {
        load = decodeLevelDataFile(path, bytes, header, records, out);
    } catch (const std::bad_alloc&) {
        // The records of a file too large for memory; the run goes on with the next file.
        records.clear();
        out.print("ERR: Not enough memory to read %s - skipped\r\n", path.c_str());
        return LevelFileLoad::Skipped;
    }
    if (load == LevelFileLoad::NoRecords) header = DataFileHeader{};
    return load;
}

}  // namespace orv
