#include "octave_filter.h"

#include <algorithm>
#include <cmath>
#include <limits>
#include <numbers>
#include <stdexcept>

namespace SlmLibrary {
namespace {

constexpr double kG = 1.9952623149688795;  // 10^0.3
constexpr unsigned kDoubleStage = OctaveFilter::kStages - 1;
// Frames per lane pass: the output (15 KB) stays in L1, and a chunk of the 48000 Hz stage is
// one 10 ms step of the statistics (fewer, longer kernel calls).
constexpr std::size_t kChunk = 480;
constexpr double kInf = std::numeric_limits<double>::infinity();

// Stage (0..5) of a band: each stage's bands lie below 0.237 of its rate.
unsigned stageOf(OctaveFilter::Bank bank, unsigned band) {
    if (bank == OctaveFilter::Bank::Third) {
        if (band >= 30) return 0;
        return std::min(kDoubleStage, (32U - band) / 3U);
    }
    if (band >= 10) return 0;
    return std::min(kDoubleStage, 10U - band);
}

// Class 1 limits at the breakpoints x (octave exponent) of IEC 61260-1:2014.
struct Breakpoint {
    double x;
    double minDb;
    double maxDb;
};
constexpr Breakpoint kPassBand[] = {
    {0.0, -0.4, 0.4}, {0.125, -0.4, 0.5}, {0.25, -0.4, 0.7}, {0.375, -0.4, 1.4}, {0.5, -0.4, 5.3}};
constexpr Breakpoint kStopBand[] = {
    {0.5, 1.2, kInf}, {1.0, 16.6, kInf}, {2.0, 40.5, kInf}, {3.0, 60.0, kInf}, {4.0, 70.0, kInf}};

double omegaOf(unsigned b, double x) {
    return 1.0 + (std::pow(kG, 1.0 / (2.0 * b)) - 1.0) / (std::pow(kG, 0.5) - 1.0) *
                     (std::pow(kG, x) - 1.0);
}

template <std::size_t N>
OctaveFilter::Limits interpolate(const Breakpoint (&table)[N], unsigned b, double omega) {
    for (std::size_t i = 0; i + 1 < N; ++i) {
        const double o0 = omegaOf(b, table[i].x);
        const double o1 = omegaOf(b, table[i + 1].x);
        if (omega <= o1) {
            const double t = std::log(omega / o0) / std::log(o1 / o0);
            const double lo = table[i].minDb + t * (table[i + 1].minDb - table[i].minDb);
            const double hi = std::isinf(table[i].maxDb)
                                  ? kInf
                                  : table[i].maxDb + t * (table[i + 1].maxDb - table[i].maxDb);
            return {lo, hi};
        }
    }
    return {table[N - 1].minDb, table[N - 1].maxDb};
}

SosList designBand(OctaveFilter::Bank bank, unsigned band, int order, double rate) {
    const unsigned b = OctaveFilter::bandsPerOctave(bank);
    const double fm = OctaveFilter::midBandFrequency(bank, band);
    const double f1 = fm * std::pow(kG, -1.0 / (2.0 * b));
    const double f2 = fm * std::pow(kG, 1.0 / (2.0 * b));
    const double w1 = design::prewarp(f1, rate);
    const double w2 = design::prewarp(f2, rate);
    const Zpk analog =
        design::lowpassToBandpass(design::butterworthPrototype(order), std::sqrt(w1 * w2), w2 - w1);
    return design::toSos(design::bilinear(analog, rate), fm, rate, 1.0);
}

// True when the band filter alone stays inside the class 1 mask up to the stage's Nyquist
// frequency (dense check, both sides of fm).
bool insideMask(OctaveFilter::Bank bank, unsigned band, const SosList& sos, double rate) {
    const double fm = OctaveFilter::midBandFrequency(bank, band);
    for (int i = -400; i <= 400; ++i) {
        const double omega = std::pow(6.0, i / 400.0);
        const double f = fm * omega;
        if (f >= 0.499 * rate) break;
        const OctaveFilter::Limits lim = OctaveFilter::class1Limits(bank, omega);
        const double att = -design::magnitudeDb(sos, f, rate);
        if (att < lim.minAttenuationDb + 0.05 || att > lim.maxAttenuationDb - 0.05) return false;
    }
    return true;
}

}  // namespace

// Read-only design shared by every bank of the same kind: made once, never changed.
struct OctaveFilter::Design {
    std::vector<SosList> bandSos;     // per band, at its stage rate
    std::vector<unsigned> bandStage;  // per band
    SosList antiAlias;                // normalised to the stage rate (same at every stage)
    std::vector<Group> groups;
    std::vector<std::size_t> groupOf;
    std::vector<std::size_t> laneOf;
};

const OctaveFilter::Design& OctaveFilter::design(Bank bank) {
    auto make = [](Bank k) {
        Design d;
        const unsigned count = bandCount(k);
        // Anti-alias: pass band to 0.118 fs, stop band from 0.25 fs, designed at unit rate.
        const double rate = 1.0;
        const Zpk proto = design::chebyshev2Prototype(8, 80.0);
        d.antiAlias = design::toSos(
            design::bilinear(design::lowpassToLowpass(proto, design::prewarp(0.25, rate)), rate),
            0.0, rate, 1.0);
        for (unsigned band = 0; band < count; ++band) {
            const unsigned stage = stageOf(k, band);
            const double stageRate = kSampleRate / std::pow(2.0, stage);
            SosList sos = designBand(k, band, 3, stageRate);
            if (!insideMask(k, band, sos, stageRate)) sos = designBand(k, band, 4, stageRate);
            d.bandSos.push_back(sos);
            d.bandStage.push_back(stage);
        }
        d.groupOf.resize(count);
        d.laneOf.resize(count);
        for (unsigned stage = 0; stage < kStages; ++stage) {
            std::vector<unsigned> members;
            for (unsigned band = 0; band < count; ++band) {
                if (d.bandStage[band] == stage) members.push_back(band);
            }
            const std::size_t groups = (members.size() + kLaneWidth - 1) / kLaneWidth;
            for (std::size_t g = 0; g < groups; ++g) {
                Group group;
                group.stage = stage;
                group.rate = kSampleRate / std::pow(2.0, stage);
                group.band.fill(-1);
                // Spread evenly over the groups of the stage.
                const std::size_t begin = g * members.size() / groups;
                const std::size_t end = (g + 1) * members.size() / groups;
                for (std::size_t i = begin; i < end; ++i) {
                    group.band[i - begin] = static_cast<int>(members[i]);
                    d.groupOf[members[i]] = d.groups.size();
                    d.laneOf[members[i]] = i - begin;
                }
                d.groups.push_back(group);
            }
        }
        return d;
    };
    static const Design kFull = make(Bank::Full);
    static const Design kThird = make(Bank::Third);
    return bank == Bank::Full ? kFull : kThird;
}

const char* OctaveFilter::bandName(Bank bank, unsigned band) {
    return bank == Bank::Full ? getFullName(band) : getThirdName(band);
}

unsigned OctaveFilter::bandCount(Bank bank) {
    return bank == Bank::Full ? static_cast<unsigned>(kFullOctaveBandCount)
                              : static_cast<unsigned>(kThirdOctaveBandCount);
}

double OctaveFilter::midBandFrequency(Bank bank, unsigned band) {
    // Band 0 is 8 Hz (x = -7) for octaves, 6.3 Hz (x = -22) for third octaves.
    const double x =
        bank == Bank::Full ? static_cast<double>(band) - 7.0 : static_cast<double>(band) - 22.0;
    return 1000.0 * std::pow(kG, x / bandsPerOctave(bank));
}

OctaveFilter::Limits OctaveFilter::class1Limits(Bank bank, double omega) {
    const unsigned b = bandsPerOctave(bank);
    if (omega < 1.0) omega = 1.0 / omega;
    const double edge = omegaOf(b, 0.5);
    if (std::abs(omega - edge) <= 1e-12 * edge) {
        return {kStopBand[0].minDb, kPassBand[4].maxDb};
    }
    return omega < edge ? interpolate(kPassBand, b, omega) : interpolate(kStopBand, b, omega);
}

std::vector<double> OctaveFilter::maskBreakpoints(Bank bank) {
    const unsigned b = bandsPerOctave(bank);
    std::vector<double> out;
    for (const Breakpoint& p : kPassBand) out.push_back(omegaOf(b, p.x));
    for (std::size_t i = 1; i < std::size(kStopBand); ++i)
        out.push_back(omegaOf(b, kStopBand[i].x));
    return out;
}

OctaveFilter::OctaveFilter(Bank bank) : bank_(bank), design_(&design(bank)) {
    // The anti-alias filters decimate in single precision: their poles stay well inside the
    // unit circle, and the rounding noise stays near that of the float samples between the
    // stages. Copies share one set of block matrices.
    const SosCascade antiAlias(design_->antiAlias, SosCascade::Precision::Single);
    antiAlias_.assign(kStages - 1, antiAlias);
    zeros_.resize(kStages);
    for (const Group& g : design_->groups) {
        std::vector<SosList> lanes(kLaneWidth);
        for (std::size_t l = 0; l < kLaneWidth; ++l) {
            if (g.band[l] >= 0) lanes[l] = design_->bandSos[static_cast<std::size_t>(g.band[l])];
        }
        unsigned order = 0;
        if (g.stage == kDoubleStage) {
            lanesD_.emplace_back(lanes);
            lanesF_.emplace_back();
            order = lanesD_.back().order();
        } else {
            lanesF_.emplace_back(lanes);
            lanesD_.emplace_back();
            order = lanesF_.back().order();
        }
        // Every group of a stage reads the same zero order (all bands of a stage but the ones
        // next to Nyquist have the same number of sections).
        StageZeros& z = zeros_[g.stage];
        if (z.zeros.order() == 0) z.zeros = BandZeros(order);
        if (z.zeros.order() != order) {
            throw std::logic_error("the groups of a stage read different zero orders");
        }
    }
    for (unsigned s = 0; s < kStages; ++s) {
        StageZeros& z = zeros_[s];
        if (s == kDoubleStage) {
            z.outD.resize(kChunk);
        } else {
            z.outF.resize(kChunk);
        }
    }
    stageBuffers_.resize(kStages);
    frames_.resize(kChunk * kLaneWidth);
}

OctaveFilter::~OctaveFilter() = default;
OctaveFilter::OctaveFilter(OctaveFilter&&) noexcept = default;
OctaveFilter& OctaveFilter::operator=(OctaveFilter&&) noexcept = default;

const std::vector<OctaveFilter::Group>& OctaveFilter::groups() const { return design_->groups; }
std::size_t OctaveFilter::groupOf(unsigned band) const { return design_->groupOf.at(band); }
std::size_t OctaveFilter::laneOf(unsigned band) const { return design_->laneOf.at(band); }

double OctaveFilter::settleSeconds(unsigned band, double decayDb) const {
    const unsigned stage = design_->bandStage.at(band);
    double t = 0.0;
    for (unsigned s = 0; s < stage; ++s) {
        t += design::settleSeconds(design_->antiAlias, kSampleRate / std::pow(2.0, s), decayDb);
    }
    return t + design::settleSeconds(design_->bandSos[band], kSampleRate / std::pow(2.0, stage),
                                     decayDb);
}

double OctaveFilter::designResponseDb(unsigned band, double f) const {
    const unsigned stage = design_->bandStage.at(band);
    double db = design::magnitudeDb(design_->bandSos[band], f, kSampleRate / std::pow(2.0, stage));
    for (unsigned s = 0; s < stage; ++s) {
        db += design::magnitudeDb(design_->antiAlias, f / (kSampleRate / std::pow(2.0, s)), 1.0);
    }
    return db;
}

void OctaveFilter::reset() {
    for (SosCascade& a : antiAlias_) a.reset();
    for (SosLanes<float>& l : lanesF_) l.reset();
    for (SosLanes<double>& l : lanesD_) l.reset();
    for (StageZeros& z : zeros_) z.zeros.reset();
}

void OctaveFilter::process(const float* in, std::size_t n, Sink& sink) {
    const float* stageIn = in;
    std::size_t count = n;
    const std::vector<Group>& groups = design_->groups;
    for (unsigned s = 0; s < kStages && count > 0; ++s) {
        StageZeros& z = zeros_[s];
        for (std::size_t pos = 0; pos < count; pos += kChunk) {
            const std::size_t m = std::min(kChunk, count - pos);
            if (s == kDoubleStage) {
                z.zeros.process(stageIn + pos, m, z.outD.data());
            } else {
                z.zeros.process(stageIn + pos, m, z.outF.data());
            }
            for (std::size_t g = 0; g < groups.size(); ++g) {
                if (groups[g].stage != s) continue;
                if (s == kDoubleStage) {
                    lanesD_[g].process(z.outD.data(), m, frames_.data());
                } else {
                    lanesF_[g].process(z.outF.data(), m, frames_.data());
                }
                sink.onBands(g, frames_.data(), m);
            }
        }
        if (s + 1 < kStages) {
            std::vector<float>& next = stageBuffers_[s + 1];
            if (next.size() < count / 2 + 1) next.resize(count / 2 + 1);
            count = antiAlias_[s].processDecimate(stageIn, count, next.data());
            stageIn = next.data();
        }
    }
}

namespace {

// Mean square of each band over a window, after a settling time.
class ToneSink : public OctaveFilter::Sink {
public:
    ToneSink(const OctaveFilter& bank, std::size_t inputStart)
        : bank_(bank),
          start_(inputStart),
          sums_(OctaveFilter::bandCount(bank.bank()), 0.0),
          counts_(sums_.size(), 0),
          seen_(bank.groups().size(), 0) {}
    void onBands(std::size_t group, const float* frames, std::size_t count) override {
        const OctaveFilter::Group& g = bank_.groups()[group];
        const std::size_t factor = std::size_t{1} << g.stage;
        for (std::size_t i = 0; i < count; ++i) {
            const std::size_t inputIndex = (seen_[group] + i + 1) * factor;
            if (inputIndex <= start_) continue;
            for (std::size_t l = 0; l < kLaneWidth; ++l) {
                if (g.band[l] < 0) continue;
                const double v = frames[i * kLaneWidth + l];
                sums_[static_cast<std::size_t>(g.band[l])] += v * v;
                ++counts_[static_cast<std::size_t>(g.band[l])];
            }
        }
        seen_[group] += count;
    }
    double meanSquare(unsigned band) const {
        return sums_[band] / static_cast<double>(counts_[band]);
    }

private:
    const OctaveFilter& bank_;
    std::size_t start_;
    std::vector<double> sums_;
    std::vector<std::size_t> counts_;
    std::vector<std::size_t> seen_;
};

}  // namespace

std::vector<double> OctaveFilter::toneResponseDb(Bank bank, double f, double settleSeconds,
                                                 double measureSeconds) {
    OctaveFilter filter(bank);
    const auto fade = static_cast<std::size_t>(std::lround(0.5 * settleSeconds * kSampleRate));
    const auto settle = static_cast<std::size_t>(std::lround(settleSeconds * kSampleRate));
    // Whole periods of the tone, rounded to the 1500 Hz grid of the slowest stage.
    const double periods = std::ceil(measureSeconds * f);
    const std::size_t grid = std::size_t{1} << kDoubleStage;
    const std::size_t measure = std::max<std::size_t>(
        grid, static_cast<std::size_t>(std::lround(periods * kSampleRate / f / grid)) * grid);
    std::vector<float> x(settle + measure);
    for (std::size_t i = 0; i < x.size(); ++i) {
        const double t = static_cast<double>(i);
        double gain = 1.0;
        if (i < fade) gain = 0.5 - 0.5 * std::cos(std::numbers::pi * t / static_cast<double>(fade));
        x[i] = static_cast<float>(gain * std::sin(2.0 * std::numbers::pi * f * t / kSampleRate));
    }
    ToneSink sink(filter, settle);
    filter.process(x.data(), x.size(), sink);
    std::vector<double> out(bandCount(bank));
    for (unsigned b = 0; b < out.size(); ++b) out[b] = 10.0 * std::log10(sink.meanSquare(b) / 0.5);
    return out;
}

}  // namespace SlmLibrary
