// Level data files: the logger's hourly text files of 100 ms records, and their decoding.
#pragma once

#include <cstddef>
#include <cstdint>
#include <string>
#include <vector>

namespace orv {

// The six header lines of one level data file.
struct DataFileHeader {
    static constexpr std::size_t kSerialNumberSize = 26;  // buffer size, terminator included
    static constexpr std::size_t kSessionTitleSize = 100;

    std::uint16_t day = 0;
    std::uint16_t month = 0;
    std::uint16_t year = 0;
    std::uint16_t hour = 0;
    std::string serialNumber;  // at most kSerialNumberSize - 1 characters
    std::string sessionTitle;  // at most kSessionTitleSize - 1 characters
    float temperature = 0.0F;
};

// One 100 ms record.
struct LevelRecord {
    std::uint16_t minute = 0;
    std::uint16_t second = 0;
    std::uint16_t tenth = 0;  // 0..9
    std::uint16_t spare = 0;
    float splA = 0.0F;  // dB; negative values are stored as 0.0
    float splC = 0.0F;
    float leqA = 0.0F;
    float leqC = 0.0F;
    float battery = 0.0F;         // as written
    std::uint32_t status = 0;     // 1 when the signal condition is 3 (overload)
    std::uint32_t cond2Mark = 0;  // 1 when the signal condition is 2 (other gain range)
};

// The records of one file, in file order. Emptied (capacity kept) for every file.
struct LevelRecordQueue {
    std::vector<LevelRecord> records;

    void clear() { records.clear(); }
    bool empty() const { return records.empty(); }
    std::size_t size() const { return records.size(); }
};

// The highest level a record may carry (dB); a record with a higher level is malformed.
inline constexpr float kMaxLevelDb = 250.0F;

// Lines end with CR LF, LF or CR alike.
//
// Fills `header` from the six header lines of `data` and sets `afterHeader` to the offset of
// line 7, which may be the end of the data. False when the header is not well formed.
bool parseHeaderLines(const char* data, std::size_t length, DataFileHeader& header,
                      std::size_t& afterHeader);
// parseHeaderLines, and at least one byte must follow the header: `firstRecord` is its offset.
bool parseDataFileHeader(const char* data, std::size_t length, DataFileHeader& header,
                         std::size_t& firstRecord);

// What decoding left out: malformed lines, counted from line 1 at the start of the data.
struct DecodeReport {
    std::size_t firstBadLine = 0;  // 0 when every line was well formed
    std::size_t badLines = 0;
};

// Replaces the queue's contents with the records in data[0, length), in file order. A
// malformed line (a field that is not well formed, a level above kMaxLevelDb, a number that
// does not fit its field, a line cut short) is left out on its own and decoding goes on at
// the next line; empty lines are passed over.
DecodeReport decodeLevelRecords(const char* data, std::size_t length, LevelRecordQueue& queue);

// The steps of the header parse, each reading one line from `pos` (bounded by `end`) and
// leaving `pos` at the start of the next line; false when the line is not well formed.
//
// Header lines 1 and 2: the text after the line's first comma and any blanks and commas,
// up to the line end, a comma or `size` - 1 characters.
bool extractHeaderField(const char*& pos, const char* end, std::string& dest, std::size_t size);
// Header line 3: day, month and year, each number followed by one separator.
bool parseHeaderDate(const char*& pos, const char* end, DataFileHeader& header);

}  // namespace orv
