#include "input/level_data.h"

#include <algorithm>
#include <cmath>

#include "sessions/decimal_number.h"

// Level data is parsed in place, left to right, in the buffer that holds the whole file:
// every reader below takes a position and the end of the data and never looks past it.

namespace orv {
namespace {

inline bool isLineEnd(char c) { return c == '\r' || c == '\n'; }

// The first line end at or after `p`, or `end`.
inline const char* findLineEnd(const char* p, const char* end) {
    while (p < end && !isLineEnd(*p)) ++p;
    return p;
}

// Moves `p` (on a line end, or at `end`) past one line end: CR LF, LF or CR.
inline const char* skipLineEnd(const char* p, const char* end) {
    if (p == end) return p;
    if (*p == '\n') return p + 1;
    if (*p != '\r') return p;
    ++p;
    return p < end && *p == '\n' ? p + 1 : p;
}

// Moves `pos` past the first comma of its line and the blanks and commas after it. False
// when the line has no comma or fewer than two bytes of data follow it.
bool skipToValue(const char*& pos, const char* end) {
    const char* p = pos;
    while (p < end && *p != ',' && !isLineEnd(*p)) ++p;
    if (p == end || *p != ',') return false;
    ++p;
    if (end - p < 2) return false;
    while (p < end && (*p == ' ' || *p == '\t' || *p == ',')) ++p;
    pos = p;
    return true;
}

bool skipPastLineEnd(const char*& pos, const char* end) {
    const char* p = findLineEnd(pos, end);
    if (p == end) return false;
    pos = skipLineEnd(p, end);
    return true;
}

// A run of digits (an empty run reads as 0) whose value fits 16 bits; `pos` is left after it.
// False when the value is larger.
inline bool readSmallNumber(const char*& pos, const char* end, std::uint32_t& value) {
    constexpr std::uint32_t kTooLarge = 0x10000;
    std::uint32_t acc = 0;
    const char* p = pos;
    while (p < end && isDecimalDigit(*p)) {
        acc = std::min(acc * 10U + static_cast<std::uint32_t>(*p - '0'), kTooLarge);
        ++p;
    }
    value = acc;
    pos = p;
    return acc < kTooLarge;
}

// A run of digits that must be followed by `separator`; a minus sign at its start or end
// (a negative or run-together number), a value beyond 16 bits or any other separator makes
// it malformed. On success `pos` is left after the separator.
inline bool readField(const char*& pos, const char* end, char separator, std::uint32_t& value) {
    if (!readSmallNumber(pos, end, value) || pos == end || *pos != separator) return false;
    ++pos;
    return true;
}

// A header number: a run of digits that fits 16 bits, not run into a minus sign. `pos` is
// left after it.
bool readHeaderNumber(const char*& pos, const char* end, std::uint16_t& out) {
    std::uint32_t value = 0;
    const char* p = pos;
    if (!readSmallNumber(p, end, value) || (p < end && *p == '-')) return false;
    out = static_cast<std::uint16_t>(value);
    pos = p;
    return true;
}

// Steps over the one separator after a date number; it must not be the line's end.
bool skipDateSeparator(const char*& pos, const char* end) {
    if (pos == end || isLineEnd(*pos)) return false;
    ++pos;
    return true;
}

// A level: a decimal number up to kMaxLevelDb followed by a comma. Negative levels are
// stored as 0.0 (so is -0.0, which would otherwise print as "-0.0").
inline bool readLevel(const char*& pos, const char* end, float& level) {
    const char* p = nullptr;
    const float value = parseDecimalFloat(pos, end, &p);
    if (p == nullptr || p == end || *p != ',' || value > kMaxLevelDb) return false;
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
    // while writing) may end in a partial number. A run of digits too long for a float
    // reads as infinity, which no reading can be.
    const char* p = nullptr;
    r.battery = parseDecimalFloat(pos, end, &p);
    if (p == nullptr || p == end || !isLineEnd(*p) || !std::isfinite(r.battery)) return false;
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
    const char* p = pos;
    const auto room = static_cast<std::ptrdiff_t>(size - 1);  // the terminator takes one byte
    while (p < end && !isLineEnd(*p) && *p != ',' && p - pos < room) ++p;
    dest.assign(pos, p);
    pos = p;
    return skipPastLineEnd(pos, end);
}

bool parseHeaderDate(const char*& pos, const char* end, DataFileHeader& header) {
    return skipToValue(pos, end) && readHeaderNumber(pos, end, header.day) &&
           skipDateSeparator(pos, end) && readHeaderNumber(pos, end, header.month) &&
           skipDateSeparator(pos, end) && readHeaderNumber(pos, end, header.year) &&
           skipPastLineEnd(pos, end);
}

bool parseHeaderLines(const char* data, std::size_t length, DataFileHeader& header,
                      std::size_t& afterHeader) {
    if (data == nullptr) return false;
    const char* p = data;
    const char* const end = data + length;
    if (!extractHeaderField(p, end, header.sessionTitle, DataFileHeader::kSessionTitleSize) ||
        !extractHeaderField(p, end, header.serialNumber, DataFileHeader::kSerialNumberSize) ||
        !parseHeaderDate(p, end, header)) {
        return false;
    }
    if (!skipToValue(p, end) || !readHeaderNumber(p, end, header.hour) ||
        !skipPastLineEnd(p, end)) {
        return false;
    }
    if (!skipToValue(p, end)) return false;
    const char* numberEnd = nullptr;
    header.temperature = parseDecimalFloat(p, end, &numberEnd);
    if (numberEnd == nullptr || !std::isfinite(header.temperature)) return false;
    p = numberEnd;
    // The rest of line 5, then line 6 (the column titles, not read).
    if (!skipPastLineEnd(p, end) || !skipPastLineEnd(p, end)) return false;
    afterHeader = static_cast<std::size_t>(p - data);
    return true;
}

bool parseDataFileHeader(const char* data, std::size_t length, DataFileHeader& header,
                         std::size_t& firstRecord) {
    std::size_t after = 0;
    if (!parseHeaderLines(data, length, header, after) || after == length) return false;
    firstRecord = after;
    return true;
}

DecodeReport decodeLevelRecords(const char* data, std::size_t length, LevelRecordQueue& queue) {
    queue.clear();
    DecodeReport report;
    if (data == nullptr) return report;
    const char* p = data;
    const char* const end = data + length;
    for (std::size_t line = 1; p < end; ++line) {
        if (!isLineEnd(*p)) {
            LevelRecord record;
            const char* q = p;
            if (decodeRecord(q, end, record)) {
                queue.records.push_back(record);
                p = q;
            } else {
                if (report.badLines++ == 0) report.firstBadLine = line;
                p = findLineEnd(p, end);
            }
        }
        p = skipLineEnd(p, end);
    }
    return report;
}

}  // namespace orv
