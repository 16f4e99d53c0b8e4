// Setters of the analysis settings with their validation and confirmations, the percentile
// list, the interval rule, start-up defaults and release.
#pragma once

#include <cstddef>
#include <cstdint>

#include "config/processing_settings.h"
#include "platform/console.h"

namespace orv {

struct SearchPathList;
struct SessionTable;

// 60 is stored as 0; other accepted values as they are. 1 on success, 0 when refused
// (nothing stored, nothing printed).
int setStatsInterval(ProcessingSettings& s, std::uint32_t minutes, platform::Console& out);
int setLeqInterval(ProcessingSettings& s, std::uint32_t seconds, platform::Console& out);
// type 1 gives 12 bands, 3 gives 36.
void setOctaveBands(ProcessingSettings& s, std::uint32_t type, platform::Console& out);
void setOctaveTimeWeighting(ProcessingSettings& s, std::uint32_t code, platform::Console& out);
void setOctaveFreqWeighting(ProcessingSettings& s, std::uint32_t code, platform::Console& out);
void setGeneralWeighting(ProcessingSettings& s, std::uint32_t code);
void setAuxFilter(ProcessingSettings& s, std::uint32_t type, const float freqs[2],
                  const std::uint32_t bands[2], std::uint32_t fw, std::uint32_t tw,
                  platform::Console& out);

// Replaces the list with `count` values sorted ascending (equal values all stay). 0 when
// count is 0 or storage cannot be had (the list is then empty).
int configurePercentiles(ProcessingSettings& s, const float* values, std::size_t count,
                         platform::Console& out);
bool isSortedAscending(const float* values, std::size_t count);

// 1 when `interval` is 0 and `value` is 0, or `interval` is not 0 and divides `value`.
int isIntervalBoundary(std::uint16_t value, std::uint16_t interval);

// Start-up state. `vectorStartupStatus` is the vector-kernel start-up status (20: generic
// code path). 0 when the default percentile list cannot be stored.
int initDefaults(ProcessingSettings& s, SearchPathList& paths, SessionTable& sessions,
                 int vectorStartupStatus, platform::Console& out);
void releaseLists(ProcessingSettings& s, SearchPathList& paths, SessionTable& sessions);

}  // namespace orv
