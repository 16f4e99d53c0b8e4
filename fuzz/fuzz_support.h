// Helpers shared by the fuzz targets: a failed check ends the target with a report, and
// each target process gets one scratch directory of its own.
#pragma once

#include <cstdio>
#include <cstdlib>
#include <string>

namespace fuzz {

// Unlike assert, also active in release builds.
#define FUZZ_CHECK(condition)                                                                  \
    do {                                                                                       \
        if (!(condition)) {                                                                    \
            std::fprintf(stderr, "%s:%d: check failed: %s\n", __FILE__, __LINE__, #condition); \
            std::abort();                                                                      \
        }                                                                                      \
    } while (false)

// A fresh directory (in /dev/shm when possible, else under the system's temporary
// directory), made once per process and removed when it ends.
const std::string& scratchDirectory();

// Removes everything below `dir` (not `dir` itself).
void emptyDirectory(const std::string& dir);

}  // namespace fuzz
