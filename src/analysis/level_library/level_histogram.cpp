#include "level_histogram.h"

#include <algorithm>
#include <cmath>

namespace SlmLibrary {

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
