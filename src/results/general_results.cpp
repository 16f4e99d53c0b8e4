#include "results/general_results.h"

#include "fweight.h"
#include "results/text_buffer.h"
#include "tweight.h"

namespace orv {

bool GeneralResultsWriter::writeHeader(const ResultHeaderInfo& info,
                                       std::uint32_t generalTimeWeighting) {
    if (!file_.isOpen()) return false;
    const std::string block = formatHeaderBlock(
        info, kGeneralFirstLine, SlmLibrary::FWeight::longName(info.generalWeighting),
        SlmLibrary::TWeight::longName(generalTimeWeighting), 0);
    return file_.write(block) && file_.write("\"Date\",\"Time\",\"Leq\",\"Lmax\",") &&
           file_.write(percentileLabels(info.percentiles)) &&
           file_.write("\"Lmin\",\"Temp\",\"Battery\",\"Overload\"\r\n");
}

std::string GeneralResultsWriter::formatRow(const GeneralIntervalRecord& r) {
    TextBuffer b;
    b.append("\"%02u/%02u/%u\",\"%02u:%02u\",\"%.1f\",\"%.1f\",", r.day, r.month, r.year, r.hour,
             r.minute, static_cast<double>(r.leq), static_cast<double>(r.lmax));
    for (float v : r.percentileValues) b.append("\"%.1f\",", static_cast<double>(v));
    b.append("\"%.1f\",\"%.1f\",\"%.1f\",\"%u\",", static_cast<double>(r.lmin),
             static_cast<double>(r.temperature), static_cast<double>(r.battery), r.overload);
    b.append(r.gapFlag != 0 ? "\"Errors Found in Interval\"\r\n" : "\r\n");
    return b.str();
}

bool GeneralResultsWriter::writeRow(const GeneralIntervalRecord& r) {
    if (!file_.isOpen()) return true;
    return file_.write(formatRow(r));
}

}  // namespace orv
