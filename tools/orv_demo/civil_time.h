// Calendar date and time of day without a time zone, as the logger stamps its files, and
// whole seconds counted from 1970-01-01 00:00:00 for arithmetic.
#pragma once

#include <cstdint>
#include <optional>
#include <string>

namespace orv_demo {

struct CivilTime {
    int year = 1970;
    unsigned month = 1, day = 1, hour = 0, minute = 0, second = 0;
};

// Fails for dates that do not exist (2023-02-29) and fields out of range.
std::optional<std::int64_t> toSeconds(const CivilTime& t);
CivilTime fromSeconds(std::int64_t seconds);

// "YYYY-MM-DD HH:MM:SS" (a 'T' may stand for the blank); nothing else on the line.
std::optional<CivilTime> parseCivilTime(const std::string& text);

}  // namespace orv_demo
