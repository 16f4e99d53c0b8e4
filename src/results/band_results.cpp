#include "results/band_results.h"

#include "fweight.h"
#include "octave_filter.h"
#include "results/text_buffer.h"
#include "tweight.h"

namespace orv {
namespace {

const char* bandName(std::uint32_t band, std::uint32_t bandCount) {
    return bandCount == 36 ? SlmLibrary::OctaveFilter::getThirdName(band)
                           : SlmLibrary::OctaveFilter::getFullName(band);
}

bool writeAll(ResultFile& file, const std::string& text) { return file.write(text); }

void appendLevels(TextBuffer& b, const BandIntervalResult& r) {
    for (float v : r.percentileLevels) b.append("\"%.1f\",", static_cast<double>(v));
}

}  // namespace

bool BandResultsWriter::openBandFiles(const ResultNaming& naming, std::uint32_t bandCount) {
    bandCount_ = bandCount;
    bandFiles_.clear();
    for (std::uint32_t b = 0; b < bandCount; ++b) {
        bandFiles_.emplace_back();
        if (!bandFiles_.back().create(naming.octaveBand(b, bandCount), run_)) return false;
    }
    return true;
}

bool BandResultsWriter::openFilteredFile(const std::string& path, std::uint32_t filterType) {
    filterType_ = filterType;
    return filteredFile_.create(path, run_);
}

void BandResultsWriter::close() {
    for (ResultFile& f : bandFiles_) f.close();
    filteredFile_.close();
}

bool BandResultsWriter::writeBandHeaders(const ResultHeaderInfo& info, std::uint32_t freqWeighting,
                                         std::uint32_t timeWeighting) {
    const std::string columns = "\"Date\",\"Time\",\"Leq\",\"Lmax\"," +
                                percentileLabels(info.percentiles) +
                                "\"Lmin\",\"Temp\",\"Battery\",\"Overload\"\r\n";
    for (std::uint32_t b = 0; b < bandCount_; ++b) {
        TextBuffer first;
        first.append(
            "\"Quellmark -  Type 1 Environmental Noise Logger - %s Octave Band Results\"\r\n",
            bandName(b, bandCount_));
        const std::string block =
            formatHeaderBlock(info, first.str(), SlmLibrary::FWeight::longName(freqWeighting),
                              SlmLibrary::TWeight::longName(timeWeighting), 0);
        if (b >= bandFiles_.size() || !writeAll(bandFiles_[b], block + columns)) return false;
    }
    return true;
}

bool BandResultsWriter::writeFilteredHeader(const ResultHeaderInfo& info,
                                            std::uint32_t freqWeighting,
                                            std::uint32_t timeWeighting) {
    TextBuffer first;
    first.append("\"Quellmark -  Type 1 Environmental Noise Logger - %s Results\"\r\n",
                 filterName(filterType_));
    const std::string block =
        formatHeaderBlock(info, first.str(), SlmLibrary::FWeight::longName(freqWeighting),
                          SlmLibrary::TWeight::longName(timeWeighting), 0);
    return writeAll(filteredFile_, block + "\"Date\",\"Time\",\"Leq\",\"Lmax\"," +
                                       percentileLabels(info.percentiles) +
                                       "\"Lmin\",\"Lpeak\",\"Temp\",\"Battery\",\"Overload\"\r\n");
}

std::string BandResultsWriter::formatBandRow(const platform::SystemTime& t,
                                             const BandIntervalResult& r) {
    TextBuffer b;
    b.append("\"%02u/%02u/%u\",\"%02u:%02u:%02u\",\"%.1f\",\"%.1f\",", t.day, t.month, t.year,
             t.hour, t.minute, t.second, static_cast<double>(r.leq), static_cast<double>(r.lmax));
    appendLevels(b, r);
    b.append("\"%.1f\",\"%.1f\",\"%.1f\",\"%u\",\r\n", static_cast<double>(r.lmin),
             static_cast<double>(r.temperature), static_cast<double>(r.battery), r.overload);
    return b.str();
}

std::string BandResultsWriter::formatFilteredRow(const platform::SystemTime& t,
                                                 const BandIntervalResult& r) {
    TextBuffer b;
    b.append("\"%02u/%02u/%u\",\"%02u:%02u\",\"%.1f\",\"%.1f\",", t.day, t.month, t.year, t.hour,
             t.minute, static_cast<double>(r.leq), static_cast<double>(r.lmax));
    appendLevels(b, r);
    b.append("\"%.1f\",\"%.1f\",\"%.1f\",\"%.1f\",\"%u\",\r\n", static_cast<double>(r.lmin),
             static_cast<double>(r.lpeak), static_cast<double>(r.temperature),
             static_cast<double>(r.battery), r.overload);
    return b.str();
}

bool BandResultsWriter::writeBlock(const BlockResult& block) {
    bool all = true;
    for (std::size_t i = 0; i < block.bands.size(); ++i) {
        if (i < bandCount_) {
            if (i < bandFiles_.size() && bandFiles_[i].isOpen()) {
                all = writeAll(bandFiles_[i], formatBandRow(block.time, block.bands[i])) && all;
            }
        } else if (filterType_ != 0 && filteredFile_.isOpen()) {
            all = writeAll(filteredFile_, formatFilteredRow(block.time, block.bands[i])) && all;
        }
    }
    return all;
}

void PendingIntervalMap::enter(std::uint64_t sequence, BlockResult result) {
    std::lock_guard<std::mutex> lock(mutex_);
    pending_.emplace(sequence, std::move(result));
    for (auto it = pending_.begin(); it != pending_.end() && it->first == next_;
         it = pending_.erase(it), ++next_) {
        writeLocked(it->second);
    }
}

void PendingIntervalMap::flushAll() {
    std::lock_guard<std::mutex> lock(mutex_);
    for (const auto& [sequence, result] : pending_) {
        writeLocked(result);
        next_ = sequence + 1;
    }
    pending_.clear();
}

void PendingIntervalMap::writeLocked(const BlockResult& result) {
    if (!result.analysed) return;
    bands_.writeBlock(result);
    if (leq_ != nullptr && !result.leqRows.empty()) leq_->writeRows(result.leqRows);
}

}  // namespace orv
