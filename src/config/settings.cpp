#include "config/settings.h"

#include <algorithm>
#include <cmath>
#include <new>

#include "fweight.h"
#include "sessions/search_paths.h"
#include "sessions/session_record.h"
#include "tweight.h"

namespace orv {

const std::int32_t kAcceptedFilterFrequencies[kAcceptedFilterFrequencyCount] = {
    25,  31,   40,   50,   63,   80,   100,  125,  160,  200,  250,  316,   400,   500,   630,
    800, 1000, 1250, 1600, 2000, 2500, 3160, 4000, 5000, 6300, 8000, 10000, 12500, 16000, 20000};

float bandEdge(std::size_t k) {
    return static_cast<float>(std::pow(10.0, 1.35 + static_cast<double>(k) / 10.0));
}

namespace {

constexpr std::uint32_t kStatsIntervals[] = {0, 1, 2, 3, 4, 5, 10, 15, 20, 30};
constexpr std::uint32_t kLeqIntervals[] = {0, 1, 2, 4, 10, 20, 30};

template <std::size_t N>
bool contains(const std::uint32_t (&table)[N], std::uint32_t v) {
    return std::find(std::begin(table), std::end(table), v) != std::end(table);
}

constexpr float kDefaultPercentiles[] = {1, 5, 10, 25, 50, 75, 90, 99};

}  // namespace

int setStatsInterval(ProcessingSettings& s, std::uint32_t minutes, platform::Console& out) {
    if (minutes == 60) minutes = 0;
    if (!contains(kStatsIntervals, minutes)) return 0;
    s.statsIntervalMin = minutes;
    out.print("Using %umin statistics interval length\r\n", minutes);
    return 1;
}

int setLeqInterval(ProcessingSettings& s, std::uint32_t seconds, platform::Console& out) {
    if (seconds == 60) seconds = 0;
    if (!contains(kLeqIntervals, seconds)) return 0;
    s.leqInterval = seconds;
    out.print("Using %umin Leq interval length\r\n", seconds);
    return 1;
}

void setOctaveBands(ProcessingSettings& s, std::uint32_t type, platform::Console& out) {
    s.octaveBandCount = type == 3 ? 36 : 12;
    out.print("Enabled octave filter bank\r\n");
}

void setOctaveTimeWeighting(ProcessingSettings& s, std::uint32_t code, platform::Console& out) {
    s.octaveTimeWeighting = code;
    out.print("Using %s time weighting\r\n", SlmLibrary::TWeight::longName(code));
}

void setOctaveFreqWeighting(ProcessingSettings& s, std::uint32_t code, platform::Console& out) {
    s.octaveFreqWeighting = code;
    out.print("Using %s frequency weighting\r\n", SlmLibrary::FWeight::longName(code));
}

void setGeneralWeighting(ProcessingSettings& s, std::uint32_t code) { s.generalWeighting = code; }

void setAuxFilter(ProcessingSettings& s, std::uint32_t type, const float freqs[2],
                  const std::uint32_t bands[2], std::uint32_t fw, std::uint32_t tw,
                  platform::Console& out) {
    s.auxFilterType = type;
    s.auxFreqWeighting = fw;
    s.auxTimeWeighting = tw;
    const auto t = static_cast<AuxFilterType>(type);
    if (t == AuxFilterType::BandPass || t == AuxFilterType::BandStop) {
        s.auxFreq1 = freqs[0];
        s.auxFreq2 = freqs[1];
        s.auxBand1 = bands[0];
        s.auxBand2 = bands[1];
    } else if (t == AuxFilterType::LowPass || t == AuxFilterType::HighPass) {
        s.auxFreq1 = freqs[0];
        s.auxBand1 = bands[0];
    }
    out.print("Enabled aux filter bank\r\n");
}

bool isSortedAscending(const float* values, std::size_t count) {
    for (std::size_t i = 1; i < count; ++i) {
        if (!(values[i] >= values[i - 1])) return false;  // NaN pairs count as out of order
    }
    return true;
}

int configurePercentiles(ProcessingSettings& s, const float* values, std::size_t count,
                         platform::Console& out) {
    s.percentiles.clear();
    s.percentiles.shrink_to_fit();
    if (count == 0) return 0;
    try {
        s.percentiles.assign(values, values + count);
    } catch (const std::bad_alloc&) {
        s.percentiles.clear();
        return 0;
    }
    // Not-a-number values never get here (the command line refuses them), but the order
    // must end whatever the values are: a stable sort with NaN last.
    std::stable_sort(s.percentiles.begin(), s.percentiles.end(), [](float a, float b) {
        if (std::isnan(a)) return false;
        if (std::isnan(b)) return true;
        return a < b;
    });
    out.print("Configured %u percentiles\r\n", static_cast<unsigned>(count));
    return 1;
}

int isIntervalBoundary(std::uint16_t value, std::uint16_t interval) {
    if (interval == 0) return value == 0 ? 1 : 0;
    return value % interval == 0 ? 1 : 0;
}

int initDefaults(ProcessingSettings& s, SearchPathList& paths, SessionTable& sessions,
                 int vectorStartupStatus, platform::Console& out) {
    if (vectorStartupStatus == 20) {
        out.print("MSG: Non Intel Processor found. px version of code was set\r\n");
    }
    s = ProcessingSettings{};
    s.statsIntervalMin = 15;
    s.leqInterval = ProcessingSettings::kLeqOff;
    s.octaveFreqWeighting = SlmLibrary::FWeight::A;
    s.octaveBandCount = 0;
    s.auxFilterType = 0;
    s.auxFreq2 = 0.0F;
    s.auxFreq1 = 0.0F;
    s.generalWeighting = SlmLibrary::FWeight::A;
    s.octaveTimeWeighting = SlmLibrary::TWeight::F;
    out.print("Using %s time weighting\r\n", SlmLibrary::TWeight::longName(s.octaveTimeWeighting));
    if (configurePercentiles(s, kDefaultPercentiles, std::size(kDefaultPercentiles), out) == 0) {
        return 0;
    }
    s.statsIntervalMin = 15;
    out.print("Using %umin statistics interval length\r\n", s.statsIntervalMin);
    paths.clear();
    sessions.entries.clear();
    s.recursiveSearch = 0;
    return 1;
}

void releaseLists(ProcessingSettings& s, SearchPathList& paths, SessionTable& sessions) {
    paths.clear();
    sessions.entries.clear();
    s.recursiveSearch = 0;
    s.percentiles.clear();
    s.percentiles.shrink_to_fit();
}

}  // namespace orv
