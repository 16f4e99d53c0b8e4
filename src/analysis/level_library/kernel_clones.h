// Attributes of the hot processing kernels.
//
// ORV_KERNEL_CLONES compiles a kernel twice, for x86-64-v3 (AVX2, FMA) and for the baseline;
// the loader picks the clone that the processor supports (the platform layer reports the
// generic code path when it lacks AVX2). Under ThreadSanitizer the loader's resolver would run
// before the sanitizer's runtime is ready, so there the baseline code is used alone.
//
// ORV_KERNEL_CONTRACT allows multiply-adds to be fused, which ISO C++ mode turns off: it
// shortens filter recursions and changes results only in the last bit.
#pragma once

#if defined(__x86_64__) && !defined(__SANITIZE_THREAD__)
#define ORV_KERNEL_CLONES __attribute__((target_clones("arch=x86-64-v3", "default")))
#else
#define ORV_KERNEL_CLONES
#endif

#define ORV_KERNEL_CONTRACT __attribute__((optimize("fp-contract=fast")))
