#include "sos.h"

#include <algorithm>
#include <cstring>
#include <stdexcept>

#include "kernel_clones.h"

namespace SlmLibrary {

SosCascade::SosCascade(const SosList& sos) : coeffs_(sos), state_(sos.size()) {}

void SosCascade::reset() {
    std::fill(state_.begin(), state_.end(), std::array<double, 2>{});
    odd_ = false;
}

double SosCascade::processSample(double x) {
    for (std::size_t k = 0; k < coeffs_.size(); ++k) {
        const Sos& c = coeffs_[k];
        std::array<double, 2>& s = state_[k];
        const double y = c.b0 * x + s[0];
        s[0] = c.b1 * x - c.a1 * y + s[1];
        s[1] = c.b2 * x - c.a2 * y;
        x = y;
    }
    return x;
}

namespace {

// Block loop with a fixed section count, so that coefficients and state stay in registers.
// Decimate: keep every second output (phase in `odd`); returns the outputs written.
template <std::size_t K, bool Decimate>
[[gnu::always_inline]] inline std::size_t runCascade(const Sos* coeffs,
                                                     std::array<double, 2>* state, const float* in,
                                                     std::size_t n, float* out, bool& odd) {
    double b0[K], b1[K], b2[K], a1[K], a2[K], s1[K], s2[K];
    for (std::size_t k = 0; k < K; ++k) {
        b0[k] = coeffs[k].b0;
        b1[k] = coeffs[k].b1;
        b2[k] = coeffs[k].b2;
        a1[k] = coeffs[k].a1;
        a2[k] = coeffs[k].a2;
        s1[k] = state[k][0];
        s2[k] = state[k][1];
    }
    std::size_t written = 0;
    bool phase = odd;
    for (std::size_t i = 0; i < n; ++i) {
        double x = in[i];
        for (std::size_t k = 0; k < K; ++k) {
            const double y = b0[k] * x + s1[k];
            s1[k] = (b1[k] * x + s2[k]) - a1[k] * y;
            s2[k] = b2[k] * x - a2[k] * y;
            x = y;
        }
        if constexpr (Decimate) {
            if (phase) out[written++] = static_cast<float>(x);
            phase = !phase;
        } else {
            out[i] = static_cast<float>(x);
        }
    }
    for (std::size_t k = 0; k < K; ++k) {
        state[k][0] = s1[k];
        state[k][1] = s2[k];
    }
    odd = phase;
    return Decimate ? written : n;
}

// The recursion of a section is two dependent multiply-adds per sample: fused
// multiply-add (x86-64-v3 clone) halves its latency.
#define ORV_CASCADE_KERNEL(NAME, K, DECIMATE)                                                      \
    ORV_KERNEL_CLONES ORV_KERNEL_CONTRACT std::size_t NAME(const Sos* c, std::array<double, 2>* s, \
                                                           const float* in, std::size_t n,         \
                                                           float* out, bool& odd) {                \
        return runCascade<K, DECIMATE>(c, s, in, n, out, odd);                                     \
    }
ORV_CASCADE_KERNEL(cascade1, 1, false)
ORV_CASCADE_KERNEL(cascade2, 2, false)
ORV_CASCADE_KERNEL(cascade3, 3, false)
ORV_CASCADE_KERNEL(cascade4, 4, false)
ORV_CASCADE_KERNEL(decimate1, 1, true)
ORV_CASCADE_KERNEL(decimate2, 2, true)
ORV_CASCADE_KERNEL(decimate3, 3, true)
ORV_CASCADE_KERNEL(decimate4, 4, true)
#undef ORV_CASCADE_KERNEL

template <bool Decimate>
std::size_t dispatchCascade(std::size_t k, const Sos* c, std::array<double, 2>* s, const float* in,
                            std::size_t n, float* out, bool& odd) {
    switch (k) {
        case 1:
            return Decimate ? decimate1(c, s, in, n, out, odd) : cascade1(c, s, in, n, out, odd);
        case 2:
            return Decimate ? decimate2(c, s, in, n, out, odd) : cascade2(c, s, in, n, out, odd);
        case 3:
            return Decimate ? decimate3(c, s, in, n, out, odd) : cascade3(c, s, in, n, out, odd);
        case 4:
            return Decimate ? decimate4(c, s, in, n, out, odd) : cascade4(c, s, in, n, out, odd);
        default:
            break;
    }
    // Longer cascades (not used by the library's own designs): plain loop.
    std::size_t done = 0;
    bool phase = odd;
    for (std::size_t i = 0; i < n; ++i) {
        double x = in[i];
        for (std::size_t j = 0; j < k; ++j) {
            const double y = c[j].b0 * x + s[j][0];
            s[j][0] = c[j].b1 * x - c[j].a1 * y + s[j][1];
            s[j][1] = c[j].b2 * x - c[j].a2 * y;
            x = y;
        }
        if (!Decimate) {
            out[i] = static_cast<float>(x);
        } else if (phase) {
            out[done++] = static_cast<float>(x);
        }
        phase = !phase;
    }
    if (Decimate) odd = phase;
    return Decimate ? done : n;
}

}  // namespace

void SosCascade::process(const float* in, float* out, std::size_t n) {
    if (coeffs_.empty()) {
        if (out != in) std::copy(in, in + n, out);
        return;
    }
    bool unused = false;
    dispatchCascade<false>(coeffs_.size(), coeffs_.data(), state_.data(), in, n, out, unused);
}

std::size_t SosCascade::processDecimate(const float* in, std::size_t n, float* out) {
    if (coeffs_.empty()) {
        std::size_t written = 0;
        for (std::size_t i = 0; i < n; ++i) {
            if (odd_) out[written++] = in[i];
            odd_ = !odd_;
        }
        return written;
    }
    return dispatchCascade<true>(coeffs_.size(), coeffs_.data(), state_.data(), in, n, out, odd_);
}

template <typename T>
SosLanes<T>::SosLanes(const std::vector<SosList>& sos) {
    for (const SosList& s : sos) sections_ = std::max(sections_, s.size());
    if (sections_ > kMaxSections) throw std::invalid_argument("too many sections for a lane");
    coef_.assign(sections_ * 5 * kLaneWidth, T{});
    for (std::size_t k = 0; k < sections_; ++k) {
        for (std::size_t l = 0; l < kLaneWidth; ++l) {
            const Sos c = (l < sos.size() && k < sos[l].size()) ? sos[l][k] : Sos{};
            const double row[5] = {c.b0, c.b1, c.b2, c.a1, c.a2};
            for (std::size_t j = 0; j < 5; ++j) {
                coef_[(k * 5 + j) * kLaneWidth + l] = static_cast<T>(row[j]);
            }
        }
    }
    s1_.assign(sections_ * kLaneWidth, T{});
    s2_.assign(sections_ * kLaneWidth, T{});
}

template <typename T>
void SosLanes<T>::reset() {
    std::fill(s1_.begin(), s1_.end(), T{});
    std::fill(s2_.begin(), s2_.end(), T{});
}

namespace {

// Lanes as GCC vectors: eight floats (one AVX register, two SSE registers), or two
// halves of four doubles. Broadcasting a scalar into a vector wider than a register would
// go through memory, so double lanes are handled as two halves.
typedef float LaneF __attribute__((vector_size(8 * sizeof(float))));
typedef float HalfF __attribute__((vector_size(4 * sizeof(float))));
typedef double HalfD __attribute__((vector_size(4 * sizeof(double))));

template <typename T>
struct LaneTypes;
template <>
struct LaneTypes<float> {
    using V = LaneF;
    using Out = LaneF;
    static constexpr std::size_t kParts = 1;
};
template <>
struct LaneTypes<double> {
    using V = HalfD;
    using Out = HalfF;
    static constexpr std::size_t kParts = 2;
};

// Runs K sections on every lane for n samples; coefficients and state live in local
// vectors for the whole block.
template <typename T, std::size_t K>
[[gnu::always_inline]] inline void runLanes(const float* __restrict in, std::size_t n,
                                            float* __restrict out, const T* coef, T* s1Io,
                                            T* s2Io) {
    using V = typename LaneTypes<T>::V;
    using Out = typename LaneTypes<T>::Out;
    constexpr std::size_t P = LaneTypes<T>::kParts;
    constexpr std::size_t L = kLaneWidth / P;  // lanes per part
    V c[K][5][P];
    V s1[K][P];
    V s2[K][P];
    for (std::size_t k = 0; k < K; ++k) {
        for (std::size_t p = 0; p < P; ++p) {
            for (std::size_t j = 0; j < 5; ++j) {
                std::memcpy(&c[k][j][p], coef + (k * 5 + j) * kLaneWidth + p * L, sizeof(V));
            }
            std::memcpy(&s1[k][p], s1Io + k * kLaneWidth + p * L, sizeof(V));
            std::memcpy(&s2[k][p], s2Io + k * kLaneWidth + p * L, sizeof(V));
        }
    }
    for (std::size_t i = 0; i < n; ++i) {
        const T x = static_cast<T>(in[i]);
        for (std::size_t p = 0; p < P; ++p) {
            V v = V{} + x;
            for (std::size_t k = 0; k < K; ++k) {
                const V y = c[k][0][p] * v + s1[k][p];
                s1[k][p] = (c[k][1][p] * v + s2[k][p]) - c[k][3][p] * y;
                s2[k][p] = c[k][2][p] * v - c[k][4][p] * y;
                v = y;
            }
            const Out f = __builtin_convertvector(v, Out);
            std::memcpy(out + i * kLaneWidth + p * L, &f, sizeof(f));
        }
    }
    for (std::size_t k = 0; k < K; ++k) {
        for (std::size_t p = 0; p < P; ++p) {
            std::memcpy(s1Io + k * kLaneWidth + p * L, &s1[k][p], sizeof(V));
            std::memcpy(s2Io + k * kLaneWidth + p * L, &s2[k][p], sizeof(V));
        }
    }
}

// One entry point per (type, section count), with the kernel attributes of
// kernel_clones.h (instruction-set clones, fused multiply-adds).
#define ORV_LANE_KERNEL(NAME, T, K)                                                             \
    ORV_KERNEL_CLONES ORV_KERNEL_CONTRACT void NAME(const float* in, std::size_t n, float* out, \
                                                    const T* c, T* s1, T* s2) {                 \
        runLanes<T, K>(in, n, out, c, s1, s2);                                                  \
    }
ORV_LANE_KERNEL(lanesF1, float, 1)
ORV_LANE_KERNEL(lanesF2, float, 2)
ORV_LANE_KERNEL(lanesF3, float, 3)
ORV_LANE_KERNEL(lanesF4, float, 4)
ORV_LANE_KERNEL(lanesD1, double, 1)
ORV_LANE_KERNEL(lanesD2, double, 2)
ORV_LANE_KERNEL(lanesD3, double, 3)
ORV_LANE_KERNEL(lanesD4, double, 4)
#undef ORV_LANE_KERNEL

void runKernel(std::size_t k, const float* in, std::size_t n, float* out, const float* c, float* s1,
               float* s2) {
    switch (k) {
        case 1:
            lanesF1(in, n, out, c, s1, s2);
            break;
        case 2:
            lanesF2(in, n, out, c, s1, s2);
            break;
        case 3:
            lanesF3(in, n, out, c, s1, s2);
            break;
        default:
            lanesF4(in, n, out, c, s1, s2);
            break;
    }
}

void runKernel(std::size_t k, const float* in, std::size_t n, float* out, const double* c,
               double* s1, double* s2) {
    switch (k) {
        case 1:
            lanesD1(in, n, out, c, s1, s2);
            break;
        case 2:
            lanesD2(in, n, out, c, s1, s2);
            break;
        case 3:
            lanesD3(in, n, out, c, s1, s2);
            break;
        default:
            lanesD4(in, n, out, c, s1, s2);
            break;
    }
}

}  // namespace

template <typename T>
void SosLanes<T>::process(const float* in, std::size_t n, float* out) {
    if (sections_ == 0) {
        for (std::size_t i = 0; i < n; ++i) {
            for (std::size_t l = 0; l < kLaneWidth; ++l) out[i * kLaneWidth + l] = in[i];
        }
        return;
    }
    runKernel(sections_, in, n, out, coef_.data(), s1_.data(), s2_.data());
}

template class SosLanes<float>;
template class SosLanes<double>;

}  // namespace SlmLibrary
