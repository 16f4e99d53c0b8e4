#include "stats.h"

#include <algorithm>

#include "dsp.h"

namespace SlmLibrary {

void Stats::reset() {
    energy_.Reset();
    histogram_.reset();
}

void Stats::addSample(const Leq& leq) { energy_.add(leq); }

void Stats::addSample(float levelDb) { histogram_.add(levelDb); }

void Stats::setUpPercentiles(const float* percents, std::size_t n) {
    percents_.assign(percents, percents + n);
}

int Stats::getPercentiles(float* out, std::size_t n) const {
    if (histogram_.count() == 0) return 0;
    const std::size_t m = std::min(n, percents_.size());
    histogram_.exceedanceLevels(percents_.data(), m, out);
    return static_cast<int>(m);
}

structResult Stats::getGenResults() const {
    structResult r;
    r.lmin = histogram_.minimum();
    r.lmax = histogram_.maximum();
    r.leq = Dsp::powerToDb(energy_.meanPower());
    r.overload = energy_.overload() ? 1U : 0U;
    return r;
}

}  // namespace SlmLibrary
