#include "sos.h"

#include <algorithm>
#include <cmath>
#include <stdexcept>
#include <type_traits>

namespace SlmLibrary {
namespace {

constexpr std::size_t kBlock = IirBlockPlan::kBlock;

// One sample through the cascade in transposed direct form II: the definition that the
// block plan reproduces.
double step(const SosList& sos, double* state, double x) {
    for (std::size_t k = 0; k < sos.size(); ++k) {
        const Sos& c = sos[k];
        double* s = state + 2 * k;
        const double y = c.b0 * x + s[0];
        s[0] = c.b1 * x - c.a1 * y + s[1];
        s[1] = c.b2 * x - c.a2 * y;
        x = y;
    }
    return x;
}

}  // namespace

// The block matrices, column by column: the response over one block to a unit state and,
// from rest, to a unit input sample.
IirBlockPlan makeIirBlockPlan(const SosList& sos) {
    IirBlockPlan plan{};
    for (std::size_t k = 0; k < sos.size(); ++k) {
        const Sos& c = sos[k];
        const double row[5] = {c.b0, c.b1, c.b2, c.a1, c.a2};
        std::copy(row, row + 5, plan.sos[k]);
    }
    const std::size_t order = 2 * sos.size();
    for (std::size_t k = 0; k < order; ++k) {
        double state[IirBlockPlan::kMaxOrder] = {};
        state[k] = 1.0;
        for (std::size_t j = 0; j < kBlock; ++j) plan.o[k][j] = step(sos, state, 0.0);
        for (std::size_t r = 0; r < order; ++r) plan.p[k][r] = state[r];
    }
    for (std::size_t i = 0; i < kBlock; ++i) {
        double state[IirBlockPlan::kMaxOrder] = {};
        for (std::size_t j = 0; j < kBlock; ++j)
            plan.t[i][j] = step(sos, state, j == i ? 1.0 : 0.0);
        for (std::size_t r = 0; r < order; ++r) plan.q[i][r] = state[r];
    }
    for (std::size_t j = 0; j < kBlock / 2; ++j) {
        for (std::size_t k = 0; k < order; ++k) plan.od[k][j] = plan.o[k][2 * j + 1];
        for (std::size_t i = 0; i < kBlock; ++i) plan.td[i][j] = plan.t[i][2 * j + 1];
    }
    auto single = [](const auto& from, auto& to) {
        std::transform(&from[0][0], &from[0][0] + sizeof from / sizeof from[0][0], &to[0][0],
                       [](double v) { return static_cast<float>(v); });
    };
    single(plan.p, plan.pf);
    single(plan.q, plan.qf);
    single(plan.od, plan.odf);
    single(plan.td, plan.tdf);
    return plan;
}

SosCascade::SosCascade(const SosList& sos, Precision decimation)
    : sections_(sos.size()), single_(decimation == Precision::Single) {
    if (sos.size() > 4) throw std::invalid_argument("a cascade has at most four sections");
    if (!sos.empty()) plan_ = std::make_shared<const IirBlockPlan>(makeIirBlockPlan(sos));
}

void SosCascade::reset() {
    state_.fill(0.0);
    stateF_.fill(0.0F);
    pendingCount_ = 0;
    odd_ = false;
}

template <bool Decimate, typename S>
std::size_t SosCascade::run(Kernel<S> kernel, std::array<S, IirBlockPlan::kMaxOrder>& state,
                            const float* in, std::size_t n, float* out) {
    constexpr std::size_t kStep = Decimate ? 2 : 1;  // inputs per output
    std::size_t written = 0;
    std::size_t pos = 0;
    // An unfinished block, or the start of one: the step on a copy of the state, with the
    // inputs still missing set to zero; the state moves on once the block is complete.
    auto partial = [&](std::size_t take) {
        const std::size_t from = pendingCount_;
        std::copy(in + pos, in + pos + take, pending_.begin() + static_cast<std::ptrdiff_t>(from));
        std::fill(pending_.begin() + static_cast<std::ptrdiff_t>(from + take), pending_.end(),
                  0.0F);
        alignas(32) std::array<S, IirBlockPlan::kMaxOrder> s = state;
        float y[kBlock];
        kernel(*plan_, s.data(), pending_.data(), 1, y);
        for (std::size_t j = from; j < from + take; ++j) {
            if (!Decimate) {
                out[written++] = y[j];
            } else if (j % 2 == 1) {
                out[written++] = y[j / 2];
            }
        }
        pendingCount_ += take;
        pos += take;
        if (pendingCount_ == kBlock) {
            state = s;
            pendingCount_ = 0;
        }
    };
    if (pendingCount_ > 0) partial(std::min(n, kBlock - pendingCount_));
    const std::size_t blocks = (n - pos) / kBlock;
    if (blocks > 0) {
        kernel(*plan_, state.data(), in + pos, blocks, out + written);
        pos += blocks * kBlock;
        written += blocks * kBlock / kStep;
    }
    if (pos < n) partial(n - pos);
    return written;
}

void SosCascade::process(const float* in, float* out, std::size_t n) {
    if (sections_ == 0) {
        if (out != in) std::copy(in, in + n, out);
        return;
    }
    run<false>(kernels().iir[sections_ - 1], state_, in, n, out);
}

std::size_t SosCascade::processDecimate(const float* in, std::size_t n, float* out) {
    if (sections_ == 0) {
        std::size_t written = 0;
        for (std::size_t i = 0; i < n; ++i) {
            if (odd_) out[written++] = in[i];
            odd_ = !odd_;
        }
        return written;
    }
    if (single_) return run<true>(kernels().iirDecimateF, stateF_, in, n, out);
    return run<true>(kernels().iirDecimate[sections_ - 1], state_, in, n, out);
}

BandZeros::BandZeros(unsigned order) : order_(order) {
    if (order > 4) throw std::invalid_argument("band zeros of order 4 at most");
}

template <typename T>
void BandZeros::process(const float* in, std::size_t n, T* out) {
    if (order_ == 0) {
        std::copy(in, in + n, out);
        return;
    }
    const KernelTable& k = kernels();
    auto* const kernel = [&] {
        if constexpr (std::is_same_v<T, float>) {
            return k.zerosF[order_ - 1];
        } else {
            return k.zerosD[order_ - 1];
        }
    }();
    // The first eight outputs read the last samples of the previous call, the others only
    // this call's.
    const std::size_t head = std::min<std::size_t>(n, 8);
    std::array<float, 16> start{};
    std::copy(last_.begin(), last_.end(), start.begin());
    std::copy(in, in + head, start.begin() + 8);
    kernel(start.data() + 8, head, out);
    if (n > 8) kernel(in + 8, n - 8, out + 8);
    // Keep the last eight samples.
    if (n >= 8) {
        std::copy(in + n - 8, in + n, last_.begin());
    } else {
        std::copy(start.begin() + static_cast<std::ptrdiff_t>(n),
                  start.begin() + static_cast<std::ptrdiff_t>(n + 8), last_.begin());
    }
}

template void BandZeros::process<float>(const float*, std::size_t, float*);
template void BandZeros::process<double>(const float*, std::size_t, double*);

template <typename T>
SosLanes<T>::SosLanes(const std::vector<SosList>& sos) {
    for (const SosList& s : sos) sections_ = std::max(sections_, s.size());
    if (sections_ > kMaxSections) throw std::invalid_argument("too many sections for a lane");
    coef_.assign(sections_ * 2 * kLaneWidth, T{});
    gain_.assign(kLaneWidth, T{});
    zero_.assign(kLaneWidth, T{});
    state_.assign(sections_ * 2 * kLaneWidth, T{});
    std::vector<unsigned> orders;
    for (std::size_t l = 0; l < kLaneWidth && l < sos.size(); ++l) {
        const SosList& lane = sos[l];
        if (lane.empty()) continue;
        // Numerator: the product of the sections' numerators, which must be g (1 - z^-2)^n.
        std::vector<double> num = {1.0};
        double gain = 1.0;
        for (const Sos& c : lane) {
            gain *= c.b0;
            std::vector<double> next(num.size() + 2, 0.0);
            for (std::size_t i = 0; i < num.size(); ++i) {
                next[i] += num[i];
                next[i + 1] += num[i] * c.b1 / c.b0;
                next[i + 2] += num[i] * c.b2 / c.b0;
            }
            num = next;
        }
        const auto n = static_cast<unsigned>(lane.size());
        double binomial = 1.0;
        for (unsigned j = 0; j <= n; ++j) {
            const double expected = (j % 2 == 0 ? 1.0 : -1.0) * binomial;
            if (std::abs(num[2 * j] - expected) > 1e-6 * std::abs(expected) ||
                (j < n && std::abs(num[2 * j + 1]) > 1e-6)) {
                throw std::invalid_argument("a lane's numerator is not a multiple of (1 - z^-2)^n");
            }
            binomial = binomial * (n - j) / (j + 1);
        }
        for (std::size_t k = 0; k < lane.size(); ++k) {
            coef_[(2 * k) * kLaneWidth + l] = static_cast<T>(lane[k].a1);
            coef_[(2 * k + 1) * kLaneWidth + l] = static_cast<T>(lane[k].a2);
        }
        gain_[l] = static_cast<T>(gain);
        orders.push_back(n);
        zero_[l] = static_cast<T>(n);  // resolved below
    }
    if (orders.empty()) return;
    order_ = *std::min_element(orders.begin(), orders.end());
    const unsigned most = *std::max_element(orders.begin(), orders.end());
    if (most > order_ + 1) {
        throw std::invalid_argument("lanes whose numbers of sections differ by more than one");
    }
    extra_ = most != order_;
    for (std::size_t l = 0; l < kLaneWidth; ++l) {
        zero_[l] = extra_ && zero_[l] == static_cast<T>(most) ? T{1} : T{0};
    }
}

template <typename T>
void SosLanes<T>::reset() {
    std::fill(state_.begin(), state_.end(), T{});
}

template <typename T>
void SosLanes<T>::process(const T* u, std::size_t n, float* out) {
    if (sections_ == 0) {
        std::fill(out, out + n * kLaneWidth, 0.0F);
        return;
    }
    const KernelTable& k = kernels();
    if constexpr (std::is_same_v<T, float>) {
        k.lanesF[sections_ - 1](u, n, out, coef_.data(), gain_.data(),
                                extra_ ? zero_.data() : nullptr, state_.data());
    } else {
        k.lanesD[sections_ - 1](u, n, out, coef_.data(), gain_.data(),
                                extra_ ? zero_.data() : nullptr, state_.data());
    }
}

template class SosLanes<float>;
template class SosLanes<double>;

}  // namespace SlmLibrary
