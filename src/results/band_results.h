// The octave band files (one per band) and the filtered channel file: one row of statistics
// per analysed audio block, and the pending results of a session's blocks, written in the
// order the blocks were dispatched whatever order their analyses finish in.
#pragma once

#include <cstdint>
#include <map>
#include <mutex>
#include <string>
#include <vector>

#include "analysis/band_interval_result.h"
#include "results/leq_results.h"
#include "results/result_files.h"
#include "results/result_header.h"

namespace orv {

class BandResultsWriter {
public:
    explicit BandResultsWriter(RunResults& run) : run_(run) {}

    // Creates one file per band, in band order. False (message printed) at the first that
    // cannot be created; the files already created stay open until close.
    bool openBandFiles(const ResultNaming& naming, std::uint32_t bandCount);
    bool openFilteredFile(const std::string& path, std::uint32_t filterType);
    void close();

    // Header block and column line of every band file. False when a file is not open or a
    // write fell short; the bands after it get no header.
    bool writeBandHeaders(const ResultHeaderInfo& info, std::uint32_t freqWeighting,
                          std::uint32_t timeWeighting);
    bool writeFilteredHeader(const ResultHeaderInfo& info, std::uint32_t freqWeighting,
                             std::uint32_t timeWeighting);

    // The rows of one block: result i to band file i, the result after the bands to the
    // filtered channel file. False when a write fell short.
    bool writeBlock(const BlockResult& block);

    static std::string formatBandRow(const platform::SystemTime& t, const BandIntervalResult& r);
    static std::string formatFilteredRow(const platform::SystemTime& t,
                                         const BandIntervalResult& r);

private:
    RunResults& run_;
    std::uint32_t bandCount_ = 0;
    std::vector<ResultFile> bandFiles_;
    std::uint32_t filterType_ = 0;
    ResultFile filteredFile_;
};

// Results of analysed blocks waiting for their turn. Each block is entered under its
// sequence number; a block's rows are written once every earlier block of the session has
// been written or has failed, so the files come out the same for any number of workers.
class PendingIntervalMap {
public:
    // `leq`: receives the octave short-Leq rows (null when short Leq is off).
    PendingIntervalMap(BandResultsWriter& bands, LeqResultsWriter* leq)
        : bands_(bands), leq_(leq) {}

    // Enters a block's result (analysed or failed) and writes every result whose turn it is.
    void enter(std::uint64_t sequence, BlockResult result);
    // Writes what is left, in order, also past blocks that never reported (end of session).
    void flushAll();

private:
    void writeLocked(const BlockResult& result);

    BandResultsWriter& bands_;
    LeqResultsWriter* leq_;
    std::mutex mutex_;
    std::map<std::uint64_t, BlockResult> pending_;
    std::uint64_t next_ = 0;
};

}  // namespace orv
