// The Leq files: the all-pass file (one broadband Leq per short interval) and the octave
// file (one Leq per band). Rows come from the driver's thread and from analysis workers, so
// one lock guards both files, their counters and the roll-over into numbered parts.
#pragma once

#include <array>
#include <cstdint>
#include <mutex>
#include <string>
#include <vector>

#include "platform/civil_time.h"
#include "results/result_files.h"
#include "results/result_header.h"

namespace orv {

struct LeqRow {
    platform::SystemTime time;  // end of the short-Leq interval (whole seconds)
    std::uint32_t errorsInInterval = 0;
    std::uint32_t overload = 0;
    std::vector<float> levels;  // dB: one level goes to the all-pass file, more to the octave file
};

class LeqResultsWriter {
public:
    // A part holds at most this many lines (header and column line included).
    static constexpr std::uint32_t kLinesPerPart = 1U << 20;
    static constexpr std::uint32_t kHeaderLines = 21;

    explicit LeqResultsWriter(RunResults& run, std::uint32_t linesPerPart = kLinesPerPart)
        : run_(run), linesPerPart_(linesPerPart) {}

    // Creates part 0 of a file. False (message printed) when it cannot be created.
    bool open(LeqFileKind kind, const std::string& path);
    void close(LeqFileKind kind);

    // Formats and keeps the header block of a file (repeated at the head of every part).
    // The octave file's column line names `bandCount` bands, then `extraColumn` when it is
    // not empty (the filtered channel's level). False when the file is not open.
    bool formatHeader(LeqFileKind kind, const ResultHeaderInfo& info, std::uint32_t bandCount,
                      const std::string& extraColumn = {});
    // Writes the kept header and the column line; the line counter becomes 21.
    bool writeColumnHeader(LeqFileKind kind);
    // Writes one row to the file its level count selects; rolls over to a new part when the
    // current one is full. True when the row was written in full.
    bool writeRow(const LeqRow& row);
    // Several rows, written with as few writes as the roll-over allows. True when every
    // row was written in full.
    bool writeRows(const std::vector<LeqRow>& rows);

    static std::string formatRow(const LeqRow& row);
    std::uint32_t lineCount(LeqFileKind kind) const { return file(kind).lines; }

private:
    struct LeqFile {
        ResultFile handle;
        std::string name;             // part 0; the base of the roll-over names
        std::string header;           // formatted header block
        std::uint32_t bandCount = 1;  // columns of the octave file
        std::string extraColumn;      // title of the column after the bands, if any
        std::uint32_t lines = 0;
        std::uint32_t part = 0;
    };
    LeqFile& file(LeqFileKind kind) { return files_[static_cast<std::size_t>(kind)]; }
    const LeqFile& file(LeqFileKind kind) const { return files_[static_cast<std::size_t>(kind)]; }
    bool writeColumnHeaderLocked(LeqFileKind kind);
    // Appends a row's line to `pending`, writing it out and rolling over when the part is full.
    bool addLineLocked(LeqFileKind kind, const std::string& line, std::string& pending);
    void rollOverLocked(LeqFileKind kind);

    RunResults& run_;
    const std::uint32_t linesPerPart_;
    mutable std::mutex mutex_;
    std::array<LeqFile, 2> files_;
};

}  // namespace orv
