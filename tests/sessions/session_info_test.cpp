#include "sessions/session_info.h"

#include <gtest/gtest.h>

#include <unistd.h>

#include <chrono>

#include "sessions/decimal_number.h"
#include "support/test_support.h"

namespace {

using orv::SessionRecord;

SessionRecord parse(const std::string& text, bool expectOk = true) {
    SessionRecord r;
    EXPECT_EQ(orv::parseSessionInfoText(text, r), expectOk) << text;
    return r;
}

std::string dateOf(const platform::SystemTime& t) {
    return std::to_string(t.day) + "/" + std::to_string(t.month) + "/" + std::to_string(t.year) +
           " " + std::to_string(t.hour) + ":" + std::to_string(t.minute) + ":" +
           std::to_string(t.second) + " " + std::to_string(t.dayOfWeek + t.milliseconds);
}

TEST(DecimalNumber, ReadsLikeTheLoggerInSinglePrecision) {
    // {text, value, end offset or -1 for no end position}
    const std::tuple<std::string, float, int> cases[] = {
        {"3.25", 3.25F, 4}, {"7-", 7.0F, -1}, {"-0.5", -0.5F, 4}, {"12.", 12.0F, 3},
        {"4.5-", 4.5F, 3},  {"1e3", 1.0F, 1}, {"+1", 0.0F, 0},    {"", 0.0F, 0}};
    for (const auto& [text, value, endOffset] : cases) {
        const char* end = nullptr;
        EXPECT_EQ(orv::parseDecimalFloat(text.data(), text.data() + text.size(), &end), value);
        EXPECT_EQ(end, endOffset < 0 ? nullptr : text.data() + endOffset) << text;
    }
    // Fraction digits add d * scale, scale = scale * 0.1, in float: 0.01 reads as
    // 0.1f * 0.1f, one step above the nearest float to 0.01.
    const std::string t = "0.01";
    const char* end = nullptr;
    const float volatile tenth = 0.1F;
    EXPECT_EQ(orv::parseDecimalFloat(t.data(), t.data() + t.size(), &end), tenth * tenth);
}

TEST(InfoFile, KeysAndValues) {
    const SessionRecord r = parse(
        "session name: Park Road\nSESSION START: 05/11/2019 14:30:00\n"
        "SESSION END: 06-11-2019 09-05-07\nTWEIGHT: 1\nCALIBRATION: -12.5\n"
        "RANGE MULTIPLIER: .5\ntrig setting: on\nTRIG PRE REC LENGTH: 10\nNOT A KEY: 99\n\n");
    EXPECT_EQ(r.sessionName, "Park Road");
    EXPECT_EQ(dateOf(r.sessionStart), "5/11/2019 14:30:0 0");
    EXPECT_EQ(dateOf(r.sessionEnd), "6/11/2019 9:5:7 0");  // '-' is a separator like any other
    EXPECT_EQ(r.timeWeightingMs, 1000U);
    EXPECT_EQ(r.calibration, 12.5F);     // the sign is not read
    EXPECT_EQ(r.rangeMultiplier, 5.0F);  // nor a leading point
    EXPECT_EQ(r.triggerOn, 1U);
    EXPECT_EQ(r.triggerPreRecordLength, 10U);
    EXPECT_EQ(parse("TWEIGHT: 125\nTRIG SETTING: OFF\n").timeWeightingMs, 125U);
    EXPECT_EQ(parse("SESSION NAME: a\nSESSION NAME: b\n").sessionName, "b");
    EXPECT_EQ(dateOf(parse("SESSION START: 1/2").sessionStart), "1/2/0 0:0:0 0");
    // A Time trigger cancels the pre-record length, before or after it.
    EXPECT_EQ(parse("TRIG TYPE: Time\nTRIG PRE REC LENGTH: 10\n").triggerPreRecordLength, 0U);
    EXPECT_EQ(parse("TRIG PRE REC LENGTH: 10\nTRIG TYPE: time\n").triggerPreRecordLength, 0U);
    EXPECT_EQ(parse("TRIG PRE REC LENGTH: 10\nTRIG TYPE: Level\n").triggerPreRecordLength, 10U);
}

TEST(InfoFile, LineShapes) {
    EXPECT_EQ(parse("SESSION NAME: X").sessionName, "X");
    EXPECT_EQ(parse("SESSION NAME: old\nSESSION NAME\n").sessionName, "");  // no colon
    EXPECT_EQ(parse("SESSION NAME:").sessionName, "");
    EXPECT_EQ(parse("SESSION NAME: " + std::string(100, 'n')).sessionName, std::string(79, 'n'));
    EXPECT_EQ(parse("SESSION NAME: A\r\r\n").sessionName, "A\r\r");  // a lone CR is text
    const SessionRecord r = parse(std::string("SESSION NAME: A") + '\0' + "B\nTWEIGHT: 2\n");
    EXPECT_EQ(r.sessionName + std::to_string(r.timeWeightingMs), "A2000");  // NUL ends a line
    // Keys of 50 characters make the file bad, but the rest is still read.
    EXPECT_EQ(parse(std::string(50, 'k') + "\nSESSION NAME: kept\n", false).sessionName, "kept");
    parse(std::string(49, 'k') + ": fine\n");
    // Lines come in pieces of 259 characters, each handled as a line of its own.
    const std::string first = "CALIBRATION: 1";
    EXPECT_EQ(parse(first + std::string(259 - first.size(), ' ') + "TWEIGHT: 2\n").timeWeightingMs,
              2000U);
    EXPECT_EQ(parse("SESSION NAME: " + std::string(300, 'x') + "\n", false).sessionName,
              std::string(79, 'x'));
    // A file that ends in one very long line is read in time linear in its length.
    const auto start = std::chrono::steady_clock::now();
    std::size_t badLine = 0;
    SessionRecord record;
    std::string text = "TWEIGHT: 1\n\n";
    text.append(8 << 20, 'x');
    EXPECT_FALSE(orv::parseSessionInfoText(text, record, &badLine));
    EXPECT_LT(std::chrono::steady_clock::now() - start, std::chrono::milliseconds(500));
    EXPECT_EQ(badLine, 3U);
}

TEST(InfoFile, ReadsFirstInfFileOfTheSessionDirectory) {
    testing_support::TempDir dir;
    SessionRecord r;
    r.sessionPath = dir.path() + "/";
    std::string out;
    platform::Console console(&out);
    EXPECT_FALSE(orv::readSessionInfoFile(r, console));
    testing_support::makeDirs(dir / "a.inf");  // a directory is not an information file
    testing_support::writeFile(dir / "B.INF", "SESSION NAME: from B\r\n");
    testing_support::writeFile(dir / "c.inf", "SESSION NAME: from c\r\n");
    EXPECT_TRUE(orv::readSessionInfoFile(r, console));
    EXPECT_EQ(r.sessionName, "from B");
    ASSERT_EQ(::symlink("missing", (dir / "0.inf").c_str()), 0);
    EXPECT_FALSE(orv::readSessionInfoFile(r, console));
    EXPECT_EQ(out, "Error opening session INF file - No such file or directory\r\n");
}

}  // namespace
