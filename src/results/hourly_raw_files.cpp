#include "results/hourly_raw_files.h"

#include "results/result_files.h"
#include "results/text_buffer.h"

namespace orv {

std::string HourlyRawFiles::fileName(const DataFileHeader& h) {
    TextBuffer b;
    b.append("%u%02u%02u_%02u.csv", h.year, h.month, h.day, h.hour);
    return b.str();
}

std::string HourlyRawFiles::fileText(const DataFileHeader& h,
                                     const std::vector<RawLevelRecord>& records) {
    TextBuffer b;
    b.append(
        "Session Name,,%s\r\nLogger Serial Number,,%s\r\nDate,,%02u/%02u/%04u\r\nHour,,%02u\r\n"
        "Temperature,,%5.1f\r\nTime,SPL-A,SPL-C,LEQ-A,LEQ-C,Signal Condition,Battery\r\n",
        h.sessionTitle.c_str(), h.serialNumber.c_str(), h.day, h.month, h.year, h.hour,
        static_cast<double>(h.temperature));
    for (const RawLevelRecord& r : records) {
        b.append("%u:%u.%u,%.1f,%.1f,%.1f,%.1f,%u,%.1f\r\n", r.time.minute, r.time.second,
                 r.time.milliseconds / 100U, static_cast<double>(r.splA),
                 static_cast<double>(r.splC), static_cast<double>(r.leqA),
                 static_cast<double>(r.leqC), r.condition, static_cast<double>(r.battery));
    }
    return b.str();
}

bool HourlyRawFiles::write(const DataFileHeader& header,
                           const std::vector<RawLevelRecord>& records) {
    const std::string name = fileName(header);
    std::string path = directory_ + name;
    for (unsigned part = 1; written_.count(path) != 0; ++part) {
        path = ResultNaming::leqPart(directory_ + name, part);
    }
    if (path != directory_ + name) {
        run_.out.print("MSG: %s%s was written earlier in this run - this hour goes to %s\r\n",
                       directory_.c_str(), name.c_str(), path.c_str());
    }
    written_.insert(path);
    ResultFile file;
    return file.create(path, run_) && file.write(fileText(header, records));
}

}  // namespace orv
