// Damaged and hostile sessions: a bad input costs only itself and is named in a message,
// result files never leave the output directory, and lost results show in the exit status.
#include <gtest/gtest.h>

#include <linux/capability.h>
#include <sys/resource.h>
#include <sys/stat.h>
#include <sys/syscall.h>
#include <unistd.h>

#include <filesystem>
#include <functional>

#include "support/result_csv.h"
#include "support/session_builder.h"
#include "support/test_support.h"

namespace {

using namespace testing_support;

// Runs `f` with the calling thread's permission overrides dropped, so that root (as in CI)
// meets the permission bits as any user does.
template <typename F>
auto WithoutOverridingPermissions(F f) {
    __user_cap_header_struct header{_LINUX_CAPABILITY_VERSION_3, 0};
    __user_cap_data_struct saved[2]{}, dropped[2]{};
    const bool capable = ::syscall(SYS_capget, &header, saved) == 0;
    std::copy(saved, saved + 2, dropped);
    dropped[0].effective &= ~((1U << CAP_DAC_OVERRIDE) | (1U << CAP_FOWNER));
    if (capable) ::syscall(SYS_capset, &header, dropped);
    auto result = f();
    if (capable) ::syscall(SYS_capset, &header, saved);
    return result;
}

// Offset of line `n` (0-based) of a text.
std::size_t lineStart(const std::string& text, std::size_t n) {
    std::size_t at = 0;
    for (std::size_t i = 0; i < n; ++i) at = text.find('\n', at) + 1;
    return at;
}
// File line of a record of levelFile() (slot 1 is line 7).
std::size_t slotLine(std::size_t slot) { return 6 + slot - 1; }

// Three whole minutes at 50 dB: slots 1..1800, giving the rows 08:01, 08:02, 08:03 with -i 1.
std::string levelFile(const LevelFileHeader& header = {}) {
    return levelFileText(header, makeRows(1800, 1, [](std::size_t, LevelRow& r) {
                             r.splA = r.splC = r.leqA = r.leqC = 50.0F;
                         }));
}

void replaceAll(std::string& text, const std::string& from, const std::string& to) {
    for (std::size_t at = 0; (at = text.find(from, at)) != std::string::npos; at += to.size())
        text.replace(at, from.size(), to);
}

class HostileInput : public ::testing::Test {
protected:
    std::string sessions() const { return dir_ / "sessions"; }
    std::string out() const { return dir_ / "out"; }
    // Canonical session directory, as messages name it.
    std::string sessionDir(const std::string& name) const {
        return std::filesystem::canonical(sessions()).string() + "/" + name;
    }
    std::string writeNamed(const std::string& name, const std::string& levelText) {
        SessionLayout layout = namedSession(name);
        layout.levelFiles.clear();
        writeSession(sessions() + "/" + name, layout);
        writeFile(sessions() + "/" + name + "/data.000/20200917_08.csv", levelText);
        return sessionDir(name) + "/data.000/20200917_08.csv";
    }
    RunResult run(std::vector<std::string> options = {"-i", "1"}) {
        options.insert(options.begin(), {"-s", sessions(), "-d", out()});
        return runTool(options);
    }

