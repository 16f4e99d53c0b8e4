// The search for sessions under the search paths.
#pragma once

#include <cstdint>

#include "config/processing_settings.h"
#include "platform/console.h"
#include "sessions/search_paths.h"
#include "sessions/session_record.h"

namespace orv {

// Walks every search path and fills the table; returns the table's count.
std::uint32_t findSessions(const SearchPathList& paths, const ProcessingSettings& settings,
                           SessionTable& table, platform::Console& out);

}  // namespace orv
