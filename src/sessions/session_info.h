// The session information file (*.inf): one "KEY: value" setting per line.
#pragma once

#include <cstddef>
#include <string>
#include <string_view>

#include "platform/civil_time.h"
#include "platform/console.h"
#include "sessions/session_record.h"

namespace orv {

// Lines are read in pieces of at most this many characters, as a 260-byte line buffer
// would take them; a longer line arrives as several pieces, each handled as a line.
inline constexpr std::size_t kInfoLinePiece = 259;
// Keys (the text before the first ':') longer than this mark the file as bad.
inline constexpr std::size_t kMaxInfoKeyLength = 49;

// Reads the first *.inf file (in name order) of record.sessionPath into the record's
// fields. False when there is no such file, it cannot be read ("Error opening session INF
// file - %s" is printed then, or the message for a file that is not a regular file or too
// large), or a key was too long (a message names the file and the line); in the last case
// the fields are still filled from the whole file.
bool readSessionInfoFile(SessionRecord& record, platform::Console& out);

// The line rules over the text of an information file (line ends already LF), in time
// linear in its length. False when a key was too long; `firstBadLine` then receives the
// number (from 1) of the first line whose key was too long.
bool parseSessionInfoText(std::string_view text, SessionRecord& record,
                          std::size_t* firstBadLine = nullptr);

// Day, month, year, hour, minute and second from the first run of digits of the line on,
// each number followed by exactly one separator character of any kind. Day of week and
// milliseconds are not written.
void parseDateTime(std::string_view line, platform::SystemTime& time);

// The value part of a line: the text from two characters after its first ':' (the colon
// and one separator) to the end of the line as read, line feed included. Empty when there
// is no colon or nothing follows it.
std::string copyLineValue(std::string_view line);

}  // namespace orv
