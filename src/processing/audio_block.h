// An audio block: the audio of a run of accepted 100 ms records, gathered by the session
// driver and analysed as one piece by a worker (normally one statistics interval).
#pragma once

#include <cstddef>
#include <cstdint>
#include <vector>

#include "input/level_data.h"
#include "input/wave_file.h"
#include "platform/civil_time.h"

namespace orv {

// What a block keeps of each accepted record besides its audio.
struct BlockPeriod {
    platform::SystemTime time;  // end of the period (the tenth in milliseconds, x 100)
    float battery = 0.0F;       // the record's battery reading
    std::uint32_t status = 0;   // 1: the record was overloaded
    std::uint32_t header = 0;   // index of its data file's header in AudioBlock::headers
};

struct AudioBlock {
    // Blocks of a session are numbered from 0 in the order they are dispatched; results
    // are written in that order.
    std::uint64_t sequence = 0;
    // Date and hour of the data file, minute and second of the last record offered to the
    // block, accepted or not, and its tenth of a second in the milliseconds field.
    platform::SystemTime time;
    AudioSpans audio;                     // 4800 samples per accepted record
    std::vector<std::uint32_t> marks;     // per accepted record: 1 = other gain range
    std::vector<BlockPeriod> periods;     // per accepted record
    std::vector<DataFileHeader> headers;  // of the data files the records came from
    // The audio of the same recording just before the block, and its marks.
    AudioSpans preRoll;
    std::vector<std::uint32_t> preRollMarks;
    // The first period directly follows earlier audio of the same recording.
    bool continuesRecording = false;
    float minBattery = 15.0F;       // lowest battery reading of the accepted records
    float temperature = 0.0F;       // of the data file, at dispatch
    std::uint32_t statusFlags = 0;  // OR of the accepted records' status

    std::size_t periodCount() const { return marks.size(); }
    std::uint64_t sampleCount() const { return std::uint64_t{marks.size()} * kPeriodSamples; }

    // Stamps the block with a record offered to it.
    void stamp(const LevelRecord& r, const DataFileHeader& header);
    // Adds an accepted record (stamped first) and its audio.
    void add(const LevelRecord& r, const DataFileHeader& header, const AudioSpans& period);
};

}  // namespace orv
