// Wave files: the header and the name rules, and the cursor gating records over a session
// of one such file. Every period the cursor hands out must lie inside the file's audio and
// read back whole.
//
// Input: one byte n, then n bytes of file name (without directory), then the file's bytes.
#include <cstddef>
#include <cstdint>
#include <cstdio>
#include <filesystem>
#include <string>
#include <string_view>
#include <vector>

#include "fuzz_support.h"
#include "input/wave_cursor.h"
#include "platform/console.h"

namespace {

const std::string& sessionDirectory() {
    static const std::string dir = [] {
        const std::string d = fuzz::scratchDirectory() + "/session";
        std::filesystem::create_directories(d + "/data.000");
        return d;
    }();
    return dir;
}

// Gates 200 records from 08:29:55.1 of 17/09/2020 on; checks every accepted period.
void gateRecords(const orv::SessionRecord& session, std::size_t fileSize) {
    std::string printed;
    platform::Console out(&printed);
    orv::WaveCursor cursor(session, 30, out);
    orv::DataFileHeader header;
    header.day = 17;
    header.month = 9;
    header.year = 2020;
    header.hour = 8;
    std::vector<std::int16_t> samples(orv::kPeriodSamples);
    for (std::uint32_t slot = 29 * 600 + 551; slot < 29 * 600 + 751; ++slot) {
        orv::LevelRecord r;
        r.minute = static_cast<std::uint16_t>(slot / 600);
        r.second = static_cast<std::uint16_t>(slot / 10 % 60);
        r.tenth = static_cast<std::uint16_t>(slot % 10);
        orv::AudioSpans period;
        if (!cursor.gate(r, header, period).accepted) continue;
        FUZZ_CHECK(period.samples() == orv::kPeriodSamples);
        for (const orv::AudioSpan& s : period.spans()) {
            FUZZ_CHECK(s.offset >= 44);
            FUZZ_CHECK(s.offset + s.samples * 2 <= fileSize);
        }
        FUZZ_CHECK(period.read(0, samples.size(), samples.data()));
        orv::AudioSpans before;
        std::vector<std::uint32_t> marks;
        cursor.precedingAudio(before, marks);
        FUZZ_CHECK(before.samples() == marks.size() * orv::kPeriodSamples);
    }
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
    if (size < 1 || size < 1U + data[0]) return 0;
    const std::string_view name(reinterpret_cast<const char*>(data + 1), data[0]);
    const std::string_view bytes(reinterpret_cast<const char*>(data + 1 + data[0]),
                                 size - 1 - data[0]);
    orv::WaveHeader header;
    orv::parseWaveHeader(reinterpret_cast<const unsigned char*>(bytes.data()), bytes.size(),
                         header);
    orv::WaveName stamp;
    orv::parseWaveName(name, stamp);

    // The same bytes as the one wave file of a session, under a usable name when the input's
    // is not one.
    const bool usable = name.find_first_of(std::string_view("/\0", 2)) == std::string_view::npos &&
                        !name.empty() && name != "." && name != "..";
    const std::string fileName = usable ? std::string(name) : "20200917_083000.wav";
    const std::string path = sessionDirectory() + "/data.000/" + fileName;
    std::FILE* f = std::fopen(path.c_str(), "wb");
    FUZZ_CHECK(f != nullptr);
    FUZZ_CHECK(std::fwrite(bytes.data(), 1, bytes.size(), f) == bytes.size());
    std::fclose(f);
    orv::SessionRecord session;
    session.sessionPath = sessionDirectory() + "/";
    session.waveFiles = {"data.000/" + fileName, "data.000/" + fileName};
    gateRecords(session, bytes.size());
    session.triggerOn = 1;
    session.triggerPreRecordLength = 5;
    gateRecords(session, bytes.size());
    std::filesystem::remove(path);
    return 0;
}
