// The wave files of one session, consumed in list order in step with the 100 ms level
// records, and the gate that decides for each record whether its 100 ms of audio is taken.
//
// Untriggered sessions hold continuous audio: every record takes the next 100 ms of the
// wave files, from the first file on, a period running on into the next file where one
// ends. Triggered sessions hold one recording per trigger (possibly split over several
// files): a record is taken when its time t lies in the open file's range,
// start < t <= end, and its audio is found in the file by that time.
//
// Audio is never read here: the cursor hands out positions in the open files (AudioSpans),
// and whoever analyses a period reads it from there.
#pragma once

#include <cstddef>
#include <cstdint>
#include <deque>
#include <memory>
#include <vector>

#include "input/level_data.h"
#include "input/wave_file.h"
#include "platform/civil_time.h"
#include "platform/console.h"
#include "sessions/session_record.h"

namespace orv {

// The time that ends a record's 100 ms: date and hour of its file's header, minute, second
// and tenth of the record. False when these do not make a valid time.
bool recordEndTime(const DataFileHeader& header, const LevelRecord& r, platform::FileTime& out);

class WaveCursor {
public:
    // `historyPeriods`: how many periods of a recording the cursor remembers before the
    // latest one, for the pre-roll of the block that starts there.
    WaveCursor(const SessionRecord& session, std::size_t historyPeriods, platform::Console& out);

    struct Decision {
        bool accepted = false;
        // The block gathered so far ends before this record: a triggered recording's range
        // was left, or a new recording starts right after the previous one.
        bool endsBlock = false;
        // An accepted period directly follows the previous one in the same recording.
        bool continuesRecording = false;
    };

    // Gates the record's 100 ms of audio. When accepted, `period` holds its 4800 samples.
    Decision gate(const LevelRecord& r, const DataFileHeader& header, AudioSpans& period);

    // The audio of the same recording before the last accepted period (at most
    // historyPeriods periods) and its range marks; empty at the start of a recording.
    void precedingAudio(AudioSpans& audio, std::vector<std::uint32_t>& marks) const;

    // An untriggered session's audio has stopped for good (a wave file could not be used).
    bool stopped() const { return stopped_; }

private:
    enum class Open { Opened, Failed, NoneLeft };

    Open openNext();
    void closeFile();
    Decision gateContinuous(AudioSpans& period);
    Decision gateTriggered(const LevelRecord& r, const DataFileHeader& header, AudioSpans& period);
    Decision finish(bool accepted, bool continuesRecording, std::uint32_t mark,
                    const AudioSpans& period);
    void printTime(platform::FileTime t, const char* end);

    const SessionRecord& session_;
    platform::Console& out_;
    const bool triggered_;
    const platform::FileTime preRecord_;
    const std::size_t historyPeriods_;

    std::uint32_t nextFile_ = 0;
    std::shared_ptr<WaveSource> file_;  // null when none is open
    bool fileStartsRecording_ = false;
    std::uint64_t audioStart_ = 0;  // byte offset of the first sample
    std::uint64_t position_ = 0;    // first byte not yet handed out (or skipped)
    std::uint64_t audioEnd_ = 0;    // end of the usable audio
    platform::FileTime startTime_ = 0;
    platform::FileTime endTime_ = 0;
    bool hasPrevious_ = false;
    platform::FileTime previousEnd_ = 0;
    std::uint64_t continuationSeconds_ = 0;
    bool wasInRange_ = false;
    std::uint64_t fileSerial_ = 0;      // counts the files opened
    std::uint64_t lastFileSerial_ = 0;  // file of the last accepted period (0: none)
    bool stopped_ = false;

    struct PastPeriod {
        AudioSpans audio;
        std::uint32_t mark = 0;
    };
    std::deque<PastPeriod> history_;  // the current recording's latest periods, oldest first
};

}  // namespace orv
