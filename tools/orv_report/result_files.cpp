#include "result_files.h"

#include <charconv>
#include <cmath>
#include <cstdio>
#include <limits>

#include "platform/civil_time.h"
#include "platform/files.h"

namespace orv_report {
namespace {

constexpr std::string_view kLoggerLine = "Quellmark -  Type 1 Environmental Noise Logger";
constexpr std::string_view kBandSuffix = " Octave Band Results";
constexpr std::string_view kFilterSuffix = " Results";
constexpr std::string_view kErrorsField = "Errors Found in Interval";
constexpr std::size_t kHeaderLines = 20;  // the column line follows
constexpr std::size_t kReportedBadRows = 5;
constexpr float kNaN = std::numeric_limits<float>::quiet_NaN();

// Walks the lines of a text; a line's CR before its LF is dropped.
class Lines {
public:
    explicit Lines(std::string_view text) : text_(text) {}
    bool next(std::string_view& line) {
        if (pos_ >= text_.size()) return false;
        std::size_t end = text_.find('\n', pos_);
        if (end == std::string_view::npos) end = text_.size();
        line = text_.substr(pos_, end - pos_);
        if (!line.empty() && line.back() == '\r') line.remove_suffix(1);
        pos_ = end + 1;
        ++number_;
        return true;
    }
    std::size_t number() const { return number_; }

private:
    std::string_view text_;
    std::size_t pos_ = 0;
    std::size_t number_ = 0;
};

bool parseUnsigned(std::string_view s, unsigned& out) {
    const auto [ptr, ec] = std::from_chars(s.data(), s.data() + s.size(), out);
    return !s.empty() && ec == std::errc() && ptr == s.data() + s.size();
}

bool parseFloat(std::string_view s, float& out) {
    if (!s.empty() && s.front() == '+') return false;
    const auto [ptr, ec] = std::from_chars(s.data(), s.data() + s.size(), out);
    return !s.empty() && ec == std::errc() && ptr == s.data() + s.size() && std::isfinite(out);
}

// Splits `s` at `sep` into exactly `n` parts of unsigned numbers.
bool parseNumbers(std::string_view s, char sep, unsigned* out, std::size_t n) {
    for (std::size_t i = 0; i < n; ++i) {
        const std::size_t at = i + 1 < n ? s.find(sep) : s.size();
        if (at == std::string_view::npos || !parseUnsigned(s.substr(0, at), out[i])) return false;
        s.remove_prefix(i + 1 < n ? at + 1 : at);
    }
    return true;
}

// "dd/mm/yyyy" -> seconds of its midnight.
std::optional<Seconds> parseDate(std::string_view s) {
    unsigned d[3];
    if (!parseNumbers(s, '/', d, 3)) return std::nullopt;
    return toSeconds(d[2], d[1], d[0], 0, 0, 0);
}

// "hh:mm", "hh:mm:ss", "'hh:mm:ss.t" -> seconds into the day (the tenth is dropped: the
// writers stamp whole seconds).
std::optional<Seconds> parseClock(std::string_view s) {
    if (!s.empty() && s.front() == '\'') s.remove_prefix(1);
    if (const std::size_t dot = s.find('.'); dot != std::string_view::npos) {
        unsigned tenth = 0;
        if (!parseUnsigned(s.substr(dot + 1), tenth)) return std::nullopt;
        s = s.substr(0, dot);
    }
    unsigned f[3] = {0, 0, 0};
    const bool withSeconds = s.size() > 5;
    if (!parseNumbers(s, ':', f, withSeconds ? 3 : 2)) return std::nullopt;
    if (f[0] > 23 || f[1] > 59 || f[2] > 59) return std::nullopt;
    return Seconds{f[0]} * 3600 + f[1] * 60 + f[2];
}

// "05/03/2024 - 12:58:00"
std::optional<Seconds> parseHeaderTime(std::string_view s) {
    const std::size_t dash = s.find(" - ");
    if (dash == std::string_view::npos) return std::nullopt;
    const auto day = parseDate(s.substr(0, dash));
    const auto clock = parseClock(s.substr(dash + 3));
    if (!day || !clock) return std::nullopt;
    return *day + *clock;
}

// The value of a header line "\"Key\",\"\",\"\",\"\",\"value\"", taken whole (a title may
// hold commas and quotes).
std::optional<std::string_view> headerValue(std::string_view line, std::string_view key) {
    constexpr std::string_view kEmptyFields = "\",\"\",\"\",\"\",\"";
    const std::size_t prefix = 1 + key.size() + kEmptyFields.size();
    if (line.size() < prefix + 1 || line.front() != '"' || line.substr(1, key.size()) != key ||
        line.substr(1 + key.size(), kEmptyFields.size()) != kEmptyFields || line.back() != '"')
        return std::nullopt;
    return line.substr(prefix, line.size() - prefix - 1);
}

// Remembers the first few bad lines of a file and counts the rest.
class BadRows {
public:
    BadRows(const std::string& path, std::vector<Problem>& problems)
        : path_(path), problems_(problems) {}
    ~BadRows() {
        if (count_ > kReportedBadRows)
            problems_.push_back({path_, 0,
                                 std::to_string(count_ - kReportedBadRows) +
                                     " more lines could not be read and were skipped"});
    }
    void add(std::size_t line, const std::string& message) {
        if (++count_ <= kReportedBadRows) problems_.push_back({path_, line, message});
    }

private:
    const std::string& path_;
    std::vector<Problem>& problems_;
    std::size_t count_ = 0;
};

// Date and time fields of a row, with the day's seconds kept for the next row.
class RowClock {
public:
    std::optional<Seconds> at(std::string_view date, std::string_view clock) {
        if (date != lastDate_ || !day_) {
            day_ = parseDate(date);
            lastDate_ = date;
        }
        const auto c = parseClock(clock);
        if (!day_ || !c) return std::nullopt;
        return *day_ + *c;
    }

private:
    std::string_view lastDate_;
    std::optional<Seconds> day_;
};

int columnIndex(const std::vector<std::string>& columns, std::string_view name) {
    for (std::size_t i = 0; i < columns.size(); ++i)
        if (columns[i] == name) return static_cast<int>(i);
    return -1;
}

void readStatRows(ResultFile& f, Lines& lines, BadRows& bad) {
    const std::vector<std::string>& c = f.columns;
    const int iLeq = columnIndex(c, "Leq"), iLmax = columnIndex(c, "Lmax"),
              iL90 = columnIndex(c, "L90"), iLmin = columnIndex(c, "Lmin"),
              iLpeak = columnIndex(c, "Lpeak"), iTemp = columnIndex(c, "Temp"),
              iBattery = columnIndex(c, "Battery"), iOverload = columnIndex(c, "Overload");
    if (iLeq != 2 || iLmax < 0 || iLmin < 0 || iTemp < 0 || iBattery < 0 || iOverload < 0) {
        bad.add(kHeaderLines + 1,
                "the column line lacks Leq, Lmax, Lmin, Temp, Battery or Overload");
        return;
    }
    RowClock clock;
    std::vector<std::string_view> fields;
    std::string_view line;
    const auto level = [&](int i, float& out) {
        if (i < 0) {
            out = kNaN;
            return true;
        }
        return parseFloat(fields[static_cast<std::size_t>(i)], out);
    };
    while (lines.next(line)) {
        if (line.empty()) continue;
        StatRow r;
        const auto t = splitQuoted(line, fields) && fields.size() >= c.size()
                           ? clock.at(fields[0], fields[1])
                           : std::nullopt;
        if (!t || !level(iLeq, r.leq) || !level(iLmax, r.lmax) || !level(iL90, r.l90) ||
            !level(iLmin, r.lmin) || !level(iLpeak, r.lpeak) || !level(iTemp, r.temperature) ||
            !level(iBattery, r.battery) ||
            !parseUnsigned(fields[static_cast<std::size_t>(iOverload)], r.overload)) {
            bad.add(lines.number(), "row not readable: " + std::string(line.substr(0, 80)));
            continue;
        }
        if (!f.stats.empty() && *t <= f.stats.back().end) {
            bad.add(lines.number(),
                    "time " + formatTime(*t, true) + " is not after the row before");
            continue;
        }
        r.end = *t;
        r.errors = fields.size() > c.size() && fields[c.size()] == kErrorsField;
        f.stats.push_back(r);
    }
}

void readLeqRows(ResultFile& f, Lines& lines, BadRows& bad) {
    LeqRows& q = f.leq;
    const std::size_t columns = f.columns.size();
    if (q.width == 0) {
        // Date, Time, levels..., Overload; an octave file may carry one level more than it has
        // titles (the filtered channel's), which the titles of band names leave out.
        for (std::size_t i = 2; i + 1 < columns && bandFrequency(f.columns[i]); ++i) ++q.width;
        if (f.kind == FileKind::Leq) q.width = 1;
    }
    RowClock clock;
    std::vector<std::string_view> fields;
    std::string_view line;
    float level = 0;
    while (lines.next(line)) {
        if (line.empty()) continue;
        const auto t = splitQuoted(line, fields) && fields.size() >= columns
                           ? clock.at(fields[0], fields[1])
                           : std::nullopt;
        bool ok = t.has_value();
        const std::size_t first = q.levels.size();
        for (std::size_t i = 0; ok && i < q.width; ++i) {
            ok = parseFloat(fields[2 + i], level);
            q.levels.push_back(level);
        }
        // The overload field follows every level (the filtered channel's included).
        std::size_t iOverload = columns - 1;
        while (ok && iOverload + 1 < fields.size() && fields[iOverload + 1] != kErrorsField)
            ++iOverload;
        unsigned overload = 0;
        ok = ok && parseUnsigned(fields[iOverload], overload);
        if (!ok || (!q.ends.empty() && *t <= q.ends.back())) {
            q.levels.resize(first);
            bad.add(lines.number(),
                    ok ? "time " + formatTime(*t, true) + " is not after the row before"
                       : "row not readable: " + std::string(line.substr(0, 80)));
            continue;
        }
        q.ends.push_back(*t);
        q.overload.push_back(overload != 0);
        q.errors.push_back(iOverload + 1 < fields.size() && fields[iOverload + 1] == kErrorsField);
    }
}

void readRawRows(ResultFile& f, Lines& lines, BadRows& bad) {
    std::string_view line;
    float a = 0, c = 0;
    while (lines.next(line)) {
        if (line.empty()) continue;
        // minute:second.tenth,SPL-A,SPL-C,LEQ-A,LEQ-C,condition,battery
        std::string_view fields[7];
        std::size_t n = 0;
        for (std::string_view rest = line; n < 7; ++n) {
            const std::size_t comma = rest.find(',');
            fields[n] = rest.substr(0, comma);
            if (comma == std::string_view::npos) {
                ++n;
                break;
            }
            rest.remove_prefix(comma + 1);
        }
        if (n != 7 || fields[0].find(':') == std::string_view::npos || !parseFloat(fields[3], a) ||
            !parseFloat(fields[4], c)) {
            bad.add(lines.number(), "row not readable: " + std::string(line.substr(0, 80)));
            continue;
        }
        RawHour& h = f.raw;
        ++h.records;
        if (a > 0) h.energyA += std::pow(10.0, a / 10.0), ++h.levelsA;
        if (c > 0) h.energyC += std::pow(10.0, c / 10.0), ++h.levelsC;
    }
}

ResultFile classifyRaw(ResultFile f, Lines& lines, std::vector<Problem>& problems) {
    std::string_view l[6];
    for (auto& x : l)
        if (!lines.next(x)) x = {};
    const auto after = [](std::string_view s,
                          std::string_view key) -> std::optional<std::string_view> {
        if (s.substr(0, key.size()) != key) return std::nullopt;
        s.remove_prefix(key.size());
        while (!s.empty() && (s.front() == ' ' || s.front() == ',')) s.remove_prefix(1);
        return s;
    };
    const auto title = after(l[0], "Session Name,");
    const auto serial = after(l[1], "Logger Serial Number,");
    const auto date = after(l[2], "Date,");
    const auto hour = after(l[3], "Hour,");
    unsigned h = 0;
    const auto day = date ? parseDate(*date) : std::nullopt;
    if (!title || !serial || !day || !hour || !parseUnsigned(*hour, h) || h > 23) {
        problems.push_back({f.path, 0, "the header of this hourly level file is not readable"});
        f.kind = FileKind::Unknown;
        return f;
    }
    f.kind = FileKind::RawLevels;
    f.raw.title = *title;
    f.raw.serial = *serial;
    f.raw.hourStart = *day + Seconds{h} * 3600;
    return f;
}

}  // namespace

std::optional<Seconds> toSeconds(unsigned year, unsigned month, unsigned day, unsigned hour,
                                 unsigned minute, unsigned second) {
    platform::SystemTime st;
    st.year = static_cast<std::uint16_t>(year);
    st.month = static_cast<std::uint16_t>(month);
    st.day = static_cast<std::uint16_t>(day);
    st.hour = static_cast<std::uint16_t>(hour);
    st.minute = static_cast<std::uint16_t>(minute);
    st.second = static_cast<std::uint16_t>(second);
    platform::FileTime ft = 0;
    if (year > 30827 || !platform::systemTimeToFileTime(st, ft)) return std::nullopt;
    return static_cast<Seconds>(ft / platform::kTicksPerSecond);
}

std::string formatTime(Seconds t, bool withSeconds) {
    platform::SystemTime st;
    if (t < 0 || !platform::fileTimeToSystemTime(
                     static_cast<platform::FileTime>(t) * platform::kTicksPerSecond, st))
        return "?";
    char buf[40];
    if (withSeconds)
        std::snprintf(buf, sizeof buf, "%02u/%02u/%04u %02u:%02u:%02u", st.day, st.month, st.year,
                      st.hour, st.minute, st.second);
    else
        std::snprintf(buf, sizeof buf, "%02u/%02u/%04u %02u:%02u", st.day, st.month, st.year,
                      st.hour, st.minute);
    return buf;
}

std::string formatDate(Seconds t) { return formatTime(t, false).substr(0, 10); }

std::string describe(const Problem& p) {
    return p.line ? p.file + ":" + std::to_string(p.line) + ": " + p.message
                  : p.file + ": " + p.message;
}

bool splitQuoted(std::string_view line, std::vector<std::string_view>& fields) {
    fields.clear();
    std::size_t i = 0;
    while (i < line.size()) {
        if (line[i] != '"') return false;
        const std::size_t close = line.find('"', i + 1);
        if (close == std::string_view::npos) return false;
        fields.push_back(line.substr(i + 1, close - i - 1));
        i = close + 1;
        if (i == line.size()) break;
        if (line[i] != ',') return false;
        ++i;  // a trailing comma ends the line
    }
    return !fields.empty();
}

std::optional<double> bandFrequency(std::string_view name) {
    double scale = 1;
    if (name.size() > 3 && name.substr(name.size() - 3) == "kHz") {
        scale = 1000;
        name.remove_suffix(3);
    } else if (name.size() > 2 && name.substr(name.size() - 2) == "Hz") {
        name.remove_suffix(2);
    } else {
        return std::nullopt;
    }
    double f = 0;
    const auto [ptr, ec] = std::from_chars(name.data(), name.data() + name.size(), f);
    if (ec != std::errc() || ptr != name.data() + name.size() || !(f > 0)) return std::nullopt;
    return f * scale;
}

ResultFile classifyFile(const std::string& path, std::string_view text,
                        std::vector<Problem>& problems) {
    ResultFile f;
    f.path = path;
    Lines lines(text);
    if (text.substr(0, 14) == "Session Name,,") return classifyRaw(std::move(f), lines, problems);
    std::string_view line;
    if (!lines.next(line) || line.size() < 2 || line.front() != '"' || line.back() != '"' ||
        line.substr(1, kLoggerLine.size()) != kLoggerLine)
        return f;  // not a result file
    f.header.line1 = line.substr(1, line.size() - 2);
    std::string_view rest = std::string_view(f.header.line1).substr(kLoggerLine.size());
    std::vector<std::string_view> fields;
    std::string_view hl[kHeaderLines + 1];
    hl[0] = line;
    for (std::size_t i = 1; i <= kHeaderLines && lines.next(hl[i]);) ++i;
    if (lines.number() <= kHeaderLines || !splitQuoted(hl[kHeaderLines], fields) ||
        fields.size() < 3 || fields[0] != "Date" || fields[1] != "Time") {
        problems.push_back({path, std::min<std::size_t>(lines.number(), kHeaderLines + 1),
                            "the header block or column line is not complete"});
        return f;
    }
    f.columns.assign(fields.begin(), fields.end());
    ResultHeader& h = f.header;
    const auto take = [&](std::string_view key, std::string& out) {
        for (std::size_t i = 1; i < kHeaderLines; ++i)
            if (const auto v = headerValue(hl[i], key)) {
                out = *v;
                return true;
            }
        return false;
    };
    std::string interval, leqLength;
    take("Logger Serial Number", h.serial);
    take("Measurement Title", h.title);
    take("Frequency Weighting", h.frequencyWeighting);
    take("Time Averaging", h.timeAveraging);
    if (take("Measurement started at", h.startText)) h.start = parseHeaderTime(h.startText);
    if (take("Measurement stopped at", h.endText)) h.end = parseHeaderTime(h.endText);
    if (take("Statistical Interval", interval))
        std::sscanf(interval.c_str(), "%u", &h.statsMinutes);
    if (take("Short Term Leq Length", leqLength))
        std::sscanf(leqLength.c_str(), "%u", &h.leqSeconds);
    if (!h.start || !h.end)
        problems.push_back({path, 4, "the session start or end in the header is not readable"});

    const std::string& third = f.columns[2];
    if (rest.empty()) {
        if (third == "Leq")
            f.kind = FileKind::General;
        else if (third == "AP Leq")
            f.kind = FileKind::Leq;
        else if (bandFrequency(third))
            f.kind = FileKind::OctaveLeq;
    } else if (rest.substr(0, 3) == " - " && third == "Leq") {
        rest.remove_prefix(3);
        const bool band = rest.size() > kBandSuffix.size() &&
                          rest.substr(rest.size() - kBandSuffix.size()) == kBandSuffix;
        const std::string_view suffix = band ? kBandSuffix : kFilterSuffix;
        if (rest.size() > suffix.size() && rest.substr(rest.size() - suffix.size()) == suffix) {
            f.kind = band ? FileKind::Band : FileKind::Filtered;
            f.label = rest.substr(0, rest.size() - suffix.size());
        }
    }
    if (f.kind == FileKind::Unknown)
        problems.push_back({path, kHeaderLines + 1, "unknown kind of result file"});
    if ((f.kind == FileKind::Leq || f.kind == FileKind::OctaveLeq) && h.leqSeconds == 0)
        problems.push_back({path, 12, "the short Leq length in the header is not readable"});
    return f;
}

void readRows(ResultFile& file, std::string_view text, std::vector<Problem>& problems) {
    Lines lines(text);
    std::string_view skip;
    const std::size_t headerLines = file.kind == FileKind::RawLevels ? 6 : kHeaderLines + 1;
    for (std::size_t i = 0; i < headerLines && lines.next(skip); ++i) {
    }
    BadRows bad(file.path, problems);
    switch (file.kind) {
        case FileKind::General:
        case FileKind::Band:
        case FileKind::Filtered:
            readStatRows(file, lines, bad);
            break;
        case FileKind::Leq:
        case FileKind::OctaveLeq:
            readLeqRows(file, lines, bad);
            break;
        case FileKind::RawLevels:
            readRawRows(file, lines, bad);
            break;
        case FileKind::Unknown:
            break;
    }
}

std::optional<ResultFile> classifyPath(const std::string& path, std::vector<Problem>& problems) {
    int error = 0;
    platform::File file = platform::openForRead(path, &error);
    if (!file.valid()) {
        problems.push_back({path, 0, "cannot be opened (error " + std::to_string(error) + ")"});
        return std::nullopt;
    }
    std::string head(4096, '\0');
    head.resize(file.read(head.data(), head.size()));
    // The header block fits in 4 KiB; cut at the last line end so no line is half read.
    if (head.size() == 4096) head.resize(head.rfind('\n') + 1);
    return classifyFile(path, head, problems);
}

bool readRowsFromDisk(ResultFile& file, std::vector<Problem>& problems) {
    std::vector<char> bytes;
    int error = 0;
    // A Leq part holds at most 2^20 lines; 4 GiB is far above any file orv_cmd writes.
    constexpr std::uint64_t kLargest = 4ULL << 30;
    if (platform::readRegularFile(file.path, bytes, kLargest, &error) != platform::ReadResult::Ok) {
        problems.push_back({file.path, 0, "cannot be read (error " + std::to_string(error) + ")"});
        return false;
    }
    readRows(file, std::string_view(bytes.data(), bytes.size()), problems);
    return true;
}

}  // namespace orv_report
