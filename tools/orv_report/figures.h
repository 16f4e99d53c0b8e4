// Every figure a report shows, computed from a session's result files. The pages and
// report.json are both written from these records and from nothing else, so a number on a
// page is always the number in report.json. Levels and percentages are kept rounded to one
// decimal, as they are printed; energy means are taken in power, never by averaging dB.
#pragma once

#include <cstddef>
#include <optional>
#include <string>
#include <vector>

#include "result_files.h"
#include "sessions.h"

namespace orv_report {

struct Thresholds {
    double minCoverage = 75.0;  // percent of a period that data must cover
    double batteryLow = 11.5;   // volts
    double temperatureLow = -10.0, temperatureHigh = 50.0;  // degrees C
    double audioTolerance = 1.0;  // dB between audio-derived and logger hourly Leq
};

// A level over a period, with the share of the period that data cover.
struct Figure {
    std::optional<double> level;  // dB; none without data
    double coverage = 0;          // percent
    bool flagged = false;         // coverage below the minimum (Lden: any part flagged)
};

// One assessment day: day 07-19, evening 19-23, night 23-07 of the next morning.
struct AssessmentDay {
    Seconds midnight = 0;
    Figure lday, levening, lnight, lden;
    std::optional<double> nightLmax;
    Seconds nightLmaxAt = 0;  // end of the interval that holds it
};

struct HourFigure {
    Seconds start = 0;
    Figure leq;
};

struct Tick {
    double at = 0;  // seconds (time axes) or dB (level axes)
    std::string label;
};

struct TimeRange {
    Seconds from = 0, to = 0;
};

// Ranges of one kind, merged where they touch; `count` counts the intervals behind them.
struct Ranges {
    std::vector<TimeRange> ranges;
    std::size_t count = 0;
};

// A column of a drawing: the energy mean of everything in [from, to).
struct Column {
    Seconds from = 0, to = 0;
    std::optional<double> leq, lmax, l90;
};

struct TimeAxis {
    Seconds from = 0, to = 0;
    std::vector<Tick> ticks;      // at = seconds
    std::vector<Tick> midnights;  // day marks, at = seconds
};

struct LevelAxis {
    double min = 0, max = 0;
    std::vector<Tick> ticks;
};

struct TimeHistory {
    std::string source;  // what the Leq line is drawn from
    TimeAxis x;
    LevelAxis y;
    std::vector<Column> columns;
};

struct Spectrum {
    std::string source, weighting;
    std::vector<std::string> bands;
    std::vector<std::optional<double>> leq, l90;  // per band; L90: median of the intervals
    LevelAxis y;
    // Band-by-time map: columns x bands, cells[column * bands + band].
    TimeAxis x;
    std::vector<Column> columns;  // only from/to are used
    std::vector<std::optional<double>> cells;
    LevelAxis colour;
};

struct FilteredChannel {
    std::string name, weighting;
    std::optional<double> leq, lmax, lpeak;
};

struct AudioHour {
    Seconds start = 0;
    double audioLeq = 0, loggerLeq = 0;
    double audioCoverage = 0, loggerCoverage = 0;  // percent of the hour
    std::optional<double> difference;              // audio - logger, when both cover alike
    bool flagged = false;
};

struct Quality {
    Ranges gaps, errors, overloads;
    double missingMinutes = 0;
    std::optional<double> batteryMin;
    std::size_t batteryLowCount = 0;
    std::optional<Seconds> batteryLowFirst;
    std::optional<double> temperatureMin, temperatureMax;
    std::size_t temperatureOutCount = 0;
    std::vector<AudioHour> audio;
    std::optional<double> audioMaxDifference;  // largest |difference|
    std::size_t audioFlagged = 0;
    std::vector<std::string> flags;  // short names: gaps, errors, overload, battery, ...
};

struct SessionReport {
    std::string name, id, layout;
    std::string serial, title, start, end, weighting, timeAveraging;
    unsigned statsMinutes = 0, leqSeconds = 0;
    std::vector<std::string> files, unusedFiles, problems;
    bool empty = true;                    // no rows at all
    Figure leq;                           // whole session
    Figure lday, levening, lnight, lden;  // whole session
    std::vector<AssessmentDay> days;
    std::vector<HourFigure> hours;
    TimeHistory history;
    std::optional<Spectrum> spectrum;
    std::optional<FilteredChannel> filtered;
    Quality quality;
};

struct Report {
    std::string resultsDir;
    Thresholds thresholds;
    std::vector<SessionReport> sessions;
    std::vector<std::string> problems;     // input problems outside any session
    std::vector<std::string> unusedFiles;  // files of no session
};

// The figures of one session whose rows have been read. `problems` are the input problems
// of the session's files, shown on its page.
SessionReport analyseSession(const SessionFiles& files, const Thresholds& thresholds,
                             const std::vector<Problem>& problems);

// 10 log10 of the energy mean; the Lden of three period levels (EU Directive 2002/49/EC).
double lden(double lday, double levening, double lnight);

// Rounds to one decimal, as every figure is kept.
double round1(double x);
// The one text of a figure, on the pages and in report.json: "%.1f".
std::string formatFigure(double x);

}  // namespace orv_report
