// Processor and memory facts.
#pragma once

#include <cstdint>

namespace platform {

// Start-up of the vector kernels: 0 when the level library runs its optimised code path, 20
// when it runs the generic one (the processor lacks AVX2 or FMA, or the build has only the
// generic kernels).
inline constexpr int kGenericCodePathStatus = 20;
int vectorKernelStartup();

// Physical cores of the processor; the logical count when it cannot be read.
unsigned physicalCoreCount();
unsigned logicalProcessorCount();

// Bytes of the process currently resident in memory (0 when unknown).
std::uint64_t residentBytes();

}  // namespace platform
