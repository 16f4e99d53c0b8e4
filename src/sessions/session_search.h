// The search for sessions under the search paths.
//
// A session directory is a directory with a subdirectory named exactly "data.000". It is
// accepted when it also holds a readable information file (*.inf) and at least one level
// data file (*.csv) in a subdirectory whose name begins with "data". The walk builds
// absolute paths instead of changing the process's current directory, so relative search
// paths stay valid for the whole run.
#pragma once

#include <cstdint>
#include <string>
#include <string_view>
#include <vector>

#include "config/processing_settings.h"
#include "platform/console.h"
#include "sessions/search_paths.h"
#include "sessions/session_record.h"

namespace orv {

// Walks every search path and fills the table; returns the table's count.
std::uint32_t findSessions(const SearchPathList& paths, const ProcessingSettings& settings,
                           SessionTable& table, platform::Console& out);

// The state of one search: where results go and what the walk has seen so far.
struct SessionSearch {
    SessionSearch(const ProcessingSettings& s, SessionTable& t, platform::Console& o);

    const ProcessingSettings& settings;
    SessionTable& table;
    platform::Console& out;
    // Canonical directory of every table entry, in table order.
    std::vector<std::string> acceptedDirectories;
    // Canonical directories being scanned, outermost first; a directory that is its own
    // ancestor (a symbolic link loop) is not entered again.
    std::vector<std::string> walk;
};

// Adds every session directory below `path` (subdirectories; with recursiveSearch at any
// depth). Returns the result of the last candidate or recursive scan made in it, not an
// accumulation: findSessions tests the search path itself as a session only when this is
// false. False also when `path` cannot be entered or is empty.
bool scanDirectory(SessionSearch& search, const std::string& path);

// True when `path` holds a directory named exactly "data.000" (case-sensitive).
bool hasDataDirectory(const std::string& path);

// Considers one candidate: `name` is a subdirectory of `parentDir` (isGivenPath false) or a
// search path as given (isGivenPath true; parentDir unused). True when it was added or was
// a duplicate of an accepted session, false when it was refused.
bool addSession(SessionSearch& search, const std::string& name, bool isGivenPath,
                const std::string& parentDir);

// The candidate's session path: a given path with one trailing separator, or the parent
// directory, a separator (none after a root such as "/"), the name and a separator.
std::string buildSessionPath(const std::string& name, bool isGivenPath,
                             const std::string& parentDir);

// Fills record.dataFiles (or record.waveFiles for a "*.wav" pattern) from every directory
// of record.sessionPath whose name begins with "data", in directory order. True when any
// of them contributed a file.
bool listSessionFiles(SessionRecord& record, const std::string& pattern);

// Appends "dir/name" for every file matching `pattern` in base/dir. True when one was added.
bool listFilesInDirectory(const std::string& base, const std::string& dir,
                          const std::string& pattern, std::vector<std::string>& list);

// Byte-wise comparison of `a` with `b` over the length of `a` (strncmp with the length of
// a): 0 also when a is a leading part of b.
int comparePrefix(std::string_view a, std::string_view b);

// Sorts file paths into ascending byte order (comparePrefix order, a leading part first).
void sortFileList(std::vector<std::string>& list);

}  // namespace orv
