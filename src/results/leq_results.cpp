#include "results/leq_results.h"

#include "fweight.h"
#include "octave_filter.h"
#include "results/text_buffer.h"
#include "tweight.h"

namespace orv {

bool LeqResultsWriter::open(LeqFileKind kind, const std::string& path) {
    std::lock_guard<std::mutex> lock(mutex_);
    LeqFile& f = file(kind);
    f.name = path;
    f.header.clear();
    f.lines = 0;
    f.part = 0;
    return f.handle.create(path, run_);
}

void LeqResultsWriter::close(LeqFileKind kind) {
    std::lock_guard<std::mutex> lock(mutex_);
    file(kind).handle.close();
}

bool LeqResultsWriter::formatHeader(LeqFileKind kind, const ResultHeaderInfo& info,
                                    std::uint32_t bandCount, const std::string& extraColumn) {
    std::lock_guard<std::mutex> lock(mutex_);
    LeqFile& f = file(kind);
    if (!f.handle.isOpen()) return false;
    f.bandCount = bandCount;
    f.extraColumn = extraColumn;
    const std::uint32_t leqSeconds = displayInterval(info.leqInterval);
    if (kind == LeqFileKind::AllPass) {
        TextBuffer averaging;
        averaging.append("%u ms", info.timeWeightingMs);
        f.header = formatHeaderBlock(info, kGeneralFirstLine,
                                     SlmLibrary::FWeight::longName(info.generalWeighting),
                                     averaging.data(), leqSeconds);
    } else {
        f.header = formatHeaderBlock(
            info, kGeneralFirstLine, SlmLibrary::FWeight::longName(info.octaveFreqWeighting),
            SlmLibrary::TWeight::longName(info.octaveTimeWeighting), leqSeconds);
    }
    return true;
}

bool LeqResultsWriter::writeColumnHeader(LeqFileKind kind) {
    std::lock_guard<std::mutex> lock(mutex_);
    return writeColumnHeaderLocked(kind);
}

bool LeqResultsWriter::writeColumnHeaderLocked(LeqFileKind kind) {
    LeqFile& f = file(kind);
    const bool header = f.handle.write(f.header);
    std::string columns;
    if (kind == LeqFileKind::AllPass) {
        columns = "\"Date\",\"Time\",\"AP Leq\",\"Overload\"\r\n";
    } else {
        TextBuffer b;
        b.append("\"Date\",\"Time\",");
        for (std::uint32_t band = 0; band < f.bandCount; ++band) {
            b.append("\"%s\",", f.bandCount == 36 ? SlmLibrary::OctaveFilter::getThirdName(band)
                                                  : SlmLibrary::OctaveFilter::getFullName(band));
        }
        if (!f.extraColumn.empty()) b.append("\"%s\",", f.extraColumn.c_str());
        b.append("\"Overload\"\r\n");
        columns = b.str();
    }
    const bool written = f.handle.write(columns) && header;
    f.lines = kHeaderLines;  // counted whether or not they reached the file, as rows are
    return written;
}

std::string LeqResultsWriter::formatRow(const LeqRow& row) {
    TextBuffer b;
    const platform::SystemTime& t = row.time;
    b.append("\"%02u/%02u/%u\",\"'%02u:%02u:%02u.%01u\",", t.day, t.month, t.year, t.hour, t.minute,
             t.second, t.milliseconds);
    for (float v : row.levels) b.append("\"%.1f\",", static_cast<double>(v));
    b.append("\"%u\",", row.overload);
    b.append(row.errorsInInterval != 0 ? "\"Errors Found in Interval\"\r\n" : "\r\n");
    return b.str();
}

bool LeqResultsWriter::writeRow(const LeqRow& row) { return writeRows({row}); }

bool LeqResultsWriter::writeRows(const std::vector<LeqRow>& rows) {
    std::array<std::string, 2> pending;
    bool all = true;
    std::lock_guard<std::mutex> lock(mutex_);
    for (const LeqRow& row : rows) {
        if (row.levels.empty()) {  // written nowhere
            all = false;
            continue;
        }
        const LeqFileKind kind =
            row.levels.size() == 1 ? LeqFileKind::AllPass : LeqFileKind::Octave;
        const std::string line = formatRow(row);
        all = addLineLocked(kind, line, pending[static_cast<std::size_t>(kind)]) && all;
    }
    for (std::size_t k = 0; k < 2; ++k) {
        LeqFile& f = files_[k];
        if (pending[k].empty()) continue;
        if (!f.handle.write(pending[k])) all = false;
    }
    return all;
}

bool LeqResultsWriter::addLineLocked(LeqFileKind kind, const std::string& line,
                                     std::string& pending) {
    LeqFile& f = file(kind);
    if (f.name.empty()) return false;  // that file was never opened in this session
    pending += line;
    // The line counts whether or not it reaches the file.
    if (++f.lines < linesPerPart_) return f.handle.isOpen();
    const bool written = f.handle.write(pending);
    pending.clear();
    rollOverLocked(kind);
    return written;
}

void LeqResultsWriter::rollOverLocked(LeqFileKind kind) {
    LeqFile& f = file(kind);
    f.handle.close();
    ++f.part;
    if (f.handle.create(ResultNaming::leqPart(f.name, f.part), run_)) writeColumnHeaderLocked(kind);
}

}  // namespace orv
