#include "level_histogram.h"

#include <algorithm>
#include <array>
#include <bit>
#include <cmath>
#include <cstdint>

#include "dsp.h"

namespace SlmLibrary {
namespace {

// Natural logarithms by table and series: m in [1, 2) is split into c_k = 1 + (k + 0.5) / 256
// (k: its top eight fraction bits) times 1 + r, |r| < 1 / 512, and
// ln m = ln c_k + ln(1 + r) with four terms of the series (error below 1e-12).
struct LogTable {
    std::array<double, 256> inverse;  // 1 / c_k
    std::array<double, 256> log;      // ln c_k
};

const LogTable& logTable() {
    static const LogTable kTable = [] {
        LogTable t{};
        for (std::size_t k = 0; k < 256; ++k) {
            t.inverse[k] = 1.0 / (1.0 + (static_cast<double>(k) + 0.5) / 256.0);
            t.log[k] = -std::log(t.inverse[k]);
        }
        return t;
    }();
    return kTable;
}

// 10 log10 of a normal positive power, within 1e-9 dB (a meaningless number for others).
double quickDb(double power, const LogTable& t) {
    const auto bits = std::bit_cast<std::uint64_t>(power);
    const auto exponent = static_cast<int>(bits >> 52) - 1023;
    const std::uint64_t fraction = bits & ((std::uint64_t{1} << 52) - 1);
    const std::size_t k = fraction >> 44;
    const double m = std::bit_cast<double>(fraction | std::bit_cast<std::uint64_t>(1.0));
    const double r = m * t.inverse[k] - 1.0;
    const double series = r * (1.0 + r * (-0.5 + r * (1.0 / 3.0 - 0.25 * r)));
    constexpr double kLn2 = 0.69314718055994530942;
    constexpr double kDbPerNeper = 4.3429448190325182765;  // 10 / ln 10
    return (static_cast<double>(exponent) * kLn2 + (t.log[k] + series)) * kDbPerNeper;
}

}  // namespace

LevelHistogram::LevelHistogram(float minDb, float maxDb)
    : firstClass_(static_cast<int>(std::lround(minDb * 10.0))),
      counts_(static_cast<std::size_t>(std::lround(maxDb * 10.0) - firstClass_ + 1), 0U) {}

std::size_t LevelHistogram::classOf(float db) const {
    // Levels written with one decimal land exactly on their own class.
    // Clamped before the conversion: a float far out of range (or infinite) has no integer.
    const double tenths = std::nearbyint(static_cast<double>(db) * 10.0) - firstClass_;
    if (!(tenths > 0.0)) return 0;  // also NaN
    const auto top = static_cast<double>(counts_.size() - 1);
    return tenths >= top ? counts_.size() - 1 : static_cast<std::size_t>(tenths);
}

float LevelHistogram::levelOfClass(std::size_t index) const {
    return static_cast<float>(static_cast<double>(static_cast<int>(index) + firstClass_) / 10.0);
}

void LevelHistogram::add(float db) {
    ++counts_[classOf(db)];
    if (count_ == 0) {
        min_ = max_ = db;
    } else {
        min_ = std::min(min_, db);
        max_ = std::max(max_, db);
    }
    ++count_;
}

void LevelHistogram::addPower(double power) { addPowers(this, &power, nullptr, 1); }

void LevelHistogram::addPowers(LevelHistogram* histograms, const double* powers, const bool* take,
                               std::size_t n) {
    // The levels first, independent of each other, then the counts.
    constexpr std::size_t kBatch = 8;
    const LogTable& table = logTable();
    for (std::size_t start = 0; start < n; start += kBatch) {
        const std::size_t m = std::min(kBatch, n - start);
        double quick[kBatch];
        for (std::size_t i = 0; i < m; ++i) quick[i] = quickDb(powers[start + i], table) * 10.0;
        for (std::size_t i = 0; i < m; ++i) {
            if (take == nullptr || take[start + i]) {
                histograms[start + i].addPower(powers[start + i], quick[i]);
            }
        }
    }
}

void LevelHistogram::addPower(double power, double quick) {
    // A level well inside its class (more than 1e-4 dB from an edge: far beyond the error of
    // quickDb and the float rounding of powerToDb) lands where add(powerToDb(power)) puts
    // it; near an edge, and for powers that are not normal positive numbers, the exact way.
    constexpr double kMargin = 1e-3;               // tenths of a dB
    constexpr double kRound = 6755399441055744.0;  // 1.5 * 2^52: rounds to the nearest integer
    const double nearest = (quick + kRound) - kRound;
    std::size_t c = 0;
    if (std::isnormal(power) && power > 0.0 && std::fabs(quick - nearest) < 0.5 - kMargin) {
        const double index = nearest - firstClass_;
        c = index > 0.0 ? std::min(static_cast<std::size_t>(index), counts_.size() - 1) : 0;
    } else {
        c = classOf(Dsp::powerToDb(power));
    }
    ++counts_[c];
    ++count_;
}

void LevelHistogram::reset() {
    std::fill(counts_.begin(), counts_.end(), 0U);
    count_ = 0;
    min_ = max_ = 0.0F;
}

float LevelHistogram::exceedanceLevel(double percent) const {
    float out = 0.0F;
    const float p = static_cast<float>(percent);
    exceedanceLevels(&p, 1, &out);
    return out;
}

void LevelHistogram::exceedanceLevels(const float* percents, std::size_t n, float* out) const {
    if (count_ == 0) {
        std::fill(out, out + n, 0.0F);
        return;
    }
    // Walk down from the top class once, answering the percentiles in ascending order
    // (a smaller n is met higher up).
    std::vector<std::size_t> order(n);
    for (std::size_t i = 0; i < n; ++i) order[i] = i;
    std::sort(order.begin(), order.end(),
              [&](std::size_t a, std::size_t b) { return percents[a] < percents[b]; });

    const double total = static_cast<double>(count_);
    std::size_t next = 0;
    std::uint64_t above = 0;  // entries in the classes visited so far
    std::size_t lowest = 0;
    while (lowest < counts_.size() && counts_[lowest] == 0) ++lowest;
    for (std::size_t c = counts_.size(); c-- > 0 && next < n;) {
        if (counts_[c] == 0) continue;
        above += counts_[c];
        // Class c is reached or exceeded by `above` entries: it answers every percentile
        // whose share of the entries is at most that.
        while (next < n && static_cast<double>(percents[order[next]]) * total <=
                               static_cast<double>(above) * 100.0) {
            out[order[next++]] = levelOfClass(c);
        }
    }
    while (next < n) out[order[next++]] = levelOfClass(lowest);  // n > 100, or NaN
}

}  // namespace SlmLibrary
