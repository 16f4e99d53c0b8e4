// The twenty-line header block that every result file begins with.
#pragma once

#include <cstdint>
#include <string>
#include <vector>

#include "platform/civil_time.h"

namespace orv {

// Header values of one session, filled when its first data file has been read.
struct ResultHeaderInfo {
    static constexpr std::size_t kMaxSerialNumber = 7;
    static constexpr std::size_t kMaxTitle = 81;

    std::string serialNumber;  // cut to kMaxSerialNumber characters
    std::string title;         // cut to kMaxTitle characters
    std::uint32_t generalWeighting = 0;
    std::uint32_t octaveFreqWeighting = 0;
    std::uint32_t statsIntervalMin = 0;
    std::uint32_t leqInterval = 0;
    std::uint32_t timeWeightingMs = 0;
    std::uint32_t octaveTimeWeighting = 0;
    platform::SystemTime sessionStart;
    platform::SystemTime sessionEnd;
    std::vector<float> percentiles;
};

// Interval settings store 60 as 0; headers and file names show 60.
inline std::uint32_t displayInterval(std::uint32_t stored) { return stored == 0 ? 60 : stored; }

// The common block. `firstLine` is the whole first line (quotes and line end included);
// `leqLengthSeconds` fills line 12 with "<n> sec" when non-zero, else "Not Applicable".
std::string formatHeaderBlock(const ResultHeaderInfo& info, const std::string& firstLine,
                              const char* frequencyWeighting, const char* timeAveraging,
                              std::uint32_t leqLengthSeconds);

inline constexpr const char* kGeneralFirstLine =
    "\"Quellmark -  Type 1 Environmental Noise Logger\"\r\n";

// A percentile as a whole number, truncated toward zero (99.9 gives 99); values beyond the
// range of int are clamped.
int truncatePercentile(float percent);

// "\"L<n>\"," for every percentile, truncated toward zero (99.9 gives L99).
std::string percentileLabels(const std::vector<float>& percentiles);

}  // namespace orv
