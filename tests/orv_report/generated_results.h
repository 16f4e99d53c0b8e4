// Result files of orv_cmd written byte for byte as the tool writes them (header block, column
// line, quoted rows, CR LF), with levels chosen by the tests.
#pragma once

#include <cstdio>
#include <string>
#include <vector>

#include "orv_report/result_files.h"

namespace report_test {

using orv_report::Seconds;

inline constexpr const char* kLogger = "Quellmark -  Type 1 Environmental Noise Logger";

// 05/03/2024 00:00:00 as seconds.
inline Seconds day0() { return *orv_report::toSeconds(2024, 3, 5, 0, 0, 0); }
inline Seconds at(int day, int hour, int minute = 0, int second = 0) {
    return day0() + day * 86400 + hour * 3600 + minute * 60 + second;
}

struct Header {
    std::string serial = "TL40217", title = "Site";
    Seconds start = at(0, 12), end = at(0, 14);
    std::string weighting = "A", averaging = "Fast";
    unsigned statsMinutes = 15;
    std::string leqLength = "Not Applicable";
};

// Joins its parts (appends, which GCC 12 does not mistake for overlapping copies).
template <typename... Parts>
std::string cat(const Parts&... parts) {
    std::string s;
    (s.append(parts), ...);
    return s;
}

// "a","b", (a row's fields, each quoted and followed by a comma)
inline std::string quoted(const std::vector<std::string>& fields) {
    std::string s;
    for (const std::string& f : fields) s.append("\"").append(f).append("\",");
    return s;
}

inline std::string headerBlock(const std::string& line1, const Header& h) {
    const auto line = [](const char* key, const std::string& v) {
        return cat("\"", key, "\",\"\",\"\",\"\",\"", v, "\"\r\n");
    };
    const auto stamp = [](Seconds t) {
        const std::string s = orv_report::formatTime(t, true);  // dd/mm/yyyy hh:mm:ss
        return cat(s.substr(0, 10), " - ", s.substr(11));
    };
    std::string t = cat("\"", line1, "\"\r\n");
    t.append(line("Logger Serial Number", h.serial))
        .append(line("Measurement Title", h.title))
        .append(line("Measurement started at", stamp(h.start)))
        .append(line("Measurement stopped at", stamp(h.end)))
        .append(line("Frequency Weighting", h.weighting))
        .append(line("Time Averaging", h.averaging))
        .append(line("Statistical Interval", cat(std::to_string(h.statsMinutes), " min")));
    for (const char* k : {"Auxiliary Power", "Tape Recorder", "Short Term Leq"})
        t.append(line(k, "Not Applicable"));
    t.append(line("Short Term Leq Length", h.leqLength));
    for (const char* k : {"Start Trigger", "Stop Trigger", "Master Timer", "Sub Timer",
                          "Pre-measurement Reference", "Post-measurement Reference"})
        t.append(line(k, "Not Applicable"));
    return t.append(line("Engineering Units", "dB SPL")).append("\r\n");
}

inline std::string f1(double v) {
    char b[32];
    std::snprintf(b, sizeof b, "%.1f", v);
    return b;
}
inline std::string date(Seconds t) { return orv_report::formatTime(t, false).substr(0, 10); }
inline std::string clock(Seconds t, bool seconds) {
    return orv_report::formatTime(t, seconds).substr(11);
}

// A row of a general (hh:mm), band (hh:mm:ss) or filtered channel (with Lpeak) file; the
// percentiles are L10, L50, L90.
struct Row {
    Seconds end = 0;
    double leq = 50, lmax = 60, l90 = 45, temperature = 12.5, battery = 12.6, lpeak = 80;
    unsigned overload = 0;
    bool errors = false;
};

enum class StatKind { General, Band, Filtered };

inline std::string statFile(StatKind kind, const std::string& label, const Header& h,
                            const std::vector<Row>& rows) {
    const std::string line1 = kind == StatKind::General ? std::string(kLogger)
                              : kind == StatKind::Band
                                  ? cat(kLogger, " - ", label, " Octave Band Results")
                                  : cat(kLogger, " - ", label, " Results");
    const bool filtered = kind == StatKind::Filtered;
    std::string t = headerBlock(line1, h);
    t.append(quoted({"Date", "Time", "Leq", "Lmax", "L10", "L50", "L90", "Lmin"}))
        .append(filtered ? quoted({"Lpeak"}) : "")
        .append("\"Temp\",\"Battery\",\"Overload\"\r\n");
    for (const Row& r : rows) {
        t.append(quoted({date(r.end), clock(r.end, kind != StatKind::General), f1(r.leq),
                         f1(r.lmax), f1(r.lmax - 1), f1(r.leq), f1(r.l90), f1(r.l90 - 1)}))
            .append(filtered ? quoted({f1(r.lpeak)}) : "")
            .append(quoted({f1(r.temperature), f1(r.battery), std::to_string(r.overload)}))
            .append(r.errors ? "\"Errors Found in Interval\"\r\n" : "\r\n");
    }
    return t;
}

// An all-pass Leq file (one level a row) or an octave Leq file (band columns).
struct LeqLine {
    Seconds end = 0;
    std::vector<double> levels;
    unsigned overload = 0;
    bool errors = false;
};

inline std::string leqFile(const Header& h, const std::vector<std::string>& bands,
                           const std::vector<LeqLine>& rows) {
    std::string t = headerBlock(kLogger, h);
    t.append(quoted({"Date", "Time"})).append(bands.empty() ? quoted({"AP Leq"}) : quoted(bands));
    t.append("\"Overload\"\r\n");
    for (const LeqLine& r : rows) {
        t.append(quoted({date(r.end), cat("'", clock(r.end, true), ".0")}));
        for (double l : r.levels) t.append(quoted({f1(l)}));
        t.append(quoted({std::to_string(r.overload)}))
            .append(r.errors ? "\"Errors Found in Interval\"\r\n" : "\r\n");
    }
    return t;
}

// An hourly raw level file with one 100 ms Leq-A per record; times count back from 59:59.9.
inline std::string rawFile(const std::string& title, const std::string& serial, Seconds hour,
                           const std::vector<double>& leqA) {
    std::string t = cat("Session Name,,", title, "\r\nLogger Serial Number,,", serial, "\r\nDate,,",
                        date(hour), "\r\nHour,,", clock(hour, false).substr(0, 2),
                        "\r\nTemperature,, 12.5\r\nTime,SPL-A,SPL-C,LEQ-A,LEQ-C,Signal "
                        "Condition,Battery\r\n");
    const std::size_t n = leqA.size();
    for (std::size_t i = 0; i < n; ++i) {
        const std::size_t tenths = 36000 - n + i;
        char row[96];
        std::snprintf(row, sizeof row, "%zu:%zu.%zu,%.1f,%.1f,%.1f,%.1f,0,12.6\r\n", tenths / 600,
                      tenths / 10 % 60, tenths % 10, leqA[i] + 1, leqA[i] + 9, leqA[i],
                      leqA[i] + 8);
        t += row;
    }
    return t;
}

// Rows every `step` seconds ending at from + step ... to, with a level from `level(end)`.
template <typename Level>
std::vector<LeqLine> leqRows(Seconds from, Seconds to, Seconds step, Level level) {
    std::vector<LeqLine> rows;
    for (Seconds t = from + step; t <= to; t += step) rows.push_back({t, {level(t)}, 0, false});
    return rows;
}

}  // namespace report_test
