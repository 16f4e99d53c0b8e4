// Octave and third-octave filter banks and their band name tables.
#pragma once

#include <cstddef>

namespace SlmLibrary {

// 1/1-octave bands 8 Hz .. 16 kHz, low to high.
enum FullOctaveBandEnum : unsigned { kFullOctaveBandCount = 12 };
// 1/3-octave bands 6.3 Hz .. 20 kHz, low to high.
enum ThirdOctaveBandEnum : unsigned { kThirdOctaveBandCount = 36 };

class OctaveFilter {
public:
    // Nominal mid-band names ("31.5Hz", "1kHz"). A band outside the table gives "?".
    static const char* getFullName(unsigned band);
    static const char* getThirdName(unsigned band);
};

}  // namespace SlmLibrary
