#include "processing/audio_block.h"

namespace orv {

void AudioBlock::stamp(const LevelRecord& r, const DataFileHeader& header) {
    time.year = header.year;
    time.month = header.month;
    time.dayOfWeek = 0;
    time.day = header.day;
    time.hour = header.hour;
    time.minute = r.minute;
    time.second = r.second;
    time.milliseconds = r.tenth;
}

void AudioBlock::add(const LevelRecord& r, const DataFileHeader& header, const AudioSpans& period) {
    BlockPeriod p;
    p.time = time;
    p.time.milliseconds = static_cast<std::uint16_t>(r.tenth * 100U);
    p.battery = r.battery;
    p.status = r.status;
    if (headers.empty() || headers.back().hour != header.hour || headers.back().day != header.day ||
        headers.back().month != header.month || headers.back().year != header.year) {
        headers.push_back(header);
    }
    p.header = static_cast<std::uint32_t>(headers.size() - 1);
    periods.push_back(p);
    marks.push_back(r.cond2Mark);
    audio.append(period);
    if (r.battery < minBattery) minBattery = r.battery;
    statusFlags |= r.status;
}

}  // namespace orv
