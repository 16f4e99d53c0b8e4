#include "civil_time.h"

#include <chrono>
#include <cstdio>

namespace orv_demo {

namespace chr = std::chrono;

std::optional<std::int64_t> toSeconds(const CivilTime& t) {
    const chr::year_month_day date{chr::year{t.year}, chr::month{t.month}, chr::day{t.day}};
    if (!date.ok() || t.hour > 23 || t.minute > 59 || t.second > 59) return std::nullopt;
    const std::int64_t days = chr::sys_days{date}.time_since_epoch().count();
    return days * 86400 + t.hour * 3600 + t.minute * 60 + t.second;
}

CivilTime fromSeconds(std::int64_t seconds) {
    const std::int64_t days = (seconds >= 0 ? seconds : seconds - 86399) / 86400;
    const std::int64_t ofDay = seconds - days * 86400;
    const chr::year_month_day date{chr::sys_days{chr::days{days}}};
    CivilTime t;
    t.year = static_cast<int>(date.year());
    t.month = static_cast<unsigned>(date.month());
    t.day = static_cast<unsigned>(date.day());
    t.hour = static_cast<unsigned>(ofDay / 3600);
    t.minute = static_cast<unsigned>(ofDay / 60 % 60);
    t.second = static_cast<unsigned>(ofDay % 60);
    return t;
}

std::optional<CivilTime> parseCivilTime(const std::string& text) {
    CivilTime t;
    char sep = 0;
    int used = 0;
    if (std::sscanf(text.c_str(), "%4d-%2u-%2u%c%2u:%2u:%2u%n", &t.year, &t.month, &t.day, &sep,
                    &t.hour, &t.minute, &t.second, &used) != 7 ||
        (sep != ' ' && sep != 'T') || static_cast<std::size_t>(used) != text.size() ||
        text.size() != 19 || !toSeconds(t)) {
        return std::nullopt;
    }
    return t;
}

}  // namespace orv_demo
