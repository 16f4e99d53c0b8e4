#include "session_files.h"

#include <cmath>
#include <cstdio>
#include <fstream>
#include <numbers>
#include <stdexcept>

#include "random.h"

namespace orv_demo {
namespace {

std::string dateTimeText(const CivilTime& t) {
    char text[40];
    std::snprintf(text, sizeof text, "%02u/%02u/%04d %02u:%02u:%02u", t.day, t.month, t.year,
                  t.hour, t.minute, t.second);
    return text;
}

void writeWhole(const std::string& path, const std::string& text) {
    std::ofstream file(path, std::ios::binary | std::ios::trunc);
    file.write(text.data(), static_cast<std::streamsize>(text.size()));
    file.close();
    if (!file) throw std::runtime_error("cannot write " + path);
}

// Appends the decimal digits of v.
void appendUnsigned(std::string& out, unsigned v) {
    char digits[10];
    int n = 0;
    do {
        digits[n++] = static_cast<char>('0' + v % 10);
        v /= 10;
    } while (v != 0);
    while (n > 0) out += digits[--n];
}

// Appends v with one decimal as printf's "%.1f" does for the levels of a level file.
void appendOneDecimal(std::string& out, float v) {
    char text[32];
    const int n = std::snprintf(text, sizeof text, "%.1f", static_cast<double>(v));
    out.append(text, static_cast<std::size_t>(n));
}

}  // namespace

std::string infoFileText(const SessionInfo& info) {
    std::string text;
    const auto line = [&text](const char* key, const std::string& value) {
        text += key;
        text += ": ";
        text += value;
        text += "\r\n";
    };
    line("SESSION NAME", info.name);
    line("SESSION START", dateTimeText(info.start));
    line("SESSION END", dateTimeText(info.end));
    line("TWEIGHT", "125");
    line("CALIBRATION", info.calibration);
    line("RANGE MULTIPLIER", "1.0");
    line("TRIG SETTING", info.triggered ? "ON" : "OFF");
    line("TRIG TYPE", "Level");
    line("TRIG PRE REC LENGTH", std::to_string(info.preRecordSeconds));
    return text;
}

float readDecimalAsLogger(const std::string& text) {
    std::size_t i = 0;
    float value = 0.0F;
    for (; i < text.size() && text[i] >= '0' && text[i] <= '9'; ++i)
        value = value * 10.0F + static_cast<float>(text[i] - '0');
    if (i < text.size() && text[i] == '.') {
        float scale = 1.0F;
        for (++i; i < text.size() && text[i] >= '0' && text[i] <= '9'; ++i) {
            scale *= 0.1F;
            value += static_cast<float>(text[i] - '0') * scale;
        }
    }
    return value;
}

std::string waveFileName(const CivilTime& t, unsigned part) {
    char text[40];
    if (part == 0) {
        std::snprintf(text, sizeof text, "%04d%02u%02u_%02u%02u%02u.wav", t.year, t.month, t.day,
                      t.hour, t.minute, t.second);
    } else {
        std::snprintf(text, sizeof text, "%04d%02u%02u_%02u%02u%02u_%03u.wav", t.year, t.month,
                      t.day, t.hour, t.minute, t.second, part);
    }
    return text;
}

HourlyLevelWriter::HourlyLevelWriter(std::string dataDir, std::string title,
                                     std::string serialNumber, std::int64_t firstRecordTenths,
                                     std::uint64_t seed)
    : dataDir_(std::move(dataDir)),
      title_(std::move(title)),
      serial_(std::move(serialNumber)),
      seed_(seed),
      nextTenth_(firstRecordTenths) {}

void HourlyLevelWriter::startHour(std::int64_t hourIndex) {
    hour_ = hourIndex;
    const CivilTime t = fromSeconds(hourIndex * 3600);
    char name[32];
    std::snprintf(name, sizeof name, "%04d%02u%02u_%02u.csv", t.year, t.month, t.day, t.hour);
    name_ = name;
    // Temperature of the hour: a daily cycle between about 4 and 14 degrees, warmest at
    // 15:00, with a small random offset per hour.
    const double cycle =
        std::cos(2.0 * std::numbers::pi * (static_cast<double>(t.hour) - 15.0) / 24.0);
    const double offset = unitFromBits(mix64(seed_, static_cast<std::uint64_t>(hourIndex))) - 0.5;
    const double temperature = 9.0 + 5.0 * cycle + offset;
    char header[512];
    std::snprintf(header, sizeof header,
                  "Session Name,,%s\r\nLogger Serial Number,,%s\r\nDate,,%02u/%02u/%04d\r\n"
                  "Hour,,%02u\r\nTemperature,,%5.1f\r\n"
                  "Time,SPL-A,SPL-C,LEQ-A,LEQ-C,Signal Condition,Battery\r\n",
                  title_.c_str(), serial_.c_str(), t.day, t.month, t.year, t.hour, temperature);
    text_ = header;
}

void HourlyLevelWriter::writeHour() {
    writeWhole(dataDir_ + "/" + name_, text_);
    fileNames_.push_back(name_);
    text_.clear();
}

void HourlyLevelWriter::add(const LevelRow& row) {
    const std::int64_t hour = nextTenth_ / 36000;
    if (hour != hour_) {
        if (hour_ >= 0) writeHour();
        startHour(hour);
    }
    // Record layout "%u:%u.%u,%.1f,%.1f,%.1f,%.1f,%u,%.1f\r\n", written piecewise because
    // a day holds 864,000 records.
    const auto slot = static_cast<unsigned>(nextTenth_ % 36000);
    appendUnsigned(text_, slot / 600);
    text_ += ':';
    appendUnsigned(text_, slot / 10 % 60);
    text_ += '.';
    appendUnsigned(text_, slot % 10);
    for (const float level : {row.splA, row.splC, row.leqA, row.leqC}) {
        text_ += ',';
        appendOneDecimal(text_, level);
    }
    text_ += ',';
    appendUnsigned(text_, row.condition);
    text_ += ',';
    appendOneDecimal(text_, row.battery);
    text_ += "\r\n";
    ++nextTenth_;
}

void HourlyLevelWriter::finish() {
    if (hour_ >= 0 && !text_.empty()) writeHour();
}

}  // namespace orv_demo
