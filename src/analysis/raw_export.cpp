#include "analysis/raw_export.h"

#include <algorithm>

#include "dsp.h"
#include "platform/error_text.h"
#include "slm.h"

namespace orv {
namespace {

constexpr std::size_t kPiecePeriods = 600;  // one minute
// A recording's start is primed with its first seconds played backwards.
constexpr std::size_t kPrimeSamples = 2 * kWaveSampleRate;

bool sameHour(const platform::SystemTime& a, const DataFileHeader& h) {
    return a.year == h.year && a.month == h.month && a.day == h.day && a.hour == h.hour;
}

void square(std::vector<float>& v, std::size_t n) {
    for (std::size_t i = 0; i < n; ++i) v[i] *= v[i];
}

}  // namespace

RawLevelExport::RawLevelExport(float calibrationGain, float rangeMultiplier, HourlyRawFiles& files,
                               platform::Console& out)
    : gain_(calibrationGain),
      range_(rangeMultiplier),
      files_(files),
      out_(out),
      weighting_(kWaveSampleRate),
      timeA_(SlmLibrary::TWeight::F, kWaveSampleRate, kWaveSampleRate),
      timeC_(SlmLibrary::TWeight::F, kWaveSampleRate, kWaveSampleRate) {}

// Starts the weightings as if the recording had been going on: its first seconds, played
// backwards, run through the frequency weighting, and the time weightings start from their
// mean square and run over the last of them. So the first periods read no start-up dip.
void RawLevelExport::prime(const float* x, std::size_t n) {
    const std::size_t m = std::min(n, kPrimeSamples);
    std::vector<float> mirror(x, x + m);
    std::reverse(mirror.begin(), mirror.end());
    std::vector<float> a(m), c(m);
    weighting_.init(SlmLibrary::FWeight::All, kWaveSampleRate);
    weighting_.ProcessAll(mirror.data(), nullptr, c.data(), a.data(), m);
    const std::size_t half = m / 2;
    double sumA = 0.0, sumC = 0.0;
    for (std::size_t i = half; i < m; ++i) {
        a[i] *= a[i];
        c[i] *= c[i];
        sumA += a[i];
        sumC += c[i];
    }
    const double count = static_cast<double>(std::max<std::size_t>(m - half, 1));
    timeA_.reset();
    timeC_.reset();
    timeA_.prime(sumA / count);
    timeC_.prime(sumC / count);
    timeA_.Process(a.data() + half, m - half);
    timeC_.Process(c.data() + half, m - half);
}

void RawLevelExport::onDispatch(const AudioBlock& block) {
    if (!block.continuesRecording) started_ = false;
    const std::size_t periods = block.periodCount();
    // Buffers grow to the longest piece seen: a minute, or the longest shorter block.
    const std::size_t longest = std::min(kPiecePeriods, periods) * kPeriodSamples;
    if (raw_.size() < longest) {
        raw_.resize(longest);
        x_.resize(longest);
        a_.resize(longest);
        c_.resize(longest);
    }
    for (std::size_t first = 0; first < periods; first += kPiecePeriods) {
        const std::size_t count = std::min(kPiecePeriods, periods - first);
        const std::size_t n = count * kPeriodSamples;
        std::string failed;
        int error = 0;
        if (!block.audio.read(std::uint64_t{first} * kPeriodSamples, n, raw_.data(), &failed,
                              &error)) {
            out_.print("ERR: Unable to read %s : %s\r\n", failed.c_str(),
                       error != 0 ? platform::errorText(error).c_str() : "unexpected end of file");
            started_ = false;  // the audio after the gap starts afresh
            return;
        }
        SlmLibrary::Slm::preCondition(raw_.data(), x_.data(), block.marks.data() + first, n, range_,
                                      gain_);
        if (!started_) prime(x_.data(), n);
        started_ = true;
        weighting_.ProcessAll(x_.data(), nullptr, c_.data(), a_.data(), n);
        square(a_, n);
        square(c_, n);
        const float perSample = 1.0F / static_cast<float>(kPeriodSamples);
        for (std::size_t k = 0; k < count; ++k) {
            float* a = a_.data() + k * kPeriodSamples;
            float* c = c_.data() + k * kPeriodSamples;
            double sumA = 0.0, sumC = 0.0;
            for (std::size_t i = 0; i < kPeriodSamples; ++i) {
                sumA += a[i];
                sumC += c[i];
            }
            timeC_.Process(c, kPeriodSamples);
            timeA_.Process(a, kPeriodSamples);
            const BlockPeriod& p = block.periods[first + k];
            RawLevelRecord r;
            r.time = p.time;
            r.splA = SlmLibrary::Dsp::powerToDb(a[kPeriodSamples - 1]);
            r.splC = SlmLibrary::Dsp::powerToDb(c[kPeriodSamples - 1]);
            r.leqA = SlmLibrary::Dsp::powerToDb(static_cast<float>(sumA) * perSample);
            r.leqC = SlmLibrary::Dsp::powerToDb(static_cast<float>(sumC) * perSample);
            r.condition = p.status != 0 ? 3U : block.marks[first + k];
            r.battery = p.battery;
            addRecord(r, block.headers[p.header]);
        }
    }
}

void RawLevelExport::addRecord(const RawLevelRecord& record, const DataFileHeader& header) {
    // The first record of another hour completes the hour in progress.
    if (!hour_.empty() && !sameHour(record.time, hourHeader_)) finish();
    if (hour_.empty()) hourHeader_ = header;
    hour_.push_back(record);
}

void RawLevelExport::finish() {
    if (hour_.empty()) return;
    files_.write(hourHeader_, hour_);
    hour_.clear();
}

}  // namespace orv
