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
typedef long long V2l __attribute__((vector_size(16)));

// Lane-wise select and element broadcast. AVX: the vector forms, one instruction each.
// Generic (vectors of two SSE registers): bit operations, which stay vector code.
#define ORV_SELECT_BITS(out, mask, a, b)          \
    do {                                          \
        auto m_ = (mask);                         \
        decltype(m_) a_, b_;                      \
        __builtin_memcpy(&a_, &(a), sizeof a_);   \
        __builtin_memcpy(&b_, &(b), sizeof b_);   \
        m_ = (a_ & m_) | (b_ & ~m_);              \
        __builtin_memcpy(&(out), &m_, sizeof m_); \
    } while (false)
#define ORV_SELECT_VECTOR(out, mask, a, b) ((out) = (mask) ? (a) : (b))

// Running maxima and minima (a = a > b ? a : b, a = a < b ? a : b) of four doubles or of
// four or eight floats. Generic: the SSE2 instructions on each 16-byte part.
typedef double V2d __attribute__((vector_size(16)));
#define ORV_PARTS_SSE2(a, b, op, part)                                                      \
    do {                                                                                    \
        part pa_[sizeof(a) / 16], pb_[sizeof(a) / 16];                                      \
        __builtin_memcpy(pa_, &(a), sizeof(a));                                             \
        __builtin_memcpy(pb_, &(b), sizeof(a));                                             \
        for (std::size_t i_ = 0; i_ < sizeof(a) / 16; ++i_) pa_[i_] = op(pa_[i_], pb_[i_]); \
        __builtin_memcpy(&(a), pa_, sizeof(a));                                             \
    } while (false)
#define ORV_ASSIGN_IF(a, b, cmp) ((a) = (a)cmp(b) ? (a) : (b))

namespace generic {
constexpr const char* kTableName = "generic";
constexpr bool kIirBlocks = false;
#define ORV_MAX_D(a, b) ORV_PARTS_SSE2(a, b, __builtin_ia32_maxpd, V2d)
#define ORV_MIN_D(a, b) ORV_PARTS_SSE2(a, b, __builtin_ia32_minpd, V2d)
#define ORV_MAX_F(a, b) ORV_PARTS_SSE2(a, b, __builtin_ia32_maxps, V4f)
#define ORV_KERNEL_TARGET
#define ORV_SELECT ORV_SELECT_BITS
#define ORV_BROADCAST(v, k) ((v)[k] - V4d{})
#define ORV_BROADCAST_LOAD(out, p) ((out) = *(p)-V4d{})
#define ORV_BROADCAST_F(out, v, k) ((out) = (v)[k] - V8f{})
#define ORV_ALL_SET(v) (((v)[0] & (v)[1] & (v)[2] & (v)[3]) == -1)
#define ORV_WIDEN(out, v) ((out) = __builtin_convertvector((v), V4d))
#define ORV_NARROW(out, v) ((out) = __builtin_convertvector((v), V4f))
#define ORV_NARROW_KERNELS
#include "kernel_bodies.h"
#include "kernel_narrow.h"
#undef ORV_NARROW_KERNELS
const KernelTable kTable = {
    kTableName,
    {iir2, iir4, iir6, iir8},
    {decimate2, decimate4, decimate6, decimate8},
    decimateNarrow,
    {lanesNarrowF1, lanesNarrowF2, lanesNarrowF3, lanesNarrowF4},
    {lanesNarrowD1, lanesNarrowD2, lanesNarrowD3, lanesNarrowD4},
    {zerosF1, zerosF2, zerosF3, zerosF4},
    {zerosD1, zerosD2, zerosD3, zerosD4},
    levelsNarrowEntry,
};
#undef ORV_KERNEL_TARGET
#undef ORV_BROADCAST_LOAD
#undef ORV_BROADCAST_F
#undef ORV_ALL_SET
#undef ORV_WIDEN
#undef ORV_NARROW
#undef ORV_SELECT
#undef ORV_BROADCAST
#undef ORV_MAX_D
#undef ORV_MIN_D
#undef ORV_MAX_F
}  // namespace generic

#if defined(__x86_64__) && !defined(ORV_GENERIC_KERNELS)
#define ORV_HAVE_AVX2_KERNELS 1
namespace avx2 {
constexpr const char* kTableName = "avx2";
constexpr bool kIirBlocks = true;
#define ORV_MAX_D(a, b) ORV_ASSIGN_IF(a, b, >)
#define ORV_MIN_D(a, b) ORV_ASSIGN_IF(a, b, <)
#define ORV_MAX_F(a, b) ORV_ASSIGN_IF(a, b, >)
// Fused multiply-adds shorten the filter recursions; ISO C++ mode does not fuse by itself.
#if defined(__clang__)
#define ORV_KERNEL_TARGET __attribute__((target("avx2,fma")))
#pragma clang fp contract(fast)
#else
#define ORV_KERNEL_TARGET __attribute__((target("avx2,fma"), optimize("fp-contract=fast")))
#endif
#define ORV_SELECT ORV_SELECT_VECTOR
#if defined(__clang__)
// clang (the sanitizer and fuzz builds) has not gcc's shuffle and AVX builtins; the plain
// vector forms give it the same instructions.
#define ORV_BROADCAST(v, k) ((v)[k] - V4d{})
#define ORV_BROADCAST_LOAD(out, p) ((out) = *(p)-V4d{})
#define ORV_BROADCAST_F(out, v, k) ((out) = (v)[k] - V8f{})
#define ORV_ALL_SET(v) (((v)[0] & (v)[1] & (v)[2] & (v)[3]) == -1)
#define ORV_WIDEN(out, v) ((out) = __builtin_convertvector((v), V4d))
#define ORV_NARROW(out, v) ((out) = __builtin_convertvector((v), V4f))
#else
#define ORV_BROADCAST(v, k)                                                        \
    __builtin_shuffle(v, V4l{static_cast<long long>(k), static_cast<long long>(k), \
                             static_cast<long long>(k), static_cast<long long>(k)})
#define ORV_BROADCAST_LOAD(out, p) ((out) = __builtin_ia32_vbroadcastsd256(p))
#define ORV_BROADCAST_F(out, v, k) ((out) = __builtin_shuffle((v), V8i{} + static_cast<int>(k)))
#define ORV_ALL_SET(v) (__builtin_ia32_movmskpd256(reinterpret_cast<V4d>(v)) == 0xf)
#define ORV_WIDEN(out, v) ((out) = __builtin_ia32_cvtps2pd256(v))
#define ORV_NARROW(out, v) ((out) = __builtin_ia32_cvtpd2ps256(v))
#endif
#include "kernel_bodies.h"
const KernelTable kTable = {
    kTableName,
    {iir2, iir4, iir6, iir8},
    {decimate2, decimate4, decimate6, decimate8},
    decimateF,
    {lanesF1, lanesF2, lanesF3, lanesF4},
    {lanesD1, lanesD2, lanesD3, lanesD4},
    {zerosF1, zerosF2, zerosF3, zerosF4},
    {zerosD1, zerosD2, zerosD3, zerosD4},
    levels,
};
#undef ORV_KERNEL_TARGET
#undef ORV_BROADCAST_LOAD
#undef ORV_BROADCAST_F
#undef ORV_ALL_SET
#undef ORV_WIDEN
#undef ORV_NARROW
#undef ORV_SELECT
#undef ORV_BROADCAST
#undef ORV_MAX_D
#undef ORV_MIN_D
#undef ORV_MAX_F
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
