#include "slm.h"

#include <algorithm>
#include <cmath>
#include <numbers>
#include <stdexcept>
#include <string>

#if defined(__SSE__)
#include <xmmintrin.h>
#endif

#include "dsp.h"

namespace SlmLibrary {
namespace {

constexpr double kRate = 48000.0;
constexpr double kSettleDb = 40.0;  // filter transient left: 1 % in amplitude, < 0.1 dB
constexpr std::size_t kDecimationGrid = std::size_t{1} << (OctaveFilter::kStages - 1);

// Subnormal numbers in decaying filter states after silence cost a hundred times the
// normal time on x86; flush them to zero while this meter processes, and restore the
// caller's mode afterwards.
class FlushDenormals {
public:
#if defined(__SSE__)
    FlushDenormals() : saved_(_mm_getcsr()) { _mm_setcsr(saved_ | 0x8040U); }
    ~FlushDenormals() { _mm_setcsr(saved_); }

private:
    unsigned saved_;
#endif
};

void checkRate(double sampleRate) {
    if (sampleRate != kRate) {
        throw std::invalid_argument("the level meter runs at 48000 Hz only, not " +
                                    std::to_string(sampleRate) + " Hz");
    }
}

void checkTimeWeighting(unsigned tw) {
    if (tw == TWeight::I) throw std::invalid_argument("impulse time weighting is not supported");
    if (tw != TWeight::N && tw != TWeight::F && tw != TWeight::S) {
        throw std::invalid_argument("unknown time weighting code " + std::to_string(tw));
    }
}

void checkFrequencyWeighting(unsigned fw) {
    if (fw != FWeight::Z && fw != FWeight::A && fw != FWeight::C) {
        throw std::invalid_argument("unknown frequency weighting code " + std::to_string(fw));
    }
}

double primeSeconds(unsigned tw, double lowestFrequency) {
    return std::max(TWeight::timeConstant(tw), 2.0 / lowestFrequency);
}

std::string hz(double f) { return std::to_string(static_cast<long long>(std::lround(f))) + " Hz"; }

// Butterworth filter of the filtered channel, 4th order per edge.
SosList auxDesign(unsigned type, const float corners[2], double fs) {
    const double nyquist = fs / 2.0;
    const double f1 = corners != nullptr ? static_cast<double>(corners[0]) : 0.0;
    const double f2 = corners != nullptr ? static_cast<double>(corners[1]) : 0.0;
    auto inside = [&](double f) { return std::isfinite(f) && f > 0.0 && f < nyquist; };
    const Zpk proto = design::butterworthPrototype(4);
    switch (type) {
        case kAllPass:
            return {};
        case kLowPass:
        case kHighPass: {
            if (!inside(f1)) {
                throw std::invalid_argument("filter corner " + hz(f1) + " is outside 0 .. " +
                                            hz(nyquist));
            }
            const double w = design::prewarp(f1, fs);
            if (type == kLowPass) {
                return design::toSos(design::bilinear(design::lowpassToLowpass(proto, w), fs), 0.0,
                                     fs, 1.0);
            }
            return design::toSos(design::bilinear(design::lowpassToHighpass(proto, w), fs), nyquist,
                                 fs, 1.0);
        }
        case kBandPass:
        case kBandStop: {
            if (!inside(f1) || !inside(f2) || !(f1 < f2)) {
                throw std::invalid_argument("filter corners " + hz(f1) + " .. " + hz(f2) +
                                            " are not 0 < f1 < f2 < " + hz(nyquist));
            }
            const double w1 = design::prewarp(f1, fs);
            const double w2 = design::prewarp(f2, fs);
            const double w0 = std::sqrt(w1 * w2);
            if (type == kBandPass) {
                const double centre = std::atan(w0 / (2.0 * fs)) * fs / std::numbers::pi;
                return design::toSos(
                    design::bilinear(design::lowpassToBandpass(proto, w0, w2 - w1), fs), centre, fs,
                    1.0);
            }
            return design::toSos(
                design::bilinear(design::lowpassToBandstop(proto, w0, w2 - w1), fs), 0.0, fs, 1.0);
        }
        default:
            throw std::invalid_argument("unknown filter type " + std::to_string(type));
    }
}

}  // namespace

struct Slm::Bank {
    // Hands the bank's lane groups to their statistics.
    struct Forward : OctaveFilter::Sink {
        std::vector<BandLevels<kLaneWidth>>* levels = nullptr;
        bool entering = false;
        void onBands(std::size_t group, const float* frames, std::size_t count) override {
            (*levels)[group].process(frames, count, entering);
        }
    };

