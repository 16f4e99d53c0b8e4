// Readers of the files orv_cmd writes into its output directory: the CSV result files (a
// 20-line header block, one column line, then rows of quoted fields) and the hourly raw level
// files (the logger's six-line level file layout). A file's kind is told by its content, not
// its name, so both output layouts and renamed directories read alike.
#pragma once

#include <cstddef>
#include <cstdint>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

namespace orv_report {

// Whole seconds since 1601-01-01 00:00, calendar time without a zone, as the files stamp it.
using Seconds = std::int64_t;

std::optional<Seconds> toSeconds(unsigned year, unsigned month, unsigned day, unsigned hour,
                                 unsigned minute, unsigned second);
// "05/03/2024 12:58" or, with seconds, "05/03/2024 12:58:00".
std::string formatTime(Seconds t, bool withSeconds);
// "05/03/2024"
std::string formatDate(Seconds t);

// Something wrong in an input file: its path, the line (1 = first; 0 = the file as a whole).
struct Problem {
    std::string file;
    std::size_t line = 0;
    std::string message;
};
std::string describe(const Problem& p);  // "path:line: message" ("path: message" for line 0)

enum class FileKind { General, Leq, OctaveLeq, Band, Filtered, RawLevels, Unknown };

// The header block of a result file, as written.
struct ResultHeader {
    std::string line1;  // the first line without its quotes
    std::string serial, title, frequencyWeighting, timeAveraging;
    std::string startText, endText;  // "05/03/2024 - 12:58:00"
    std::optional<Seconds> start, end;
    unsigned statsMinutes = 0;  // 0 when not stated
    unsigned leqSeconds = 0;    // 0 when "Not Applicable"
};

// One row of a general, octave band or filtered channel file; levels in dB, NaN when the
// file has no such column.
struct StatRow {
    Seconds end = 0;  // the row's time stamp: the end of its interval
    float leq = 0, lmax = 0, l90 = 0, lmin = 0, lpeak = 0, temperature = 0, battery = 0;
    unsigned overload = 0;
    bool errors = false;  // the row ends with "Errors Found in Interval"
};

// Rows of an all-pass or octave Leq file (and of its roll-over parts): `width` levels a row.
struct LeqRows {
    std::size_t width = 0;
    std::vector<Seconds> ends;
    std::vector<float> levels;           // ends.size() x width
    std::vector<std::uint8_t> overload;  // 1 when the overload field is non-zero
    std::vector<std::uint8_t> errors;    // 1 when the row ends with "Errors Found in Interval"
};

// An hourly raw level file: what the report needs of it is the energy of its 100 ms Leqs.
struct RawHour {
    std::string title, serial;
    Seconds hourStart = 0;
    std::size_t records = 0;
    double energyA = 0, energyC = 0;  // sums of 10^(L/10) over records with a level above 0
    std::size_t levelsA = 0, levelsC = 0;
};

struct ResultFile {
    std::string path;
    FileKind kind = FileKind::Unknown;
    ResultHeader header;
    std::vector<std::string> columns;  // the column line's titles
    std::string label;                 // band name (Band), filter name (Filtered)
    std::vector<StatRow> stats;        // General, Band, Filtered
    LeqRows leq;                       // Leq, OctaveLeq
    RawHour raw;                       // RawLevels
};

// Tells the kind of a file from its first lines and reads its header block and column line
// (rows are not read). Unknown for a file that is not one of ours; a problem is recorded
// only for a file that starts like ours but is damaged.
ResultFile classifyFile(const std::string& path, std::string_view text,
                        std::vector<Problem>& problems);

// Reads the rows of a classified file from its whole text. A row that cannot be read is
// skipped with a problem naming its line; rows whose time is not after the row before are
// skipped likewise.
void readRows(ResultFile& file, std::string_view text, std::vector<Problem>& problems);

// The same two steps from disk; nullopt (with a problem) when the file cannot be read.
std::optional<ResultFile> classifyPath(const std::string& path, std::vector<Problem>& problems);
bool readRowsFromDisk(ResultFile& file, std::vector<Problem>& problems);

// Field splitting of a result line: "a","b", or "a","b" -> a, b. False when malformed.
bool splitQuoted(std::string_view line, std::vector<std::string_view>& fields);

// Band names as the level library writes them ("31.5Hz", "1.25kHz") -> mid-band frequency in
// Hz; nullopt for anything else.
std::optional<double> bandFrequency(std::string_view name);

}  // namespace orv_report
