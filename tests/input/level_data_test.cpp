#include "input/level_data.h"

#include <gtest/gtest.h>

#include <sys/resource.h>
#include <unistd.h>

#include <cmath>
#include <cstdio>
#include <fstream>
#include <memory>
#include <random>

#include "input/input_file.h"

#include "sessions/session_info.h"
#include "support/session_builder.h"
#include "support/test_support.h"

namespace {

using orv::DataFileHeader;
using orv::LevelRecordQueue;

const std::string kHeader =
    "Session Name,,  Park Road\r\nLogger Serial Number,,SN123\r\nDate,,17/09/2020\r\n"
    "Hour,,08\r\nTemperature,, 21.5\r\nTime,SPL-A,SPL-C,LEQ-A,LEQ-C,Signal Condition,Battery\r\n";
const std::string kRecord = "1:2.3,50.0,60.0,50.0,60.0,0,12.0\r\n";

// The text is copied into a heap block of exactly its size, so that the address sanitizer
// catches any read past its end.
bool parseHeader(const std::string& text, DataFileHeader& h, std::size_t& first) {
    const auto data = std::make_unique<char[]>(text.size());
    std::copy(text.begin(), text.end(), data.get());
    return orv::parseDataFileHeader(data.get(), text.size(), h, first);
}

LevelRecordQueue decode(const std::string& records, LevelRecordQueue q = {},
                        orv::DecodeReport* report = nullptr) {
    const auto data = std::make_unique<char[]>(records.size());
    std::copy(records.begin(), records.end(), data.get());
    const orv::DecodeReport r = orv::decodeLevelRecords(data.get(), records.size(), q);
    if (report != nullptr) *report = r;
    return q;
}

TEST(LevelFileHeader, ReadsTheSixLines) {
    DataFileHeader h;
    std::size_t first = 0;
    ASSERT_TRUE(parseHeader(kHeader + kRecord, h, first));
    EXPECT_EQ(h.sessionTitle + "|" + h.serialNumber, "Park Road|SN123");
    EXPECT_EQ(std::vector<int>({h.day, h.month, h.year, h.hour}),
              std::vector<int>({17, 9, 2020, 8}));
    EXPECT_EQ(h.temperature, 21.5F);
    EXPECT_EQ(first, kHeader.size());
    // Bare line feeds keep the last character; a comma ends a text.
    ASSERT_TRUE(
        parseHeader("Session Name,,Title,x\nLogger Serial Number,,,SN\nDate,,1/2/2003\n"
                    "Hour,,4\nTemperature,,-5.5\ncols\n\n",
                    h, first));
    EXPECT_EQ(h.sessionTitle + "|" + h.serialNumber, "Title|SN");
    EXPECT_EQ(h.temperature, -5.5F);
    // Texts longer than their buffers keep 99 and 25 characters.
    std::string text = kHeader;
    text.replace(text.find("  Park Road"), 11, std::string(150, 't'));
    text.replace(text.find("SN123"), 5, std::string(30, 's'));
    ASSERT_TRUE(parseHeader(text + "x", h, first));
    EXPECT_EQ(h.sessionTitle + "|" + h.serialNumber,
              std::string(99, 't') + "|" + std::string(25, 's'));
}

TEST(LevelFileHeader, MalformedHeadersFail) {
    const auto with = [](const char* from, const char* to) {
        std::string text = kHeader + kRecord;
        return text.replace(text.find(from), std::string(from).size(), to);
    };
    const std::string cases[] = {
        kHeader,  // nothing after the column titles
        kHeader.substr(0, kHeader.size() - 1),
        "",
        with("Session Name,,", "Session Name "),
        with("17/09/2020", "17-09-2020"),
        with("17/09/2020", "-17/09/2020"),
        with("17/09/2020", "17"),  // the date ends at the line end
        with("Hour,,08", "Hour,,-8"),
        with(" 21.5", " 21-5"),
        with("Temperature,, 21.5\r\nTime", "Temperature,"),
    };
    for (const std::string& text : cases) {
        DataFileHeader h;
        std::size_t first = 0;
        EXPECT_FALSE(parseHeader(text, h, first)) << text;
    }
}

TEST(LevelRecords, FieldsAndConditions) {
    const LevelRecordQueue q = decode(
        "\n12:30.5,65.3,-1.5,-0.0,70.1,3,-12.6\r\n12:30.6,65.3,71.0,64.0,70.1,2,12.6\n\r\n\r\n"
        ":.,,,,,,\r\n");
    ASSERT_EQ(q.size(), 3U);
    const orv::LevelRecord& a = q.records[0];
    EXPECT_EQ(std::vector<int>({a.minute, a.second, a.tenth}), std::vector<int>({12, 30, 5}));
    EXPECT_EQ(a.splA, 65.3F);
    EXPECT_EQ(a.splC, 0.0F);  // negative levels are stored as 0.0
    EXPECT_FALSE(std::signbit(a.leqA));
    EXPECT_EQ(a.battery, -12.6F);  // the battery is stored as written
    EXPECT_EQ(a.status * 10 + a.cond2Mark, 10U);
    EXPECT_EQ(q.records[1].status * 10 + q.records[1].cond2Mark, 1U);
    const orv::LevelRecord& e = q.records[2];  // empty fields read as 0
    EXPECT_EQ(e.minute + e.second + e.tenth + e.status + e.cond2Mark, 0);
    EXPECT_EQ(e.splA + e.splC + e.leqA + e.leqC + e.battery, 0.0F);
}

// A malformed line is left out on its own; the report names the first and counts them all.
TEST(LevelRecords, MalformedLinesAreLeftOutOneByOne) {
    const std::string cases[] = {
        "1:2.3,50.0;60.0,50.0,60.0,0,12.0",
        "1:2.3,50.0,60.0,50.0,60.0,0,12.0;",
        "-1:2.3,50.0,60.0,50.0,60.0,0,12.0",
        "1-:2.3,50.0,60.0,50.0,60.0,0,12.0",
        "1:2.-3,50.0,60.0,50.0,60.0,0,12.0",
        "1:2.3,50-,60.0,50.0,60.0,0,12.0",
        "1:2.3,50.0,60.0,50.0,60.0,-2,12.0",
        "1:2.3,50.0,60.0,50.0,60.0,0,12-",
        "1:2,3,50.0,60.0,50.0,60.0,0,12.0",
        "1:2.3,50.0,60.0,250.1,60.0,0,12.0",
        "65536:2.3,50.0,60.0,50.0,60.0,0,12.0",
        "1:2.3,50.0,60.0,50.0,60.0,4294967299,12.0",
        "1:2.3,50.0,60.0,50.0,60.0,0," + std::string(40, '9'),
        std::string("1:2.3,50.0\0,60.0,50.0,60.0,0,12.0", 34),
    };
    for (const std::string& bad : cases) {
        for (const char* end : {"\r\n", "\n", "\r"}) {
            orv::DecodeReport report;
            EXPECT_EQ(
                decode(kRecord + bad + end + "\r\n" + bad + end + kRecord, {}, &report).size(), 2U)
                << bad;
            EXPECT_EQ(report.firstBadLine * 10 + report.badLines, 22U) << bad;  // lines 2 and 4
        }
    }
    // A last line without its line end is cut short; a lone line end is an empty line.
    orv::DecodeReport cut;
    decode(kRecord.substr(0, kRecord.size() - 2), {}, &cut);
    EXPECT_EQ(cut.badLines, 1U);
    EXPECT_EQ(decode(kRecord + "\r").size(), 1U);
    EXPECT_EQ(decode("\n").size(), 0U);
}

TEST(LevelRecords, RoundTripOfAnHourInTheLoggersLayout) {
    testing_support::LevelFileHeader header;
    header.temperature = -3.2F;
    const auto rows = testing_support::makeHour([](std::size_t slot, testing_support::LevelRow& r) {
        r.splA = 30.0F + static_cast<float>(slot % 700) / 10.0F;
        r.leqC = static_cast<float>(slot % 97) - 10.0F;
        r.condition = static_cast<unsigned>(slot % 4);
    });
    const std::string text = testing_support::levelFileText(header, rows);
    DataFileHeader h;
    std::size_t first = 0;
    ASSERT_TRUE(parseHeader(text, h, first));
    EXPECT_EQ(h.temperature, -3.2F);
    // The queue is emptied for each file but keeps its capacity.
    LevelRecordQueue q = decode(text.substr(first), decode(text.substr(first)));
    ASSERT_EQ(q.size(), rows.size());
    const auto row = [](unsigned m, unsigned s, unsigned t, float a, float c, unsigned cond) {
        char line[64];
        std::snprintf(line, sizeof line, "%u:%u.%u,%.1f,%.1f,%u", m, s, t, static_cast<double>(a),
                      static_cast<double>(c), cond);
        return std::string(line);
    };
    for (std::size_t i = 0; i < rows.size(); ++i) {
        const auto& r = q.records[i];
        const auto& w = rows[i];
        ASSERT_EQ(row(r.minute, r.second, r.tenth, r.splA, r.leqC, r.status * 3 + r.cond2Mark * 2),
                  row(w.minute, w.second, w.tenth, w.splA, std::max(w.leqC, 0.0F),
                      w.condition == 1 ? 0 : w.condition));
    }
    const std::size_t capacity = q.records.capacity();
    orv::decodeLevelRecords(kRecord.data(), kRecord.size(), q);
    EXPECT_EQ(q.size(), 1U);
    EXPECT_EQ(q.records.capacity(), capacity);
}

// Sanitizers reserve the address space this test limits (gcc and clang name them apart).
#if defined(__has_feature)
#if __has_feature(address_sanitizer) || __has_feature(thread_sanitizer)
#define ORV_SANITIZED_ADDRESS_SPACE
#endif
#endif
#if !defined(__SANITIZE_ADDRESS__) && !defined(__SANITIZE_THREAD__) && \
    !defined(ORV_SANITIZED_ADDRESS_SPACE)
// A file whose bytes do not fit in memory is skipped with a message; the next one is read.
TEST(LevelFile, AllocationFailureSkipsOnlyThatFile) {
    testing_support::TempDir dir;
    const std::string big = dir / "big.csv";
    testing_support::writeFile(big, "");
    ASSERT_EQ(::truncate(big.c_str(), 60 << 20), 0);
    testing_support::writeFile(dir / "small.csv", kHeader + kRecord);
    std::string text;
    platform::Console out(&text);
    std::vector<char> bytes;
    DataFileHeader header;
    LevelRecordQueue q;
    rlimit saved{};
    ASSERT_EQ(::getrlimit(RLIMIT_AS, &saved), 0);
    std::ifstream statm("/proc/self/statm");
    std::size_t pages = 0;
    statm >> pages;
    rlimit limit = saved;
    limit.rlim_cur = pages * static_cast<std::size_t>(::sysconf(_SC_PAGESIZE)) + (16 << 20);
    ASSERT_EQ(::setrlimit(RLIMIT_AS, &limit), 0);
    const orv::LevelFileLoad load = orv::loadLevelDataFile(big, bytes, header, q, out);
    ::setrlimit(RLIMIT_AS, &saved);
    EXPECT_EQ(load, orv::LevelFileLoad::Skipped);
    EXPECT_EQ(text, "ERR: Not enough memory to read " + big + " - skipped\r\n");
    EXPECT_EQ(orv::loadLevelDataFile(dir / "small.csv", bytes, header, q, out),
              orv::LevelFileLoad::Loaded);
    EXPECT_EQ(q.size(), 1U);
}
#endif

// Mutated text must never make the readers look outside it.
TEST(RobustReaders, MutatedInputStaysInBounds) {
    const std::string base = testing_support::levelFileText({}, testing_support::makeRows(20));
    std::mt19937 rng(12345);
    const char alphabet[] = "0123456789-.,:;\r\n \t\0xZ";
    int parsed = 0;
    for (int round = 0; round < 10000; ++round) {
        std::string text = base.substr(0, rng() % (base.size() + 1));
        for (unsigned k = 0, edits = 1 + rng() % 6; k < edits && !text.empty(); ++k) {
            text[rng() % text.size()] = alphabet[rng() % (sizeof alphabet - 1)];
        }
        DataFileHeader h;
        std::size_t first = 0;
        if (parseHeader(text, h, first)) {
            ++parsed;
            ASSERT_LT(first, text.size());
            EXPECT_LE(decode(text.substr(first)).size(), 20U);
        }
        decode(text);
        orv::SessionRecord r;
        orv::parseSessionInfoText(text, r);
        EXPECT_LE(r.sessionName.size(), 79U);
    }
    EXPECT_GT(parsed, 1000);  // most mutations still reach the records
}

}  // namespace
