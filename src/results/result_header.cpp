#include "results/result_header.h"

#include "results/text_buffer.h"

namespace orv {

std::string formatHeaderBlock(const ResultHeaderInfo& info, const std::string& firstLine,
                              const char* frequencyWeighting, const char* timeAveraging,
                              std::uint32_t leqLengthSeconds) {
    constexpr const char* kField = "\",\"\",\"\",\"\",\"";
    TextBuffer b;
    b.append(firstLine);
    b.append("\"Logger Serial Number%s%s\"\r\n", kField, info.serialNumber.c_str());
    b.append("\"Measurement Title%s%s\"\r\n", kField, info.title.c_str());
    const platform::SystemTime& s = info.sessionStart;
    const platform::SystemTime& e = info.sessionEnd;
    b.append("\"Measurement started at%s%02u/%02u/%02u - %02u:%02u:%02u\"\r\n", kField, s.day,
             s.month, s.year, s.hour, s.minute, s.second);
    b.append("\"Measurement stopped at%s%02u/%02u/%02u - %02u:%02u:%02u\"\r\n", kField, e.day,
             e.month, e.year, e.hour, e.minute, e.second);
    b.append("\"Frequency Weighting%s%s\"\r\n", kField, frequencyWeighting);
    b.append("\"Time Averaging%s%s\"\r\n", kField, timeAveraging);
    b.append("\"Statistical Interval%s%u min\"\r\n", kField,
             displayInterval(info.statsIntervalMin));
    b.append("\"Auxiliary Power%sNot Applicable\"\r\n", kField);
    b.append("\"Tape Recorder%sNot Applicable\"\r\n", kField);
    b.append("\"Short Term Leq%sNot Applicable\"\r\n", kField);
    if (leqLengthSeconds != 0) {
        b.append("\"Short Term Leq Length%s%u sec\"\r\n", kField, leqLengthSeconds);
    } else {
        b.append("\"Short Term Leq Length%sNot Applicable\"\r\n", kField);
    }
    for (const char* key : {"Start Trigger", "Stop Trigger", "Master Timer", "Sub Timer",
                            "Pre-measurement Reference", "Post-measurement Reference"}) {
        b.append("\"%s%sNot Applicable\"\r\n", key, kField);
    }
    b.append("\"Engineering Units%sdB SPL\"\r\n", kField);
    b.append("\r\n");
    return b.str();
}

int truncatePercentile(float percent) {
    constexpr float kLimit = 2147483520.0F;  // the largest float below 2^31
    if (!(percent > -kLimit)) return percent != percent ? 0 : -static_cast<int>(kLimit);
    if (percent > kLimit) return static_cast<int>(kLimit);
    return static_cast<int>(percent);
}

std::string percentileLabels(const std::vector<float>& percentiles) {
    TextBuffer b;
    for (float p : percentiles) b.append("\"L%d\",", truncatePercentile(p));
    return b.str();
}

}  // namespace orv
