#include "sessions/session_info.h"

#include <gtest/gtest.h>

#include <unistd.h>

#include "sessions/decimal_number.h"
#include "support/test_support.h"

namespace {

using orv::SessionRecord;
using testing_support::TempDir;

SessionRecord parse(const std::string& text, bool expectOk = true) {
    SessionRecord r;
    EXPECT_EQ(orv::parseSessionInfoText(text, r), expectOk) << text;
    return r;
}

TEST(DecimalNumber, ReadsLikeTheLoggerInSinglePrecision) {
    struct Case {
        const char* text;
        float value;
        std::ptrdiff_t endOffset;  // -1: no end position
    };
    const Case cases[] = {
        {"3.25", 3.25F, 4}, {"7-", 7.0F, -1}, {"-0.5", -0.5F, 4}, {"12.", 12.0F, 3},
        {".5", 0.5F, 2},    {"-", -0.0F, 1},  {"4.5-", 4.5F, 3},  {"1e3", 1.0F, 1},
        {"+1", 0.0F, 0},    {"", 0.0F, 0},
    };
    for (const Case& c : cases) {
        const std::string text = c.text;
        const char* end = nullptr;
        const float v = orv::parseDecimalFloat(text.data(), text.data() + text.size(), &end);
        EXPECT_EQ(v, c.value) << c.text;
        if (c.endOffset < 0) {
            EXPECT_EQ(end, nullptr) << c.text;
        } else {
            EXPECT_EQ(end, text.data() + c.endOffset) << c.text;
        }
    }
    // Each fraction digit adds d * scale with scale = scale * 0.1 in float, so 0.01 reads as
    // 0.1f * 0.1f, one step above the nearest float to 0.01.
    const std::string t = "0.01";
    const char* end = nullptr;
    const float volatile tenth = 0.1F;
    const float v = orv::parseDecimalFloat(t.data(), t.data() + t.size(), &end);
    EXPECT_EQ(v, tenth * tenth);
    EXPECT_NE(v, 0.01F);
}

TEST(InfoFile, KeysAndValues) {
    const SessionRecord r = parse(
        "session name: Park Road\n"
        "SESSION START: 05/11/2019 14:30:00\n"
        "SESSION END: 06/11/2019 09:05:07\n"
        "TWEIGHT: 1\n"
        "CALIBRATION: -12.5\n"
        "RANGE MULTIPLIER: .5\n"
        "trig setting: on\n"
        "TRIG PRE REC LENGTH: 10\n"
        "NOT A KEY: 99\n"
        "\n");
    EXPECT_EQ(r.sessionName, "Park Road");
    EXPECT_EQ(r.sessionStart.day, 5);
    EXPECT_EQ(r.sessionStart.month, 11);
    EXPECT_EQ(r.sessionStart.year, 2019);
    EXPECT_EQ(r.sessionStart.hour, 14);
    EXPECT_EQ(r.sessionStart.minute, 30);
    EXPECT_EQ(r.sessionStart.dayOfWeek, 0);
    EXPECT_EQ(r.sessionEnd.second, 7);
    EXPECT_EQ(r.timeWeightingMs, 1000U);
    EXPECT_EQ(r.calibration, 12.5F);     // the sign is not read
    EXPECT_EQ(r.rangeMultiplier, 5.0F);  // neither is a leading point
    EXPECT_EQ(r.triggerOn, 1U);
    EXPECT_EQ(r.triggerPreRecordLength, 10U);
    EXPECT_EQ(parse("TWEIGHT: 125\n").timeWeightingMs, 125U);
    EXPECT_EQ(parse("TRIG SETTING: OFF\n").triggerOn, 0U);
    EXPECT_EQ(parse("SESSION NAME: a\nSESSION NAME: b\n").sessionName, "b");
}

TEST(InfoFile, TimeTriggerCancelsPreRecordLengthInEitherOrder) {
    EXPECT_EQ(parse("TRIG TYPE: Time\nTRIG PRE REC LENGTH: 10\n").triggerPreRecordLength, 0U);
    EXPECT_EQ(parse("TRIG PRE REC LENGTH: 10\nTRIG TYPE: time\n").triggerPreRecordLength, 0U);
    EXPECT_EQ(parse("TRIG PRE REC LENGTH: 10\nTRIG TYPE: Level\n").triggerPreRecordLength, 10U);
}

TEST(InfoFile, LineShapes) {
    // A name line that ends without a line feed, one that has no colon, and one of 80+
    // characters, cut to 79.
    EXPECT_EQ(parse("SESSION NAME: X").sessionName, "X");
    EXPECT_EQ(parse("SESSION NAME: old\nSESSION NAME\n").sessionName, "");
    EXPECT_EQ(parse("SESSION NAME:").sessionName, "");
    EXPECT_EQ(parse("SESSION NAME: " + std::string(100, 'n') + "\n").sessionName,
              std::string(79, 'n'));
    // A lone CR (not part of CR LF) is kept as text.
    EXPECT_EQ(parse("SESSION NAME: A\r\r\n").sessionName, "A\r\r");
    // A NUL byte ends its line's text.
    const SessionRecord r = parse(std::string("SESSION NAME: A") + '\0' + "B\nTWEIGHT: 2\n");
    EXPECT_EQ(r.sessionName, "A");
    EXPECT_EQ(r.timeWeightingMs, 2000U);
}

TEST(InfoFile, LongKeysMakeTheFileBadButItIsStillRead) {
    const std::string longKey(50, 'k');
    SessionRecord r = parse(longKey + "\nSESSION NAME: kept\n", false);
    EXPECT_EQ(r.sessionName, "kept");
    parse(std::string(49, 'k') + ": fine\n");
    // A line of more than 259 characters arrives in pieces; a piece without a colon in its
    // first 50 characters is a key too long.
    r = parse("SESSION NAME: " + std::string(300, 'x') + "\n", false);
    EXPECT_EQ(r.sessionName, std::string(79, 'x'));
    // The second piece starts exactly at the 260th character.
    const std::string first = "CALIBRATION: 1";
    r = parse(first + std::string(259 - first.size(), ' ') + "TWEIGHT: 2\n");
    EXPECT_EQ(r.timeWeightingMs, 2000U);
}

TEST(InfoFile, DatesWithAnySeparator) {
    platform::SystemTime t;
    orv::parseDateTime("SESSION START: 05-11-2019 14-30-09", t);
    EXPECT_EQ(t.day, 5);
    EXPECT_EQ(t.month, 11);
    EXPECT_EQ(t.year, 2019);
    EXPECT_EQ(t.second, 9);
    orv::parseDateTime("SESSION END: 1/2", t);  // too short: the rest reads as 0
    EXPECT_EQ(t.month, 2);
    EXPECT_EQ(t.year, 0);
    EXPECT_EQ(t.second, 0);
    orv::parseDateTime("no digits", t);
    EXPECT_EQ(t.day, 0);
}

TEST(InfoFile, ReadsFirstInfFileOfTheSessionDirectory) {
    TempDir dir;
    SessionRecord r;
    r.sessionPath = dir.path() + "/";
    std::string out;
    platform::Console console(&out);
    EXPECT_FALSE(orv::readSessionInfoFile(r, console));  // no .inf file
    testing_support::makeDirs(dir / "a.inf");            // a directory is not an information file
    testing_support::writeFile(dir / "B.INF", "SESSION NAME: from B\r\nTWEIGHT: 125\r\n");
    testing_support::writeFile(dir / "c.inf", "SESSION NAME: from c\r\n");
    EXPECT_TRUE(orv::readSessionInfoFile(r, console));
    EXPECT_EQ(r.sessionName, "from B");  // CR LF read as LF
    EXPECT_EQ(r.timeWeightingMs, 125U);
    EXPECT_EQ(out, "");

    ASSERT_EQ(::symlink("missing", (dir / "0.inf").c_str()), 0);
    EXPECT_FALSE(orv::readSessionInfoFile(r, console));
    EXPECT_EQ(out, "Error opening session INF file - No such file or directory\r\n");
}

}  // namespace
