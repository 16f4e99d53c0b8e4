#include "support/session_builder.h"

#include <cstdarg>
#include <cstdio>

#include "support/test_support.h"

namespace testing_support {
namespace {

std::string format(const char* fmt, ...) __attribute__((format(printf, 1, 2)));
std::string format(const char* fmt, ...) {
    va_list args;
    va_start(args, fmt);
    va_list copy;
    va_copy(copy, args);
    const int n = std::vsnprintf(nullptr, 0, fmt, args);
    va_end(args);
    std::string text(static_cast<std::size_t>(n) + 1, '\0');
    std::vsnprintf(text.data(), text.size(), fmt, copy);
    va_end(copy);
    text.resize(static_cast<std::size_t>(n));
    return text;
}

void addLine(std::string& text, const char* key, const std::string& value) {
    if (!value.empty()) text += std::string(key) + ": " + value + "\r\n";
}

std::string infoFileText(const InfoFields& f) {
    std::string text;
    addLine(text, "SESSION NAME", f.sessionName);
    addLine(text, "SESSION START", f.sessionStart);
    addLine(text, "SESSION END", f.sessionEnd);
    addLine(text, "TWEIGHT", f.timeWeighting);
    addLine(text, "CALIBRATION", f.calibration);
    addLine(text, "RANGE MULTIPLIER", f.rangeMultiplier);
    addLine(text, "TRIG SETTING", f.trigSetting);
    addLine(text, "TRIG PRE REC LENGTH", f.trigPreRecLength);
    return text;
}

}  // namespace

std::vector<LevelRow> makeRows(std::size_t count, std::size_t firstSlot,
                               const std::function<void(std::size_t slot, LevelRow&)>& fill) {
    std::vector<LevelRow> rows(count);
    for (std::size_t i = 0; i < count; ++i) {
        const std::size_t slot = firstSlot + i;
        LevelRow& row = rows[i];
        row.minute = static_cast<unsigned>(slot / 600 % 60);
        row.second = static_cast<unsigned>(slot / 10 % 60);
        row.tenth = static_cast<unsigned>(slot % 10);
        if (fill) fill(slot, row);
    }
    return rows;
}

std::vector<LevelRow> makeHour(const std::function<void(std::size_t slot, LevelRow&)>& fill) {
    return makeRows(36000, 0, fill);
}

std::string levelFileText(const LevelFileHeader& h, const std::vector<LevelRow>& rows) {
    std::string text = format(
        "Session Name,,%s\r\nLogger Serial Number,,%s\r\nDate,,%02u/%02u/%04u\r\nHour,,%02u\r\n"
        "Temperature,,%5.1f\r\nTime,SPL-A,SPL-C,LEQ-A,LEQ-C,Signal Condition,Battery\r\n",
        h.sessionTitle.c_str(), h.serialNumber.c_str(), h.day, h.month, h.year, h.hour,
        static_cast<double>(h.temperature));
    for (const LevelRow& r : rows) {
        text += format("%u:%u.%u,%.1f,%.1f,%.1f,%.1f,%u,%.1f\r\n", r.minute, r.second, r.tenth,
                       static_cast<double>(r.splA), static_cast<double>(r.splC),
                       static_cast<double>(r.leqA), static_cast<double>(r.leqC), r.condition,
                       static_cast<double>(r.battery));
    }
    return text;
}

SessionLayout namedSession(const std::string& name) {
    SessionLayout layout;
    layout.info.sessionName = name;
    for (LevelFileLayout& file : layout.levelFiles) file.header.sessionTitle = name;
    return layout;
}

std::string writeSession(const std::string& dir, const SessionLayout& layout) {
    makeDirs(dir);
    if (layout.writeInfo) {
        std::string infName = layout.infName;
        if (infName.empty()) infName = dir.substr(dir.find_last_of('/') + 1) + ".inf";
        writeFile(dir + "/" + infName, infoFileText(layout.info));
    }
    for (const LevelFileLayout& file : layout.levelFiles) {
        const LevelFileHeader& h = file.header;
        const std::string name =
            file.name.empty() ? format("%04u%02u%02u_%02u.csv", h.year, h.month, h.day, h.hour)
                              : file.name;
        writeFile(dir + "/" + file.dataDir + "/" + name, levelFileText(h, file.rows));
    }
    for (const std::string& wave : layout.waveFiles) writeFile(dir + "/" + wave, "");
    for (const std::string& extra : layout.extraDirs) makeDirs(dir + "/" + extra);
    return dir;
}

}  // namespace testing_support
