// The sound level meter: frequency weighting, an octave or third-octave bank and one
// filtered channel, each band with its own time weighting and statistics.
//
// Use (one meter per block of audio; meters share nothing mutable, so several can run on
// different threads):
//   Slm slm(48000, 1, 48000);
//   slm.initThirdOct(TWeight::F, FWeight::A, 0, 35, 48000, 0);   // or initFullOct(.., 0, 11, ..)
//   slm.initAuxCh(3, corners, TWeight::F, FWeight::Z, 48000);     // optional filtered channel
//   slm.setPercentiles({10, 50, 90});
//   slm.resetAll();
//   slm.preRoll(previousAudio, n);     // optional, see below
//   slm.addSamples(block, n, n / 10, n);   // repeatedly, n <= 48000
//   slm.getStatistics(band, &leq, &lmin, &lmax, levels, &lpeak, nullptr, nullptr);
//   slm.getAuxStatistics(&leq, &lmin, &lmax, levels, &lpeak, nullptr, nullptr);
//
// Channels. The bank's bands are addressed by their band index (ThirdOctaveBandEnum
// 0..35 or FullOctaveBandEnum 0..11, low to high, as in the name tables); the filtered
// channel has its own accessors (getAuxStatistics, getAuxShortLeq). No index is shared
// between the two.
//
// Scale. Levels are 10 log10 of mean squares of the float samples (dB re 1); preCondition
// turns 16-bit samples into calibrated floats.
//
// Statistics per channel, over every sample entered with addSamples since resetAll (or
// resetStatistics): Leq (energy mean); Lmax and Lmin, the extremes of the time-weighted
// level over every output sample of the band (bands run at 48000 / 2^s Hz, see
// octave_filter.h; N: over the 100 ms equivalent levels); Ln, the level exceeded for n % of
// the time, from a histogram of 0.1 dB classes of the time-weighted level taken every 10 ms
// (100 per second); Lpeak, 20 log10 of the largest absolute value of the weighted, filtered
// signal at the band's rate. A level with no entry reads 0.0 dB.
//
// Short Leqs. Every addSamples call with a non-zero last argument appends, for every band
// and the filtered channel, a Leq of exactly that call's samples (energy = mean square x
// seconds). For bands at a decimated rate "that call's samples" are the band samples that
// the call completed, which are exactly its own when n is a multiple of 32 (every whole
// number of 100 ms periods is).
//
// Lpeak is the crest of the band signal, found between its samples too (quarter-sample
// interpolation around the largest samples, band_levels.h), within 0.2 dB, for every band
// that lies below a quarter of its rate: all but the bands computed at 48000 Hz above
// 11 kHz (third octaves 12.5, 16, 20 kHz; octave 16 kHz). Those and the filtered channel take
// the largest sample at 48000 Hz, as a meter sampling at that rate does.
//
// Start-up. Each channel has a warm-up (band_levels.h): its filters first settle (40 dB
// decay of the slowest pole on the way: frequency weighting, anti-alias stages, band
// filter: 2.3 s for the 6.3 Hz third-octave band, 0.8 s for the 8 Hz octave band, under
// 0.25 s above 80 Hz), then the time weighting is primed with the mean square of at least
// max(tau, 2 / fm) seconds (N: no priming). Whole warm-up with F: 2.6 s (6.3 Hz third
// octave), 1.05 s (8 Hz octave), under 0.4 s above 80 Hz; with S add about 0.75 s.
// Levels of the warm-up are left out of Lmax, Lmin, Ln and Lpeak but counted in Leq and
// the short Leqs; settlingSeconds(band) tells how long it is. So the first block of a
// recording starts without start-up artefacts.
//
// Pre-roll: audio that precedes the block, given to preRoll before the first addSamples,
// runs through the filters, the time weightings and the warm-up without entering anything
// into the statistics or short Leqs; when it is longer than the warm-up, the time weighting
// is primed over all of it. A band whose warm-up fits in the pre-roll starts its statistics
// at the block's first sample. How much pre-roll makes a block read as the same stretch of
// one continuous analysis (within 0.2 dB for Leq, Lmax, Lmin and Ln in every band, stationary
// and fluctuating noise, tested): F and N: 3 s, longer than the longest warm-up (2.6 s,
// 6.3 Hz third octave; with 2 s that band would start 0.6 s into the block, and on a short
// block of fluctuating noise its Ln would be off by up to 0.8 dB); S: 8 s, because the S
// average still carries 13 % of the audio older than 2 s; with 2 s of pre-roll the S levels of
// bands below about 30 Hz may differ by up to 0.7 dB during the first seconds of the block.
#pragma once

#include <cstddef>
#include <cstdint>
#include <initializer_list>
#include <memory>
#include <vector>

#include "band_levels.h"
#include "fweight.h"
#include "ipp_buffer.h"
#include "leq.h"
#include "octave_filter.h"
#include "sos.h"
#include "tweight.h"

