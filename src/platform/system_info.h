// Processor and memory facts.
#pragma once

#include <cstdint>

namespace platform {

// Start-up of the vector kernels: 0 when the optimised code path is usable, 20 when the
// processor lacks the instructions it needs and the generic path was chosen.
inline constexpr int kGenericCodePathStatus = 20;
int vectorKernelStartup();

// Physical cores of the processor; the logical count when it cannot be read.
unsigned physicalCoreCount();
unsigned logicalProcessorCount();

// Bytes of the process currently resident in memory (0 when unknown).
std::uint64_t residentBytes();

}  // namespace platform
