#include "processing/record_statistics.h"

#include "config/settings.h"
#include "dsp.h"
#include "fweight.h"

namespace orv {

namespace {

constexpr std::uint32_t kTenthsPerHour = 36000;
constexpr platform::FileTime kTicksPerHour = 3600ULL * platform::kTicksPerSecond;
// The hour of a header whose date cannot be converted: records are then only compared
// within the hour.
constexpr platform::FileTime kUnknownHour = ~0ULL;

platform::FileTime hourOf(const DataFileHeader& h) {
    platform::SystemTime t;
    t.year = h.year;
    t.month = h.month;
    t.day = h.day;
    t.hour = h.hour;
    platform::FileTime f = 0;
    return platform::systemTimeToFileTime(t, f) ? f : kUnknownHour;
}

std::uint32_t tenthOfHour(const LevelRecord& r) {
    return r.minute * 600U + r.second * 10U + r.tenth;
}

}  // namespace

RecordStatistics::RecordStatistics(const ProcessingSettings& settings, bool triggerOn,
                                   GeneralResultsWriter& generalWriter, LeqResultsWriter* leqWriter)
    : settings_(settings),
      useC_(settings.generalWeighting == SlmLibrary::FWeight::C),
      leqOn_(settings.leqOn() && leqWriter != nullptr),
      dispatchEveryBoundary_(!triggerOn || settings.triggeredHandling == 0),
      generalWriter_(generalWriter),
      leqWriter_(leqWriter),
      shortLeq_(0.0, 0.0, false) {
    row_.percentileValues.resize(settings.percentiles.size());
    generalStats_.setUpPercentiles(settings.percentiles.data(), settings.percentiles.size());
}

void RecordStatistics::sequenceCheck(const LevelRecord& r, const DataFileHeader& header) {
    const platform::FileTime hour = hourOf(header);
    const std::uint32_t tenth = tenthOfHour(r);
    // A time with a field out of its range (0:60.0, 0:29.10) is never the expected time, even
    // where its fields add up to it. It stands where the expected record should be, so it is
    // marked without re-synchronising.
    const bool inRange = r.minute < 60 && r.second < 60 && r.tenth < 10;
    if (firstRecord_) {
        firstRecord_ = false;
        expectedHour_ = hour;
        expectedTenth_ = inRange ? tenth : 0;
    }
    if (!inRange) {
        gapFlag_ = 1;
    } else if (hour != expectedHour_ || tenth != expectedTenth_) {
        // Every break re-synchronises, so the interval after a marked one is marked only
        // when it has a break of its own.
        gapFlag_ = 1;
        expectedHour_ = hour;
        expectedTenth_ = tenth;
    }
    if (++expectedTenth_ >= kTenthsPerHour) {
        expectedTenth_ = 0;
        if (expectedHour_ != kUnknownHour) expectedHour_ += kTicksPerHour;
    }
}

void RecordStatistics::stepShortLeq(const LevelRecord& r, const DataFileHeader& header) {
    const float leq = selectedLeq(r);
    shortLeq_.AddSamples(&leq, 1, true);
    if (r.status == 1) shortLeq_.setOverload(true);
    if (r.tenth != 0 ||
        isIntervalBoundary(r.second, static_cast<std::uint16_t>(settings_.leqInterval)) == 0) {
        return;
    }
    ShortLeqRecord rec;
    rec.time.year = header.year;
    rec.time.month = header.month;
    rec.time.day = header.day;
    rec.time.hour = header.hour;
    rec.time.minute = r.minute;
    rec.time.second = r.second;
    rec.overload = shortLeq_.overload() ? 1U : 0U;
    rec.leqDb = SlmLibrary::Dsp::powerToDb(shortLeq_.meanPower());
    shortLeqList_.push_back(rec);
    shortLeq_.Reset();
}

bool RecordStatistics::stepGeneralStatistics(const LevelRecord& r, const DataFileHeader& header) {
    const float leq = selectedLeq(r);
    SlmLibrary::Leq period(0.0, 0.0, false);
    period.AddSamples(&leq, 1, true);
    generalStats_.addSample(period);
    generalStats_.addSample(selectedSpl(r));
    if (r.battery != 0.0F && (intervalMinBattery_ == 0.0F || r.battery < intervalMinBattery_)) {
        intervalMinBattery_ = r.battery;
    }
    if (r.status == 1) intervalOverload_ = true;

    if (r.tenth != 0 || r.second != 0 ||
        isIntervalBoundary(r.minute, static_cast<std::uint16_t>(settings_.statsIntervalMin)) == 0) {
        return true;
    }
    const SlmLibrary::structResult result = generalStats_.getGenResults();
    const int n =
        generalStats_.getPercentiles(row_.percentileValues.data(), row_.percentileValues.size());
    if (n <= 0) return true;

    row_.lmin = result.lmin;
    row_.lmax = result.lmax;
    row_.gapFlag = gapFlag_;
    gapFlag_ = 0;
    row_.leq = SlmLibrary::Dsp::powerToDb(generalStats_.getLeq());
    row_.day = header.day;
    row_.month = header.month;
    row_.year = header.year;
    row_.hour = header.hour;
    row_.minute = r.minute;
    row_.second = r.second;
    row_.temperature = header.temperature;
    row_.battery = intervalMinBattery_;
    row_.overload = (intervalOverload_ || result.overload != 0 || row_.gapFlag == 1) ? 1U : 0U;

    const bool written = generalWriter_.writeRow(row_);
    writeShortLeqRows(row_.gapFlag);

    generalStats_.reset();
    intervalMinBattery_ = 0.0F;
    intervalOverload_ = false;
    dispatchAtBoundary_ = dispatchEveryBoundary_;
    return written;
}

void RecordStatistics::writeShortLeqRows(std::uint32_t errorMark) {
    if (leqOn_ && !shortLeqList_.empty()) {
        std::vector<LeqRow> rows(shortLeqList_.size());
        for (std::size_t i = 0; i < rows.size(); ++i) {
            rows[i].time = shortLeqList_[i].time;
            rows[i].errorsInInterval = errorMark;
            rows[i].overload = shortLeqList_[i].overload;
            rows[i].levels.assign(1, shortLeqList_[i].leqDb);
        }
        leqWriter_->writeRows(rows);
    }
    shortLeqList_.clear();
}

void RecordStatistics::finishSession() { writeShortLeqRows(gapFlag_); }

bool RecordStatistics::takeDispatchRequest() {
    const bool requested = dispatchAtBoundary_;
    dispatchAtBoundary_ = false;
    return requested;
}

}  // namespace orv
