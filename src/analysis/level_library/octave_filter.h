// Octave and third-octave filter banks (IEC 61260-1:2014, class 1) and their band names.
//
// Mid-band frequencies are base 10: fm = 1000 * G^(x/b), G = 10^0.3, b = 1 or 3; band edges
// fm * G^(+-1/(2b)). 1/1 octave: 12 bands 8 Hz .. 16 kHz; 1/3 octave: 36 bands
// 6.3 Hz .. 20 kHz; band index 0 is the lowest, as in the name tables.
//
// Each band is a Butterworth band-pass (third order prototype, six poles; fourth order for
// the bands close to Nyquist where the pre-warped design would otherwise leave the class 1
// mask), designed with pre-warped -3 dB edges and unity gain at fm, as second-order sections.
//
// Multirate: the input (48000 Hz) feeds the bands above 5.6 kHz directly. A Chebyshev II
// anti-alias filter (8th order, flat within 0.012 dB to 0.118 fs, at least 80 dB down from
// 0.25 fs) and a decimation by two then give the next stage, 24000 Hz, for the next octave,
// and so on down to 1500 Hz, where all bands below 355 Hz are computed (each stage's bands
// lie below 0.237 of its rate). Aliased components are therefore at least 80 dB down, below
// every class 1 stop-band limit. The anti-alias filters and the bands at 48000..3000 Hz run
// in single precision (their rounding noise stays more than 150 dB below a tone), the bands
// of the 1500 Hz stage in double precision; bands of a stage are computed side by side as
// lanes.
//
// Band outputs come at their stage rate: 48000 / 2^s, s = 0..5.
#pragma once

#include <array>
#include <cstddef>
#include <vector>

#include "sos.h"

namespace SlmLibrary {

// 1/1-octave bands 8 Hz .. 16 kHz, low to high.
enum FullOctaveBandEnum : unsigned { kFullOctaveBandCount = 12 };
// 1/3-octave bands 6.3 Hz .. 20 kHz, low to high.
enum ThirdOctaveBandEnum : unsigned { kThirdOctaveBandCount = 36 };

class OctaveFilter {
public:
    enum class Bank { Full, Third };
    static constexpr double kSampleRate = 48000.0;
    static constexpr unsigned kStages = 6;  // 48000, 24000, ..., 1500 Hz

    // Nominal mid-band names ("31.5Hz", "1kHz"). A band outside the table gives "?".
    static const char* getFullName(unsigned band);
    static const char* getThirdName(unsigned band);
    static const char* bandName(Bank bank, unsigned band);

    static unsigned bandCount(Bank bank);
    static unsigned bandsPerOctave(Bank bank) { return bank == Bank::Full ? 1U : 3U; }
    // Exact base-10 mid-band frequency (Hz).
    static double midBandFrequency(Bank bank, unsigned band);

    // Class 1 acceptance limits of relative attenuation (dB, positive = attenuation) at the
    // normalised frequency omega = f / fm (IEC 61260-1:2014, Table 1; linear in log omega
    // between breakpoints; the same limits at 1/omega). At the band edge itself the limits
    // of both sides apply.
    struct Limits {
        double minAttenuationDb;
        double maxAttenuationDb;  // +infinity where there is no upper limit
    };
    static Limits class1Limits(Bank bank, double omega);
    // The breakpoint frequencies omega >= 1 of the class 1 mask (centre, pass band, edge,
    // stop band).
    static std::vector<double> maskBreakpoints(Bank bank);

    // Lanes of one stage computed together.
    struct Group {
        unsigned stage = 0;
        double rate = kSampleRate;
        std::array<int, kLaneWidth> band{};  // band index per lane, -1 for an unused lane
    };
    // Receives the band outputs of a group: count frames of kLaneWidth floats.
    class Sink {
    public:
        virtual ~Sink() = default;
        virtual void onBands(std::size_t group, const float* frames, std::size_t count) = 0;
    };

    explicit OctaveFilter(Bank bank);
    ~OctaveFilter();
    OctaveFilter(OctaveFilter&&) noexcept;
    OctaveFilter& operator=(OctaveFilter&&) noexcept;

    Bank bank() const { return bank_; }
    const std::vector<Group>& groups() const;
    // Group and lane of a band.
    std::size_t groupOf(unsigned band) const;
    std::size_t laneOf(unsigned band) const;
    // Time (s) after which the transient of a switched-on input has decayed by decayDb in
    // the band (slowest pole of the anti-alias stages and the band filter).
    double settleSeconds(unsigned band, double decayDb) const;
    // Response (dB) of the band's own filter, at its stage rate, to a frequency below that
    // stage's Nyquist frequency; the anti-alias filters of the earlier stages are included.
    double designResponseDb(unsigned band, double f) const;

    void reset();
    // Filters n samples at 48000 Hz (any n; decimation phases carry over between calls).
    void process(const float* in, std::size_t n, Sink& sink);

    // Measures every band's level (dB re the input) for a unit sine of frequency f that is
    // faded in, given settleSeconds to settle and measured over at least measureSeconds,
    // on a fresh bank: the full implementation, decimation and aliasing included.
    static std::vector<double> toneResponseDb(Bank bank, double f, double settleSeconds,
                                              double measureSeconds);

private:
    struct Design;
    static const Design& design(Bank bank);

    // The zeros of a stage's bands (BandZeros of the order its lanes read) and their output
    // for one chunk.
    struct StageZeros {
        BandZeros zeros;
        std::vector<float> outF;
        std::vector<double> outD;
    };

    Bank bank_;
    const Design* design_;
    std::vector<SosCascade> antiAlias_;     // one per stage transition
    std::vector<SosLanes<float>> lanesF_;   // per group (float stages)
    std::vector<SosLanes<double>> lanesD_;  // per group (double stage)
    std::vector<StageZeros> zeros_;         // per stage
    std::vector<std::vector<float>> stageBuffers_;
    std::vector<float> frames_;
};

}  // namespace SlmLibrary