    TempDir dir_;
};

TEST_F(HostileInput, MalformedRecordsCostOnlyTheirOwnLines) {
    struct Case {
        const char* name;
        std::function<void(std::string&)> damage;
        std::size_t firstBadLine, badLines;  // 0: no message
        std::size_t rows;
        bool firstRowMarked;  // a record is missing or out of place in the first minute
    };
    const auto atSlot = [](std::size_t slot, std::size_t column, const std::string& with) {
        return [=](std::string& t) { t.replace(lineStart(t, slotLine(slot)) + column, 1, with); };
    };
    const auto replaceLine = [](std::size_t slot, const std::string& with) {
        return [=](std::string& t) {
            const std::size_t at = lineStart(t, slotLine(slot));
            t.replace(at, t.find('\r', at) - at, with);
        };
    };
    const Case cases[] = {
        {"Clean", [](std::string&) {}, 0, 0, 3, false},
        {"NulByte", atSlot(100, 3, std::string(1, '\0')), slotLine(100) + 1, 1, 3, true},
        {"NonAscii", atSlot(100, 8, "\xe9"), slotLine(100) + 1, 1, 3, true},
        {"CutLine", replaceLine(100, "0:10.0,50"), slotLine(100) + 1, 1, 3, true},
        {"GarbageLine",
         [](std::string& t) {
             t.insert(lineStart(t, slotLine(100)), std::string(10 << 20, 'x') + "\r\n");
         },
         slotLine(100) + 1, 1, 3, false},
        {"LevelsAbove250",
         [&](std::string& t) {
             replaceLine(700, "1:10.0,250.0,50.0,50.0,50.0,0,12.6")(t);  // the highest level
             replaceLine(200, "0:20.0,50.0," + std::string(400, '9') + ",50.0,50.0,0,12.6")(t);
             replaceLine(100, "0:10.0,250.1,50.0,50.0,50.0,0,12.6")(t);
         },
         slotLine(100) + 1, 2, 3, true},
        {"CutLastLine", [](std::string& t) { t.resize(t.size() - 4); }, slotLine(1800) + 1, 1, 2,
         false},
        {"CrLineEnds", [](std::string& t) { replaceAll(t, "\r\n", "\r"); }, 0, 0, 3, false},
        {"LfLineEnds", [](std::string& t) { replaceAll(t, "\r\n", "\n"); }, 0, 0, 3, false},
        {"Second60", replaceLine(600, "0:60.0,50.0,50.0,50.0,50.0,0,12.6"), 0, 0, 2, true},
        {"Tenth10", replaceLine(300, "0:29.10,50.0,50.0,50.0,50.0,0,12.6"), 0, 0, 3, true},
    };
    std::vector<std::string> paths;
    for (const Case& c : cases) {
        std::string text = levelFile();
        c.damage(text);
        paths.push_back(writeNamed(c.name, text));
    }
    const RunResult r = run();
    ASSERT_EQ(r.status, 0) << r.output;
    for (std::size_t i = 0; i < std::size(cases); ++i) {
        const Case& c = cases[i];
        SCOPED_TRACE(c.name);
        const std::string message = "ERR: " + paths[i] + " has malformed records - first at line " +
                                    std::to_string(c.firstBadLine) + ", " +
                                    std::to_string(c.badLines) + " line(s) skipped\r\n";
        EXPECT_EQ(r.output.find(message) != std::string::npos, c.badLines > 0) << r.output;
        EXPECT_EQ(r.output.find("ERR: " + paths[i]), r.output.rfind("ERR: " + paths[i]));
        const auto rows = resultRows(out() + "/" + c.name + ".csv");
        EXPECT_EQ(rows.size(), c.rows);
        if (rows.size() < 2) continue;
        EXPECT_EQ(rows[0].back() == "Errors Found in Interval", c.firstRowMarked);
        EXPECT_EQ(rows[1].size(), 16U);  // no errors mark
    }
    EXPECT_EQ(resultRows(out() + "/LevelsAbove250.csv")[1][3], "250.0");  // Lmax
    // Line ends of any kind give the same results as the logger's CR LF.
    for (const char* name : {"CrLineEnds", "LfLineEnds"})
        EXPECT_EQ(readFile(out() + "/" + name + ".csv"), readFile(out() + "/Clean.csv"));
}

// Level files that give no records: each is named with what was wrong, the session's other
// file and the next session are processed as if it were not there.
TEST_F(HostileInput, DamagedFilesCostNothingElse) {
    struct Case {
        const char* name;
        std::function<void(const std::string& path)> make;
        const char* problem;
    };
    const auto text = [](std::string content) {
        return [content](const std::string& path) { writeFile(path, content); };
    };
    const auto dated = [&](unsigned day, unsigned month, unsigned year, unsigned hour) {
        LevelFileHeader h;
        h.day = day, h.month = month, h.year = year, h.hour = hour;
        return text(levelFile(h));
    };
    const Case cases[] = {
        {"Empty", text(""), " is empty - skipped"},
        {"CutHeader", text(levelFile().substr(0, 60)), " has a cut or malformed header - skipped"},
        {"Zeros", dated(0, 0, 0, 8), " has an invalid date or hour in its header (00/00/0000 08)"},
        {"Feb31", dated(31, 2, 2020, 8),
         " has an invalid date or hour in its header (31/02/2020 08)"},
        {"Hour99", dated(17, 9, 2020, 99),
         " has an invalid date or hour in its header (17/09/2020 99)"},
        {"Fifo", [](const std::string& p) { ASSERT_EQ(::mkfifo(p.c_str(), 0666), 0); },
         " is not a regular file - skipped"},
        {"Huge",
         [](const std::string& p) {
             writeFile(p, "");
             ASSERT_EQ(::truncate(p.c_str(), 1LL << 40), 0);
         },
         " is larger than 64 MiB - skipped"},
    };
    SessionLayout good = namedSession("Good");
    good.levelFiles[0].rows = makeRows(1800, 1);
    writeSession(sessions() + "/Good", good);
    ASSERT_EQ(run().status, 0);
    const std::string clean = readFile(out() + "/Good.csv");

    for (const Case& c : cases) {
        SCOPED_TRACE(c.name);
        const std::string damaged = writeNamed(std::string("A") + c.name, levelFile());
        const std::string bad = damaged.substr(0, damaged.size() - 6) + "07.csv";
        c.make(sessions() + "/A" + c.name + "/data.000/20200917_07.csv");
        const RunResult r = run();
        EXPECT_EQ(r.status, 0);
        EXPECT_NE(r.output.find("ERR: " + bad + c.problem), std::string::npos) << r.output;
        EXPECT_EQ(resultRows(out() + "/A" + c.name + ".csv").size(), 3U);
        EXPECT_EQ(readFile(out() + "/Good.csv"), clean);
        std::filesystem::remove_all(sessions() + "/A" + c.name);
    }
}

TEST_F(HostileInput, SessionNamesStayInsideTheOutputDirectory) {
    struct Case {
        const char* dir;
        std::string info;
        const char* fileName;  // of the general results; nullptr: session not added
        std::string message;   // after "ERR: "
    };
    const Case cases[] = {
        {"Up", "SESSION NAME: ../escaped\r\n", "_._escaped",
         "Session name of %s cannot be used as a file name - using \"_._escaped\""},
        {"Ctl",
         "SESSION NAME: a\\b\x01"
         "c\r\n",
         "a_b_c", "Session name of %s cannot be used as a file name - using \"a_b_c\""},
        {"Dot", "SESSION NAME: .hidden\r\n", "_hidden",
         "Session name of %s cannot be used as a file name - using \"_hidden\""},
        {"Unnamed", "", "Unnamed",
         "Session name of %s cannot be used as a file name - using \"Unnamed\""},
        {"Dup1", "SESSION NAME: Dup\r\n", "Dup", ""},
        {"Dup2", "SESSION NAME: Dup\r\n", "Dup_2",
         "Session name \"Dup\" already used in this run - results of %s named \"Dup_2\""},
        {"Dup3", "SESSION NAME: Dup\r\n", "Dup_3",
         "Session name \"Dup\" already used in this run - results of %s named \"Dup_3\""},
        {"Key", "SESSION NAME: Key\r\nTWEIGHT: 1\r\n" + std::string(60, 'k') + "\r\n", nullptr,
         "%sKey.inf line 3: key longer than 49 characters - session not added"},
        {"Fifo", "", nullptr, "%sFifo.inf is not a regular file - skipped"},
    };
    for (const Case& c : cases) {
        SessionLayout layout;
        layout.info = {};
        layout.writeInfo = false;
        const std::string dir = writeSession(sessions() + "/" + c.dir, layout);
        const std::string inf = dir + "/" + std::filesystem::path(dir).filename().string() + ".inf";
        if (std::string(c.dir) == "Fifo") {
            ASSERT_EQ(::mkfifo(inf.c_str(), 0666), 0);
        } else {
            writeFile(inf, c.info);
        }
    }
    for (const bool bin : {false, true}) {
        SCOPED_TRACE(bin ? "-bin" : "flat");
        std::filesystem::remove_all(out());
        const RunResult r =
            run(bin ? std::vector<std::string>{"-bin"} : std::vector<std::string>{});
        EXPECT_EQ(r.status, 0);
        for (const Case& c : cases) {
            SCOPED_TRACE(c.dir);
            if (!c.message.empty()) {
                std::string where = sessionDir(c.dir) + "/";
                std::string message = "ERR: " + c.message + "\r\n";
                message.replace(message.find("%s"), 2, where);
                EXPECT_NE(r.output.find(message), std::string::npos) << r.output;
            }
            if (c.fileName == nullptr) continue;
            const std::string general = bin ? out() + "/" + c.fileName + "/GEN_A_15_S.csv"
                                            : out() + "/" + c.fileName + ".csv";
            EXPECT_TRUE(exists(general)) << general;
        }
        EXPECT_EQ(listNames(dir_.path()), (std::vector<std::string>{"out", "sessions"}));
        EXPECT_NE(r.output.find("Processed 7 out of 7 sessions"), std::string::npos);
    }
}

// A full disk (here the process's file size limit) loses results: one message per file with
// the system's reason, and the run ends with status 2.
TEST_F(HostileInput, LostResultsAreReportedAndEndTheRunWithStatus2) {
    SessionLayout layout = namedSession("Full");
    layout.levelFiles[0].rows = makeRows(1800, 1);
    writeSession(sessions() + "/Full", layout);
    rlimit saved{};
    ASSERT_EQ(::getrlimit(RLIMIT_FSIZE, &saved), 0);
    rlimit limit = saved;
    limit.rlim_cur = 1200;  // the header block and the column line, not all rows
    ASSERT_EQ(::setrlimit(RLIMIT_FSIZE, &limit), 0);
    const RunResult r = run({"-i", "1", "-leq", "1"});
    ::setrlimit(RLIMIT_FSIZE, &saved);
    EXPECT_EQ(r.status, 2);
    for (const char* name : {"Full.csv", "Full_LEQ.csv"}) {
        const std::string message =
            "ERR: Unable to write " + out() + "/" + name + " : File too large\r\n";
        EXPECT_NE(r.output.find(message), std::string::npos) << r.output;
        EXPECT_EQ(r.output.find(message), r.output.rfind(message));
    }
}

// An old result file in a directory where it cannot be deleted is still written from empty.
TEST_F(HostileInput, OldResultFileThatCannotBeDeletedIsTruncated) {
    writeSession(sessions() + "/Old", namedSession("Old"));
    ASSERT_EQ(run().status, 0);
    const std::string fresh = readFile(out() + "/Old.csv");
    writeFile(out() + "/Old.csv", std::string(100000, 'x'));
    ASSERT_EQ(::chmod(out().c_str(), 0555), 0);
    const RunResult r = WithoutOverridingPermissions([&] { return run(); });
    ::chmod(out().c_str(), 0755);
    EXPECT_EQ(r.status, 0);
    EXPECT_EQ(readFile(out() + "/Old.csv"), fresh);
}

}  // namespace
