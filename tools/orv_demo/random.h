// Small deterministic random number generators: the same seed gives the same numbers on
// every platform and standard library, which the standard distributions do not promise.
#pragma once

#include <cmath>
#include <cstdint>

namespace orv_demo {

// SplitMix64 step: a well-mixed 64-bit value of its argument, used to derive independent
// seeds and hashed values from (seed, index) pairs.
constexpr std::uint64_t mix64(std::uint64_t x) {
    x += 0x9E3779B97F4A7C15ULL;
    x = (x ^ (x >> 30)) * 0xBF58476D1CE4E5B9ULL;
    x = (x ^ (x >> 27)) * 0x94D049BB133111EBULL;
    return x ^ (x >> 31);
}

constexpr std::uint64_t mix64(std::uint64_t a, std::uint64_t b) { return mix64(a ^ mix64(b)); }

// Uniform value in [0, 1) from 53 bits of a hash.
inline double unitFromBits(std::uint64_t bits) {
    return static_cast<double>(bits >> 11) * 0x1.0p-53;
}

// xorshift64*: fast, good enough for noise signals.
class Rng {
public:
    explicit Rng(std::uint64_t seed) : state_(mix64(seed) | 1U) {}

    std::uint64_t next() {
        state_ ^= state_ >> 12;
        state_ ^= state_ << 25;
        state_ ^= state_ >> 27;
        return state_ * 0x2545F4914F6CDD1DULL;
    }
    // Uniform in [0, 1).
    double uniform() { return unitFromBits(next()); }
    // Uniform in [-1, 1), single precision, for white noise.
    float white() {
        return static_cast<float>(static_cast<std::int32_t>(next() >> 32)) * 0x1.0p-31F;
    }
    // Standard normal (Box-Muller, one value per call).
    double normal() {
        const double u = 1.0 - uniform();  // (0, 1]
        return std::sqrt(-2.0 * std::log(u)) * std::cos(6.283185307179586 * uniform());
    }

private:
    std::uint64_t state_;
};

}  // namespace orv_demo
