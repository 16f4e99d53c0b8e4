// Reading one input file whole, and the level data file as the session run takes it: every
// file that gives no records, or not all of its records, is named in a message.
#pragma once

#include <cstdint>
#include <string>
#include <vector>

#include "input/level_data.h"
#include "platform/console.h"
#include "platform/files.h"

namespace orv {

// No real input file comes near this size (an hour of level records is about 1.5 MB); a
// larger one is refused before anything is allocated for it.
inline constexpr std::uint64_t kMaxInputFileSize = 64ULL << 20;

// Prints the message for a file that the platform reader refused as not a regular file,
// too large, or too large for memory. False, with nothing printed, for any other result.
bool reportRefusedFile(platform::ReadResult result, const std::string& path,
                       platform::Console& out);

enum class LevelFileLoad {
    Skipped,    // not read at all: not counted in the progress
    NoRecords,  // read, but empty or without a usable header: `header` is cleared
    Loaded,     // header and records decoded (malformed lines left out)
};

// Checks the header of a level data file's bytes (a real calendar date and hour) and decodes
// its records into `records`. Prints one "ERR: " message naming `path` for whatever it could
// not use. May throw std::bad_alloc.
LevelFileLoad decodeLevelDataFile(const std::string& path, const std::vector<char>& bytes,
                                  DataFileHeader& header, LevelRecordQueue& records,
                                  platform::Console& out);

// Reads the level data file at `path` into `bytes` (reused from file to file), then
// decodeLevelDataFile; a file whose records do not fit in memory is skipped with a message.
LevelFileLoad loadLevelDataFile(const std::string& path, std::vector<char>& bytes,
                                DataFileHeader& header, LevelRecordQueue& records,
                                platform::Console& out);

}  // namespace orv
