#include "sessions/session_info.h"

#include <algorithm>
#include <cstdint>
#include <vector>

#include "input/input_file.h"
#include "platform/directory.h"
#include "platform/error_text.h"
#include "platform/files.h"
#include "sessions/decimal_number.h"

namespace orv {
namespace {

char upper(char c) { return (c >= 'a' && c <= 'z') ? static_cast<char>(c - 'a' + 'A') : c; }

// True when `text` begins with `prefix`, ignoring ASCII case.
bool startsWithNoCase(std::string_view text, std::string_view prefix) {
    if (text.size() < prefix.size()) return false;
    for (std::size_t i = 0; i < prefix.size(); ++i) {
        if (upper(text[i]) != upper(prefix[i])) return false;
    }
    return true;
}

enum class InfoKey {
    SessionStart,
    SessionEnd,
    TimeWeighting,
    SessionName,
    Calibration,
    RangeMultiplier,
    TrigSetting,
    TrigPreRecordLength,
    TrigType,
    None,
};

struct KeyName {
    std::string_view text;
    InfoKey key;
};

// Tested in this order; a key matches when the line's key begins with it.
// clang-format off
constexpr KeyName kKeys[] = {
    {"SESSION START", InfoKey::SessionStart},
    {"SESSION END", InfoKey::SessionEnd},
    {"TWEIGHT", InfoKey::TimeWeighting},
    {"SESSION NAME", InfoKey::SessionName},
    {"CALIBRATION", InfoKey::Calibration},
    {"RANGE MULTIPLIER", InfoKey::RangeMultiplier},
    {"TRIG SETTING", InfoKey::TrigSetting},
    {"TRIG PRE REC LENGTH", InfoKey::TrigPreRecordLength},
    {"TRIG TYPE", InfoKey::TrigType},
};
// clang-format on

InfoKey matchKey(std::string_view key) {
    for (const KeyName& k : kKeys) {
        if (startsWithNoCase(key, k.text)) return k.key;
    }
    return InfoKey::None;
}

// Numbers of a line are found from its second character on, so that a sign or point in
// front of them is passed over.
const char* firstDigitAfterFirstChar(std::string_view line) {
    const char* const limit = line.data() + line.size();
    const char* p = line.empty() ? limit : line.data() + 1;
    while (p < limit && !isDecimalDigit(*p)) ++p;
    return p;
}

std::uint32_t lineWholeNumber(std::string_view line) {
    std::uint32_t value = 0;
    parseDigitRun(firstDigitAfterFirstChar(line), line.data() + line.size(), value);
    return value;
}

float lineDecimalNumber(std::string_view line) {
    const char* end = nullptr;
    return parseDecimalFloat(firstDigitAfterFirstChar(line), line.data() + line.size(), &end);
}

struct InfoReadState {
    bool keyTooLong = false;
    bool trigTypeIsTime = false;  // later TRIG PRE REC LENGTH lines are ignored
};

void handleLine(std::string_view line, SessionRecord& record, InfoReadState& state) {
    const std::size_t keyLength = std::min(line.find_first_of(":\r\n"), line.size());
    if (keyLength > kMaxInfoKeyLength) {
        state.keyTooLong = true;
        return;
    }
    switch (matchKey(line.substr(0, keyLength))) {
        case InfoKey::SessionStart:
            parseDateTime(line, record.sessionStart);
            break;
        case InfoKey::SessionEnd:
            parseDateTime(line, record.sessionEnd);
            break;
        case InfoKey::TimeWeighting: {
            const std::uint32_t n = lineWholeNumber(line);
            record.timeWeightingMs = n == 125 ? 125 : n * 1000U;
            break;
        }
        case InfoKey::SessionName: {
            std::string name = copyLineValue(line);
            name.erase(std::min(name.find('\n'), name.size()));
            if (name.size() > SessionRecord::kMaxNameLength) {
                name.resize(SessionRecord::kMaxNameLength);
            }
            record.sessionName = std::move(name);
            break;
        }
        case InfoKey::Calibration:
            record.calibration = lineDecimalNumber(line);
            break;
        case InfoKey::RangeMultiplier:
            record.rangeMultiplier = lineDecimalNumber(line);
            break;
        case InfoKey::TrigSetting:
            record.triggerOn = startsWithNoCase(copyLineValue(line), "ON") ? 1 : 0;
            break;
        case InfoKey::TrigPreRecordLength:
            if (!state.trigTypeIsTime) record.triggerPreRecordLength = lineWholeNumber(line);
            break;
        case InfoKey::TrigType:
            // Time-triggered sessions record no lead-in before the trigger.
            if (startsWithNoCase(copyLineValue(line), "Time")) {
                record.triggerPreRecordLength = 0;
                state.trigTypeIsTime = true;
            }
            break;
        case InfoKey::None:
            break;
    }
}

}  // namespace

void parseDateTime(std::string_view line, platform::SystemTime& time) {
    const char* p = line.data();
    const char* const limit = p + line.size();
    while (p < limit && !isDecimalDigit(*p)) ++p;
    std::uint16_t* const fields[] = {&time.day,  &time.month,  &time.year,
                                     &time.hour, &time.minute, &time.second};
    for (std::uint16_t* field : fields) {
        std::uint32_t value = 0;
        p = parseDigitRun(p, limit, value);
        *field = static_cast<std::uint16_t>(value);
        // One separator of any kind ('/', ':', ' ', '-', ...) follows each number.
        if (p < limit) ++p;
    }
}

std::string copyLineValue(std::string_view line) {
    if (line.size() < 2) return {};
    const std::size_t colon = line.find(':', 1);
    if (colon == std::string_view::npos || colon + 2 > line.size()) return {};
    return std::string(line.substr(colon + 2));
}

bool parseSessionInfoText(std::string_view text, SessionRecord& record, std::size_t* firstBadLine) {
    InfoReadState state;
    std::size_t lineNumber = 1;
    std::size_t lf = text.find('\n');  // the end of the current line; searched once per line
    for (std::size_t pos = 0; pos < text.size();) {
        const std::size_t lineEnd = lf == std::string_view::npos ? text.size() : lf + 1;
        const std::size_t length = std::min(kInfoLinePiece, lineEnd - pos);
        std::string_view line = text.substr(pos, length);
        pos += length;
        // A NUL byte ends the text of its line, as it ends a C string.
        line = line.substr(0, line.find('\0'));
        const bool wasTooLong = state.keyTooLong;
        handleLine(line, record, state);
        if (!wasTooLong && state.keyTooLong && firstBadLine != nullptr) *firstBadLine = lineNumber;
        if (pos == lineEnd && lf != std::string_view::npos) {
            ++lineNumber;
            lf = text.find('\n', pos);
        }
    }
    return !state.keyTooLong;
}

bool readSessionInfoFile(SessionRecord& record, platform::Console& out) {
    std::vector<platform::DirEntry> entries;
    if (!platform::listDirectory(record.sessionPath, "*.inf", entries)) return false;
    const auto file = std::find_if(entries.begin(), entries.end(),
                                   [](const platform::DirEntry& e) { return !e.isDirectory; });
    if (file == entries.end()) return false;
    const std::string path = platform::joinPath(record.sessionPath, file->name);
    std::string text;
    int error = 0;
    const platform::ReadResult read = platform::readTextFile(path, text, kMaxInputFileSize, &error);
    if (read != platform::ReadResult::Ok) {
        if (!reportRefusedFile(read, path, out)) {
            out.print("Error opening session INF file - %s\r\n",
                      platform::errorText(error).c_str());
        }
        return false;
    }
    std::size_t badLine = 0;
    if (!parseSessionInfoText(text, record, &badLine)) {
        out.print("ERR: %s line %zu: key longer than %zu characters - session not added\r\n",
                  path.c_str(), badLine, kMaxInfoKeyLength);
        return false;
    }
    return true;
}

}  // namespace orv
