// Frequency weighting (IEC 61672-1 A, C and Z) and its name tables.
#pragma once

#include <cstddef>

namespace SlmLibrary {

class FWeight {
public:
    // Codes stored in settings and passed between modules. 5 selects the three outputs of
    // ProcessAll (Z, C and A of one input).
    enum FWeightEnum : unsigned { Z = 0, A = 1, C = 2, All = 5 };

    // Name texts used in result file names ("A") and headers ("A"). A code outside the
    // table gives "?".
    static const char* shortName(unsigned code);
    static const char* longName(unsigned code);
};

}  // namespace SlmLibrary
