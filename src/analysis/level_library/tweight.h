// Time weighting (exponential averaging of the squared signal) and its name tables.
#pragma once

#include <cstddef>

namespace SlmLibrary {

class TWeight {
public:
    // N: no exponential averaging; I: impulse (never selected by the tool); F: 125 ms; S: 1 s.
    enum TWeightEnum : unsigned { N = 0, I = 1, F = 2, S = 3 };

    // Short texts for file names ("F"), long texts for headers and messages ("Fast").
    // A code outside the table gives "?".
    static const char* shortName(unsigned code);
    static const char* longName(unsigned code);
};

}  // namespace SlmLibrary
