// The command line: option words, values, messages, and the usage text.
#pragma once

#include <cstdint>

#include "config/processing_settings.h"
#include "platform/console.h"

namespace orv {

struct SearchPathList;

inline constexpr double kToolVersion = 3.6;

// Non-zero when the command line is usable (both a search path and a valid output
// directory given, no refused option). Writes the settings and the search path list.
int parseCommandLine(int argc, const char* const* argv, ProcessingSettings& settings,
                     SearchPathList& paths, platform::Console& out);
void printUsage(platform::Console& out);

// Whole text, any case: "A" 1, "C" 2, "Z" 0. Anything else prints the invalid frequency
// weighting message and returns 0 with the code left at A.
int parseFreqWeightingLetter(const char* text, std::uint32_t& code, platform::Console& out);
// "F" 2, "S" 3, "N" 0; anything else prints its message, code left at F.
int parseTimeWeightingLetter(const char* text, std::uint32_t& code, platform::Console& out);

}  // namespace orv