    Bank(OctaveFilter::Bank kind, unsigned twCode, unsigned fwCode) : filter(kind), weight(kRate) {
        weight.init(fwCode, kRate);
        tw = twCode;
        fw = fwCode;
    }

    OctaveFilter filter;
    FWeight weight;
    unsigned tw = 0;
    unsigned fw = 0;
    std::vector<BandLevels<kLaneWidth>> levels;  // per lane group
    std::vector<double> settle;                  // warm-up per band, seconds
    Forward sink;
};

struct Slm::Aux {
    FWeight weight{kRate};
    SosCascade filter;
    unsigned tw = 0;
    unsigned fw = 0;
    BandLevels<1> levels;
    double settle = 0.0;
};

Slm::Slm(double sampleRate, unsigned channels, std::size_t maxBlock)
    : fs_(sampleRate), maxBlock_(maxBlock) {
    checkRate(sampleRate);
    if (channels != 1) throw std::invalid_argument("the level meter takes one channel");
    if (maxBlock == 0) throw std::invalid_argument("the level meter needs a block size");
    weighted_.resize(maxBlock_);
    auxBuffer_.resize(maxBlock_);
}

Slm::~Slm() = default;
Slm::Slm(Slm&&) noexcept = default;
Slm& Slm::operator=(Slm&&) noexcept = default;

void Slm::initFullOct(unsigned tw, unsigned fw, unsigned first, unsigned last, double sampleRate,
                      unsigned reserved) {
    initBank(OctaveFilter::Bank::Full, tw, fw, first, last, sampleRate, reserved);
}

void Slm::initThirdOct(unsigned tw, unsigned fw, unsigned first, unsigned last, double sampleRate,
                       unsigned reserved) {
    initBank(OctaveFilter::Bank::Third, tw, fw, first, last, sampleRate, reserved);
}

void Slm::initBank(OctaveFilter::Bank kind, unsigned tw, unsigned fw, unsigned first, unsigned last,
                   double sampleRate, unsigned reserved) {
    checkRate(sampleRate);
    checkTimeWeighting(tw);
    checkFrequencyWeighting(fw);
    const unsigned count = OctaveFilter::bandCount(kind);
    if (first > last || last >= count) {
        throw std::invalid_argument("bands " + std::to_string(first) + " .. " +
                                    std::to_string(last) + " are not within 0 .. " +
                                    std::to_string(count - 1));
    }
    if (reserved != 0) throw std::invalid_argument("the last band set-up argument must be 0");

    auto bank = std::make_unique<Bank>(kind, tw, fw);
    const double weightSettle = FWeight::settleSeconds(fw, kRate, kSettleDb);
    bank->settle.resize(count);
    for (unsigned b = 0; b < count; ++b) {
        const double fm = OctaveFilter::midBandFrequency(kind, b);
        bank->settle[b] = weightSettle + bank->filter.settleSeconds(b, kSettleDb);
        if (tw != TWeight::N) bank->settle[b] += primeSeconds(tw, fm);
    }
    for (const OctaveFilter::Group& g : bank->filter.groups()) {
        std::array<BandLevels<kLaneWidth>::LaneSetup, kLaneWidth> lanes{};
        for (std::size_t l = 0; l < kLaneWidth; ++l) {
            if (g.band[l] < 0) continue;
            const auto b = static_cast<unsigned>(g.band[l]);
            lanes[l].active = b >= first && b <= last;
            const double fm = OctaveFilter::midBandFrequency(kind, b);
            lanes[l].primeSeconds = tw == TWeight::N ? 0.0 : primeSeconds(tw, fm);
            lanes[l].settleSeconds = bank->settle[b] - lanes[l].primeSeconds;
            const double upperEdge = fm * std::pow(10.0, 0.15 / OctaveFilter::bandsPerOctave(kind));
            lanes[l].interpolatePeak = upperEdge <= 0.25 * g.rate;
        }
        bank->levels.emplace_back(tw, g.rate, kRate, lanes);
    }
    bank->sink.levels = &bank->levels;
    bank_ = std::move(bank);
    first_ = first;
    last_ = last;
    resetAll();
}

void Slm::initAuxCh(unsigned filterType, const float corners[2], unsigned tw, unsigned fw,
                    double sampleRate) {
    checkRate(sampleRate);
    checkTimeWeighting(tw);
    checkFrequencyWeighting(fw);
    const SosList sos = auxDesign(filterType, corners, kRate);
    auto aux = std::make_unique<Aux>();
    aux->weight.init(fw, kRate);
    aux->filter = SosCascade(sos);
    aux->tw = tw;
    aux->fw = fw;
    const double lowest = (filterType == kAllPass || filterType == kLowPass)
                              ? 8.0  // 0.25 s: averages a tone of a few Hz
                              : static_cast<double>(corners[0]);
    std::array<BandLevels<1>::LaneSetup, 1> lane{};
    lane[0].active = true;
    lane[0].primeSeconds = tw == TWeight::N ? 0.0 : primeSeconds(tw, lowest);
    lane[0].settleSeconds =
        FWeight::settleSeconds(fw, kRate, kSettleDb) + design::settleSeconds(sos, kRate, kSettleDb);
    aux->settle = lane[0].settleSeconds + lane[0].primeSeconds;
    aux->levels = BandLevels<1>(tw, kRate, kRate, lane);
    aux_ = std::move(aux);
    resetAll();
}

void Slm::setPercentiles(const std::vector<float>& percents) { percents_ = percents; }

void Slm::setPercentiles(const std::vector<std::uint32_t>& percents) {
    percents_.assign(percents.begin(), percents.end());
}

void Slm::setPercentiles(std::initializer_list<float> percents) { percents_.assign(percents); }

void Slm::resetAll() {
    if (bank_) {
        bank_->filter.reset();
        bank_->weight.reset();
        for (BandLevels<kLaneWidth>& l : bank_->levels) l.reset();
    }
    if (aux_) {
        aux_->weight.reset();
        aux_->filter.reset();
        aux_->levels.reset();
    }
    started_ = false;
    preRollSamples_ = 0;
}

void Slm::resetStatistics() {
    if (bank_) {
        for (BandLevels<kLaneWidth>& l : bank_->levels) l.resetStatistics();
    }
    if (aux_) aux_->levels.resetStatistics();
}

void Slm::preCondition(const std::int16_t* in, float* out, const std::uint32_t* marks,
                       std::size_t count, float rangeMultiplier, float calibrationGain) {
    constexpr std::size_t kPeriod = 4800;
    const float range = rangeMultiplier > 0.0F ? rangeMultiplier : 1.0F;
    for (std::size_t start = 0; start < count; start += kPeriod) {
        const bool marked = marks != nullptr && marks[start / kPeriod] != 0;
        const float gain = marked ? calibrationGain * range : calibrationGain;
        const std::size_t end = std::min(count, start + kPeriod);
        for (std::size_t i = start; i < end; ++i) out[i] = static_cast<float>(in[i]) * gain;
    }
}

void Slm::preRoll(const float* data, std::size_t n) {
    if (started_) throw std::logic_error("pre-roll must come before the first addSamples");
    const FlushDenormals flush;
    const std::size_t skip = n % kDecimationGrid;
    processChunk(data + skip, n - skip, false);
    preRollSamples_ += n - skip;
}

double Slm::preRollSeconds() const { return static_cast<double>(preRollSamples_) / fs_; }

void Slm::addSamples(const float* data, std::size_t n, std::size_t /*unused*/,
                     std::size_t leqSamples) {
    const FlushDenormals flush;
    started_ = true;
    if (leqSamples != 0) {
        if (bank_) {
            for (BandLevels<kLaneWidth>& l : bank_->levels) l.beginCall();
        }
        if (aux_) aux_->levels.beginCall();
    }
    processChunk(data, n, true);
    if (leqSamples != 0) {
        if (bank_) {
            for (BandLevels<kLaneWidth>& l : bank_->levels) l.endCall();
        }
        if (aux_) aux_->levels.endCall();
    }
}

void Slm::processChunk(const float* data, std::size_t n, bool entering) {
    for (std::size_t pos = 0; pos < n; pos += maxBlock_) {
        const std::size_t m = std::min(maxBlock_, n - pos);
        const float* x = data + pos;
        if (bank_) {
            bank_->weight.Process(x, weighted_.data(), m);
            bank_->sink.entering = entering;
            bank_->filter.process(weighted_.data(), m, bank_->sink);
        }
        if (aux_) {
            const float* weighted = weighted_.data();
            if (!bank_ || bank_->fw != aux_->fw) {
                aux_->weight.Process(x, auxBuffer_.data(), m);
                weighted = auxBuffer_.data();
            }
            aux_->filter.process(weighted, auxBuffer_.data(), m);
            aux_->levels.process(auxBuffer_.data(), m, entering);
        }
    }
}

template <std::size_t W>
void Slm::readStatistics(const BandLevels<W>& levels, std::size_t lane, float* leq, float* lmin,
                         float* lmax, float* out, float* lpeak, std::uint64_t* levelCount,
                         double* seconds) const {
    if (leq != nullptr) *leq = Dsp::powerToDb(levels.leqPower(lane));
    double lo = 0.0;
    double hi = 0.0;
    const bool any = levels.extremes(lane, lo, hi);
    if (lmin != nullptr) *lmin = any ? Dsp::powerToDb(lo) : 0.0F;
    if (lmax != nullptr) *lmax = any ? Dsp::powerToDb(hi) : 0.0F;
    if (out != nullptr) levels.percentiles(lane, percents_, out);
    if (lpeak != nullptr) {
        const double p = levels.peak(lane);
        *lpeak = Dsp::powerToDb(p * p);
    }
    if (levelCount != nullptr) *levelCount = levels.levelCount(lane);
    if (seconds != nullptr) *seconds = levels.seconds();
}

bool Slm::getStatistics(unsigned band, float* leq, float* lmin, float* lmax, float* levels,
                        float* lpeak, std::uint64_t* levelCount, double* seconds) const {
    if (!bank_ || band < first_ || band > last_) return false;
    readStatistics(bank_->levels[bank_->filter.groupOf(band)], bank_->filter.laneOf(band), leq,
                   lmin, lmax, levels, lpeak, levelCount, seconds);
    return true;
}

const std::vector<Leq>& Slm::getShortLeq(unsigned band) const {
    static const std::vector<Leq> kNone;
    if (!bank_ || band < first_ || band > last_) return kNone;
    return bank_->levels[bank_->filter.groupOf(band)].shortLeqs(bank_->filter.laneOf(band));
}

double Slm::settlingSeconds(unsigned band) const {
    if (!bank_ || band < first_ || band > last_) return 0.0;
    return bank_->settle[band];
}

bool Slm::getAuxStatistics(float* leq, float* lmin, float* lmax, float* levels, float* lpeak,
                           std::uint64_t* levelCount, double* seconds) const {
    if (!aux_) return false;
    readStatistics(aux_->levels, 0, leq, lmin, lmax, levels, lpeak, levelCount, seconds);
    return true;
}

const std::vector<Leq>& Slm::getAuxShortLeq() const {
    static const std::vector<Leq> kNone;
    return aux_ ? aux_->levels.shortLeqs(0) : kNone;
}

double Slm::auxSettlingSeconds() const { return aux_ ? aux_->settle : 0.0; }

}  // namespace SlmLibrary