namespace SlmLibrary {

// Filter type codes of the filtered channel.
enum SigFilterType : unsigned {
    kLowPass = 1,
    kHighPass = 2,
    kBandPass = 3,
    kBandStop = 4,
    kAllPass = 6,
};

class Slm {
public:
    // sampleRate must be 48000; channels must be 1; maxBlock is the largest n for which
    // addSamples and preRoll work without splitting (larger calls are split internally).
    explicit Slm(double sampleRate = 48000.0, unsigned channels = 1, std::size_t maxBlock = 48000);
    ~Slm();
    Slm(const Slm&) = delete;
    Slm& operator=(const Slm&) = delete;
    Slm(Slm&&) noexcept;
    Slm& operator=(Slm&&) noexcept;

    // Sets up the bank: time weighting tw (N, F, S), frequency weighting fw (Z, A, C) ahead
    // of it, bands first..last (inclusive). `reserved` must be 0. Throws
    // std::invalid_argument with the reason on a refused value; std::bad_alloc may escape.
    void initFullOct(unsigned tw, unsigned fw, unsigned first, unsigned last, double sampleRate,
                     unsigned reserved);
    void initThirdOct(unsigned tw, unsigned fw, unsigned first, unsigned last, double sampleRate,
                      unsigned reserved);
    // Filtered channel: Butterworth, 4th order per edge (24 dB/octave), -3 dB at the corners:
    // low-pass (corners[0]), high-pass (corners[0]), band-pass and band-stop
    // (corners[0]..corners[1]), all-pass (no filter). Own weightings. Throws
    // std::invalid_argument.
    void initAuxCh(unsigned filterType, const float corners[2], unsigned tw, unsigned fw,
                   double sampleRate);

    // Percentiles n of Ln, in output order (fractions allowed).
    void setPercentiles(const std::vector<float>& percents);
    void setPercentiles(const std::vector<std::uint32_t>& percents);
    void setPercentiles(std::initializer_list<float> percents);
    std::size_t percentileCount() const { return percents_.size(); }

    // Filters, time weightings, warm-up, statistics and short Leqs back to the start.
    void resetAll();
    // Statistics and short Leqs cleared; filters, time weightings and warm-up carry on
    // (consecutive intervals of one continuous analysis).
    void resetStatistics();

    // x = s * calibrationGain * (marks[k] != 0 ? rangeMultiplier : 1) for the samples of
    // period k (4800 samples); a rangeMultiplier <= 0 counts as 1; marks may be null.
    static void preCondition(const std::int16_t* in, float* out, const std::uint32_t* marks,
                             std::size_t count, float rangeMultiplier, float calibrationGain);

    // Audio preceding the block, before the first addSamples since resetAll (throws
    // std::logic_error afterwards). Its first n mod 32 samples are skipped so that the block
    // starts on the bank's decimation grid. May be called more than once with consecutive
    // audio whose lengths are multiples of 32.
    void preRoll(const float* data, std::size_t n);
    double preRollSeconds() const;

    // Analyses n samples. The third argument is accepted for the callers' convention and
    // not used (the level rate is fixed, see above). leqSamples != 0: append a short Leq of
    // this call to every channel.
    void addSamples(const float* data, std::size_t n, std::size_t unused, std::size_t leqSamples);

    // Bank bands.
    unsigned firstBand() const { return first_; }
    unsigned lastBand() const { return last_; }
    bool hasBank() const { return bank_ != nullptr; }
    // Statistics of band `band` (any output pointer may be null; levels gets one value per
    // percentile). Returns false, and writes nothing, for a band that is not set up.
    bool getStatistics(unsigned band, float* leq, float* lmin, float* lmax, float* levels,
                       float* lpeak, std::uint64_t* levelCount, double* seconds) const;
    // Empty for a band that is not set up.
    const std::vector<Leq>& getShortLeq(unsigned band) const;
    // Warm-up time of a band (filters settling plus priming), seconds.
    double settlingSeconds(unsigned band) const;

    // Filtered channel.
    bool hasAux() const { return aux_ != nullptr; }
    bool getAuxStatistics(float* leq, float* lmin, float* lmax, float* levels, float* lpeak,
                          std::uint64_t* levelCount, double* seconds) const;
    const std::vector<Leq>& getAuxShortLeq() const;
    double auxSettlingSeconds() const;

private:
    struct Bank;
    struct Aux;

    void initBank(OctaveFilter::Bank kind, unsigned tw, unsigned fw, unsigned first, unsigned last,
                  double sampleRate, unsigned reserved);
    void processChunk(const float* data, std::size_t n, bool entering);
    template <std::size_t W>
    void readStatistics(const BandLevels<W>& levels, std::size_t lane, float* leq, float* lmin,
                        float* lmax, float* out, float* lpeak, std::uint64_t* levelCount,
                        double* seconds) const;

    double fs_;
    std::size_t maxBlock_;
    unsigned first_ = 0;
    unsigned last_ = 0;
    std::unique_ptr<Bank> bank_;
    std::unique_ptr<Aux> aux_;
    std::vector<float> percents_;
    std::vector<float> weighted_;
    std::vector<float> auxBuffer_;
    bool started_ = false;
    std::size_t preRollSamples_ = 0;
};

}  // namespace SlmLibrary
