// The general results file: one row of broadband statistics per statistics interval.
#pragma once

#include <cstdint>
#include <string>
#include <vector>

#include "results/result_files.h"
#include "results/result_header.h"

namespace orv {

// One closed statistics interval, stamped with its end time.
struct GeneralIntervalRecord {
    std::uint16_t day = 0, month = 0, year = 0, hour = 0;
    std::uint16_t minute = 0, second = 0;
    std::uint32_t gapFlag = 0;  // a break in the 100 ms sequence was seen in the interval
    std::uint32_t overload = 0;
    float temperature = 0.0F;
    float battery = 0.0F;
    float lmin = 0.0F;
    float lmax = 0.0F;
    float leq = 0.0F;                     // dB
    std::vector<float> percentileValues;  // one level per configured percentile
};

class GeneralResultsWriter {
public:
    explicit GeneralResultsWriter(RunResults& run) : run_(run) {}

    // Creates the file (replacing an old one). False, with the open message, on failure.
    bool open(const std::string& path) { return file_.create(path, run_); }
    void close() { file_.close(); }
    bool isOpen() const { return file_.isOpen(); }

    // Header block (line 6 the frequency weighting, line 7 the time weighting of the session)
    // and the column line. False when the file is not open or a write fell short.
    bool writeHeader(const ResultHeaderInfo& info, std::uint32_t generalTimeWeighting);
    // One row. True when written in full, and when the file is not open (nothing written).
    bool writeRow(const GeneralIntervalRecord& r);

    static std::string formatRow(const GeneralIntervalRecord& r);

private:
    RunResults& run_;
    ResultFile file_;
};

}  // namespace orv
