// The options of one run. Written at start-up and while the command line is parsed,
// read-only afterwards (except features the driver switches off for the rest of a run).
#pragma once

#include <cstdint>
#include <string>
#include <vector>

namespace orv {

// Where a filter option is enabled: AcceptedFilterFrequencies[j] is the nominal centre of
// the third-octave band that runs from BandEdges[j] to BandEdges[j + 1].
inline constexpr std::size_t kAcceptedFilterFrequencyCount = 30;
extern const std::int32_t kAcceptedFilterFrequencies[kAcceptedFilterFrequencyCount];
// Band edges 10^(1.35 + k/10) Hz, k = 0..30, as single-precision values.
float bandEdge(std::size_t k);

enum class AuxFilterType : std::uint32_t {
    None = 0,
    LowPass = 1,
    HighPass = 2,
    BandPass = 3,
    BandStop = 4,
    AllPass = 6,
};

struct ProcessingSettings {
    std::uint32_t statsIntervalMin = 0;  // minutes; 0 stands for 60
    std::uint32_t leqInterval = 0;       // seconds; 0 stands for 60; kLeqOff = no short Leq
    std::uint32_t generalWeighting = 0;  // frequency weighting code
    std::uint32_t octaveFreqWeighting = 0;
    std::uint32_t octaveTimeWeighting = 0;
    std::uint32_t octaveBandCount = 0;  // 0 off, 12 or 36
    std::uint32_t auxFreqWeighting = 0;
    std::uint32_t auxTimeWeighting = 0;
    std::uint32_t auxFilterType = 0;  // AuxFilterType
    float auxFreq1 = 0.0F;            // Hz
    float auxFreq2 = 0.0F;            // Hz
    std::uint32_t auxBand1 = 0;
    std::uint32_t auxBand2 = 0;
    std::uint32_t rawLevelCsv = 0;
    std::uint32_t binMode = 0;
    std::uint32_t triggeredHandling = 0;  // 0 Split, 1 Continual
    std::string outputDir;                // absolute, ends with the path separator
    std::uint32_t outputDirValid = 0;
    std::vector<float> percentiles;  // ascending
    std::string pipeName;            // empty: no progress pipe
    std::uint32_t needWaveFiles = 0;
    std::uint32_t recursiveSearch = 0;

    static constexpr std::uint32_t kLeqOff = 99;

    std::uint32_t percentileCount() const { return static_cast<std::uint32_t>(percentiles.size()); }
    bool leqOn() const { return leqInterval != kLeqOff; }
};

}  // namespace orv
