// Name tables of the weightings and filter bands. These texts appear in result file names
// and headers, so they never change.
#include <array>

#include "fweight.h"
#include "octave_filter.h"
#include "tweight.h"

namespace SlmLibrary {
namespace {

constexpr const char* kUnknown = "?";

constexpr std::array<const char*, 3> kFWeightShort = {"Z", "A", "C"};
constexpr std::array<const char*, 3> kFWeightLong = {"Z", "A", "C"};
constexpr std::array<const char*, 4> kTWeightShort = {"N", "I", "F", "S"};
constexpr std::array<const char*, 4> kTWeightLong = {"None", "Impulse", "Fast", "Slow"};

constexpr std::array<const char*, kFullOctaveBandCount> kFullNames = {
    "8Hz",   "16Hz", "31.5Hz", "63Hz", "125Hz", "250Hz",
    "500Hz", "1kHz", "2kHz",   "4kHz", "8kHz",  "16kHz"};

constexpr std::array<const char*, kThirdOctaveBandCount> kThirdNames = {
    "6.3Hz",   "8Hz",   "10Hz",  "12.5Hz", "16Hz",  "20Hz",    "25Hz",    "31.5Hz", "40Hz",
    "50Hz",    "63Hz",  "80Hz",  "100Hz",  "125Hz", "160Hz",   "200Hz",   "250Hz",  "315Hz",
    "400Hz",   "500Hz", "630Hz", "800Hz",  "1kHz",  "1.25kHz", "1.6kHz",  "2kHz",   "2.5kHz",
    "3.15kHz", "4kHz",  "5kHz",  "6.3kHz", "8kHz",  "10kHz",   "12.5kHz", "16kHz",  "20kHz"};

template <std::size_t N>
const char* lookup(const std::array<const char*, N>& table, unsigned code) {
    return code < N ? table[code] : kUnknown;
}

}  // namespace

const char* FWeight::shortName(unsigned code) { return lookup(kFWeightShort, code); }
const char* FWeight::longName(unsigned code) { return lookup(kFWeightLong, code); }
const char* TWeight::shortName(unsigned code) { return lookup(kTWeightShort, code); }
const char* TWeight::longName(unsigned code) { return lookup(kTWeightLong, code); }
const char* OctaveFilter::getFullName(unsigned band) { return lookup(kFullNames, band); }
const char* OctaveFilter::getThirdName(unsigned band) { return lookup(kThirdNames, band); }

}  // namespace SlmLibrary
