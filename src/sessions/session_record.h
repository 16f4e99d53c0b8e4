// What the tool knows of one session, and the table of all sessions of a run.
#pragma once

#include <cstddef>
#include <cstdint>
#include <string>
#include <vector>

#include "platform/civil_time.h"

namespace orv {

struct SessionRecord {
    static constexpr std::size_t kMaxNameLength = 79;
    static constexpr std::size_t kMaxPathLength = 259;

    std::string sessionName;            // at most kMaxNameLength characters
    std::string sessionPath;            // the session directory, ending with the path separator
    std::uint32_t timeWeightingMs = 0;  // 125 (Fast) or n x 1000
    platform::SystemTime sessionStart;
    platform::SystemTime sessionEnd;
    float calibration = 0.0F;  // dB
    float rangeMultiplier = 0.0F;
    std::uint32_t triggerOn = 0;
    std::uint32_t triggerPreRecordLength = 0;  // seconds
    // Paths relative to sessionPath: data directory, separator, file name; sorted.
    std::vector<std::string> dataFiles;
    std::vector<std::string> waveFiles;

    std::uint32_t dataFileCount() const { return static_cast<std::uint32_t>(dataFiles.size()); }
    std::uint32_t waveFileCount() const { return static_cast<std::uint32_t>(waveFiles.size()); }
};

struct SessionTable {
    static constexpr std::size_t kCapacity = 1024;
    std::vector<SessionRecord> entries;  // accepted sessions, in the order they were added

    std::uint32_t count() const { return static_cast<std::uint32_t>(entries.size()); }
};

}  // namespace orv
