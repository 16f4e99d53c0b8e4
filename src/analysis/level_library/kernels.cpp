#include "kernels.h"

#include <cstddef>

namespace SlmLibrary {
namespace {

typedef double V4d __attribute__((vector_size(32)));
typedef float V8f __attribute__((vector_size(32)));
typedef float V4f __attribute__((vector_size(16)));
typedef long long V4l __attribute__((vector_size(32)));
typedef int V4i __attribute__((vector_size(16)));
typedef int V8i __attribute__((vector_size(32)));

namespace generic {
constexpr const char* kTableName = "generic";
#define ORV_KERNEL_TARGET
#include "kernel_bodies.h"
#undef ORV_KERNEL_TARGET
}  // namespace generic

#if defined(__x86_64__) && !defined(ORV_GENERIC_KERNELS)
#define ORV_HAVE_AVX2_KERNELS 1
namespace avx2 {
constexpr const char* kTableName = "avx2";
// Fused multiply-adds shorten the filter recursions; ISO C++ mode does not fuse by itself.
#if defined(__clang__)
#define ORV_KERNEL_TARGET __attribute__((target("avx2,fma")))
#pragma clang fp contract(fast)
#else
#define ORV_KERNEL_TARGET __attribute__((target("avx2,fma"), optimize("fp-contract=fast")))
#endif
#include "kernel_bodies.h"
#undef ORV_KERNEL_TARGET
}  // namespace avx2
#endif

}  // namespace

const KernelTable& genericKernels() { return generic::kTable; }

const KernelTable* avx2Kernels() {
#if defined(ORV_HAVE_AVX2_KERNELS)
    static const bool kSupported = __builtin_cpu_supports("avx2") && __builtin_cpu_supports("fma");
    return kSupported ? &avx2::kTable : nullptr;
#else
    return nullptr;
#endif
}

const KernelTable& kernels() {
    static const KernelTable& kChosen =
        avx2Kernels() != nullptr ? *avx2Kernels() : genericKernels();
    return kChosen;
}

}  // namespace SlmLibrary
