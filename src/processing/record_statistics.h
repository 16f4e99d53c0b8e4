// Statistics computed from the logger's own 100 ms levels: the time-continuity check, the
// short Leq and the general statistics of each interval. One instance per session, so
// nothing of one session reaches the next.
#pragma once

#include <cstdint>
#include <vector>

#include "config/processing_settings.h"
#include "input/level_data.h"
#include "leq.h"
#include "platform/civil_time.h"
#include "results/general_results.h"
#include "results/leq_results.h"
#include "stats.h"

namespace orv {

struct ShortLeqRecord {
    platform::SystemTime time;  // end of the interval
    std::uint32_t overload = 0;
    float leqDb = 0.0F;
};

class RecordStatistics {
public:
    // `leqWriter` receives the short-Leq rows (may be null when short Leq is off).
    RecordStatistics(const ProcessingSettings& settings, bool triggerOn,
                     GeneralResultsWriter& generalWriter, LeqResultsWriter* leqWriter);

    // Marks the current interval when a record does not follow its predecessor by exactly
    // 100 ms (date and hour from the header of the record's file).
    void sequenceCheck(const LevelRecord& r, const DataFileHeader& header);
    // Accumulates the short Leq; closes a short interval at its boundary.
    void stepShortLeq(const LevelRecord& r, const DataFileHeader& header);
    // Accumulates the general statistics; at a statistics boundary writes the interval's
    // row and the short-Leq rows of the interval. False when the general row could not be
    // written.
    bool stepGeneralStatistics(const LevelRecord& r, const DataFileHeader& header);
    // At the end of the session: writes the complete short-Leq intervals that no statistics
    // boundary has written yet, with the current gap mark.
    void finishSession();

    // Set at a statistics boundary when the audio gathered so far is to be dispatched.
    bool takeDispatchRequest();

private:
    float selectedSpl(const LevelRecord& r) const { return useC_ ? r.splC : r.splA; }
    float selectedLeq(const LevelRecord& r) const { return useC_ ? r.leqC : r.leqA; }
    void writeShortLeqRows(std::uint32_t errorMark);

    const ProcessingSettings& settings_;
    const bool useC_;
    const bool leqOn_;
    const bool dispatchEveryBoundary_;
    GeneralResultsWriter& generalWriter_;
    LeqResultsWriter* leqWriter_;

    // Continuity check: the hour (as a time) and the tenth of a second within it that the
    // next record should carry.
    bool firstRecord_ = true;
    platform::FileTime expectedHour_ = 0;
    std::uint32_t expectedTenth_ = 0;
    std::uint32_t gapFlag_ = 0;

    SlmLibrary::Stats generalStats_;
    float intervalMinBattery_ = 0.0F;  // lowest non-zero battery reading, 0 when none
    bool intervalOverload_ = false;
    GeneralIntervalRecord row_;

    SlmLibrary::Leq shortLeq_;
    std::vector<ShortLeqRecord> shortLeqList_;
    bool dispatchAtBoundary_ = false;
};

}  // namespace orv
