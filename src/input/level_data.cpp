#include "input/level_data.h"

#include <cstring>

#include "sessions/decimal_number.h"

// Level data is parsed in place, left to right, in the buffer that holds the whole file:
// every reader below takes a position and the end of the data and never looks past it.

namespace orv {
namespace {

// Moves `pos` past the first comma of its line and the blanks and commas after it. False
// when the line has no comma or fewer than two bytes of data follow it.
bool skipToValue(const char*& pos, const char* end) {
    const char* p = pos;
    while (p < end && *p != ',' && *p != '\n') ++p;
    if (p == end || *p != ',') return false;
    ++p;
    if (end - p < 2) return false;
    while (p < end && (*p == ' ' || *p == '\t' || *p == ',')) ++p;
    pos = p;
    return true;
}

bool skipPastLineFeed(const char*& pos, const char* end) {
    const void* lf = std::memchr(pos, '\n', static_cast<std::size_t>(end - pos));
    if (lf == nullptr) return false;
    pos = static_cast<const char*>(lf) + 1;
    return true;
}

// A run of digits that must be followed by `separator`; a minus sign at its start or end
// (a negative or run-together number) or any other separator makes it malformed.
// On success `pos` is left after the separator.
inline bool readField(const char*& pos, const char* end, char separator, std::uint32_t& value) {
    const char* p = parseDigitRun(pos, end, value);
    if (p == end || *p != separator) return false;
    pos = p + 1;
    return true;
}

// A header number: a run of digits, not run into a minus sign. `pos` is left after it.
bool readHeaderNumber(const char*& pos, const char* end, std::uint16_t& out) {
    std::uint32_t value = 0;
    const char* p = parseDigitRun(pos, end, value);
    if (p < end && *p == '-') return false;
    out = static_cast<std::uint16_t>(value);
    pos = p;
    return true;
}

// Steps over the one separator after a date number; it must not be the line's end.
bool skipDateSeparator(const char*& pos, const char* end) {
    if (pos == end || *pos == '\n') return false;
    ++pos;
    return true;
}

// A level: a decimal number followed by a comma. Negative levels are stored as 0.0 (so is
// -0.0, which would otherwise print as "-0.0").
inline bool readLevel(const char*& pos, const char* end, float& level) {
    const char* p = nullptr;
    const float value = parseDecimalFloat(pos, end, &p);
    if (p == nullptr || p == end || *p != ',') return false;
    level = value > 0.0F ? value : 0.0F;
    pos = p + 1;
    return true;
}

// One record "minute:second.tenth,splA,splC,leqA,leqC,condition,battery" and its line end.
// `pos` is left on the line end. False when any field is malformed.
inline bool decodeRecord(const char*& pos, const char* end, LevelRecord& r) {
    std::uint32_t minute = 0;
    std::uint32_t second = 0;
    std::uint32_t tenth = 0;
    std::uint32_t condition = 0;
    if (!readField(pos, end, ':', minute) || !readField(pos, end, '.', second) ||
        !readField(pos, end, ',', tenth) || !readLevel(pos, end, r.splA) ||
        !readLevel(pos, end, r.splC) || !readLevel(pos, end, r.leqA) ||
        !readLevel(pos, end, r.leqC) || !readField(pos, end, ',', condition)) {
        return false;
    }
    // The battery value needs its line end: a line cut short (a logger that lost power
    // while writing) may end in a partial number.
    const char* p = nullptr;
    r.battery = parseDecimalFloat(pos, end, &p);
    if (p == nullptr || p == end || (*p != '\r' && *p != '\n')) return false;
    pos = p;
    r.minute = static_cast<std::uint16_t>(minute);
    r.second = static_cast<std::uint16_t>(second);
    r.tenth = static_cast<std::uint16_t>(tenth);
    r.status = condition == 3 ? 1 : 0;  // overload
    r.cond2Mark = condition == 2 ? 1 : 0;
    return true;
}

}  // namespace

bool extractHeaderField(const char*& pos, const char* end, std::string& dest, std::size_t size) {
    if (size == 0 || !skipToValue(pos, end)) return false;
    const char* const start = pos;
    const char* p = pos;
    while (p < end && *p != '\n' && *p != ',' && static_cast<std::size_t>(p - start) < size) ++p;
    auto length = static_cast<std::size_t>(p - start);
    if (length > 0 && start[length - 1] == '\r') {
        --length;
    } else if (length == size) {
        --length;  // the buffer's last byte is its terminator
    }
    dest.assign(start, length);
    pos = p;
    return skipPastLineFeed(pos, end);
}

bool parseHeaderDate(const char*& pos, const char* end, DataFileHeader& header) {
    return skipToValue(pos, end) && readHeaderNumber(pos, end, header.day) &&
           skipDateSeparator(pos, end) && readHeaderNumber(pos, end, header.month) &&
           skipDateSeparator(pos, end) && readHeaderNumber(pos, end, header.year) &&
           skipPastLineFeed(pos, end);
}

bool parseDataFileHeader(const char* data, std::size_t length, DataFileHeader& header,
                         std::size_t& firstRecord) {
    if (data == nullptr) return false;
    const char* p = data;
    const char* const end = data + length;
    if (!extractHeaderField(p, end, header.sessionTitle, DataFileHeader::kSessionTitleSize) ||
        !extractHeaderField(p, end, header.serialNumber, DataFileHeader::kSerialNumberSize) ||
        !parseHeaderDate(p, end, header)) {
        return false;
    }
    if (!skipToValue(p, end) || !readHeaderNumber(p, end, header.hour) ||
        !skipPastLineFeed(p, end)) {
        return false;
    }
    if (!skipToValue(p, end)) return false;
    const char* numberEnd = nullptr;
    header.temperature = parseDecimalFloat(p, end, &numberEnd);
    if (numberEnd == nullptr) return false;
    p = numberEnd;
    // The rest of line 5, then line 6 (the column titles, not read).
    if (!skipPastLineFeed(p, end) || !skipPastLineFeed(p, end) || p == end) return false;
    firstRecord = static_cast<std::size_t>(p - data);
    return true;
}

void decodeLevelRecords(const char* data, std::size_t length, LevelRecordQueue& queue) {
    queue.clear();
    if (data == nullptr || length == 0) return;
    const char* p = data;
    const char* const end = data + length;
    if (*p == '\n') ++p;
    // A record needs at least two bytes: anything shorter cannot hold a line end.
    while (end - p > 1) {
        LevelRecord record;
        if (!decodeRecord(p, end, record)) break;
        queue.records.push_back(record);
        while (p < end && (*p == '\r' || *p == '\n')) ++p;
    }
}

}  // namespace orv
