#include "sos.h"

#include <algorithm>
#include <stdexcept>

namespace SlmLibrary {

SosCascade::SosCascade(const SosList& sos) : coeffs_(sos), state_(sos.size()) {}

void SosCascade::reset() {
    std::fill(state_.begin(), state_.end(), State{});
    odd_ = false;
}

double SosCascade::processSample(double x) {
    for (std::size_t k = 0; k < coeffs_.size(); ++k) {
        const Sos& c = coeffs_[k];
        State& s = state_[k];
        const double y = c.b0 * x + s.s1;
        s.s1 = c.b1 * x - c.a1 * y + s.s2;
        s.s2 = c.b2 * x - c.a2 * y;
        x = y;
    }
    return x;
}

void SosCascade::process(const float* in, float* out, std::size_t n) {
    for (std::size_t i = 0; i < n; ++i)
        out[i] = static_cast<float>(processSample(in[i]));
}

std::size_t SosCascade::processDecimate(const float* in, std::size_t n, float* out) {
    std::size_t written = 0;
    for (std::size_t i = 0; i < n; ++i) {
        const double y = processSample(in[i]);
        if (odd_) out[written++] = static_cast<float>(y);
        odd_ = !odd_;
    }
    return written;
}

template <typename T>
SosLanes<T>::SosLanes(const std::vector<SosList>& sos) {
    for (const SosList& s : sos)
        sections_ = std::max(sections_, s.size());
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

// Runs K sections on every lane for n samples. The loops over lanes have a fixed count so
// that they become vector operations; coefficients and state are copied to local arrays
// for the block so that nothing aliases the output.
template <typename T, std::size_t K>
inline void runLanes(const float* __restrict in, std::size_t n, float* __restrict out,
                     const T* __restrict coefIn, T* __restrict s1Io, T* __restrict s2Io) {
    alignas(64) T c[K][5][kLaneWidth];
    alignas(64) T s1[K][kLaneWidth];
    alignas(64) T s2[K][kLaneWidth];
    for (std::size_t k = 0; k < K; ++k) {
        for (std::size_t j = 0; j < 5; ++j) {
            for (std::size_t l = 0; l < kLaneWidth; ++l)
                c[k][j][l] = coefIn[(k * 5 + j) * kLaneWidth + l];
        }
        for (std::size_t l = 0; l < kLaneWidth; ++l) {
            s1[k][l] = s1Io[k * kLaneWidth + l];
            s2[k][l] = s2Io[k * kLaneWidth + l];
        }
    }
    for (std::size_t i = 0; i < n; ++i) {
        T v[kLaneWidth];
        for (std::size_t l = 0; l < kLaneWidth; ++l)
            v[l] = static_cast<T>(in[i]);
        for (std::size_t k = 0; k < K; ++k) {
            for (std::size_t l = 0; l < kLaneWidth; ++l) {
                const T x = v[l];
                const T y = c[k][0][l] * x + s1[k][l];
                s1[k][l] = c[k][1][l] * x - c[k][3][l] * y + s2[k][l];
                s2[k][l] = c[k][2][l] * x - c[k][4][l] * y;
                v[l] = y;
            }
        }
        for (std::size_t l = 0; l < kLaneWidth; ++l)
            out[i * kLaneWidth + l] = static_cast<float>(v[l]);
    }
    for (std::size_t k = 0; k < K; ++k) {
        for (std::size_t l = 0; l < kLaneWidth; ++l) {
            s1Io[k * kLaneWidth + l] = s1[k][l];
            s2Io[k * kLaneWidth + l] = s2[k][l];
        }
    }
}

// One entry point per (type, section count), each compiled for AVX2 and for the baseline
// instruction set; the loader picks the clone that the processor supports.
#define ORV_LANE_KERNEL(NAME, T, K)                                             \
    __attribute__((target_clones("avx2", "default"))) void NAME(                \
        const float* in, std::size_t n, float* out, const T* c, T* s1, T* s2) { \
        runLanes<T, K>(in, n, out, c, s1, s2);                                  \
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
            for (std::size_t l = 0; l < kLaneWidth; ++l)
                out[i * kLaneWidth + l] = in[i];
        }
        return;
    }
    runKernel(sections_, in, n, out, coef_.data(), s1_.data(), s2_.data());
}

template class SosLanes<float>;
template class SosLanes<double>;

}  // namespace SlmLibrary
