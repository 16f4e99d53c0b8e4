#include "sessions/session_search.h"

#include <gtest/gtest.h>

#include <unistd.h>

#include "platform/directory.h"
#include "support/session_builder.h"
#include "support/test_support.h"

namespace {

using testing_support::namedSession;
using testing_support::SessionLayout;
using Strings = std::vector<std::string>;

std::string real(const std::string& path) {
    std::string out;
    platform::canonicalDirectory(path, out);
    return out;
}
std::string added(const std::string& name) { return "MSG: Added - \"" + name + "\".\r\n"; }
std::string duplicate(const std::string& name) {
    return "MSG: Duplicate Session Found - \"" + name + "\". Using first instance\r\n";
}

class SearchTest : public ::testing::Test {
protected:
    testing_support::TempDir tmp;
    std::string root = real(tmp.path());
    orv::SessionTable table;
    std::string out;

    std::string session(const std::string& rel, const SessionLayout& layout) {
        return testing_support::writeSession(root + "/" + rel, layout);
    }
    std::string session(const std::string& rel) {
        return session(rel, namedSession(rel.substr(rel.find_last_of('/') + 1)));
    }
    // Runs a search over a copy of `table`; returns what it printed.
    std::string search(const Strings& paths, bool recursive = false, bool needWave = false) {
        orv::ProcessingSettings settings;
        settings.recursiveSearch = recursive ? 1 : 0;
        settings.needWaveFiles = needWave ? 1 : 0;
        orv::SearchPathList list{paths};
        out.clear();
        platform::Console console(&out);
        found = table;
        const std::uint32_t count = orv::findSessions(list, settings, found, console);
        EXPECT_EQ(count, found.count());
        return out;
    }
    Strings paths() const {
        Strings p;
        for (const auto& e : found.entries) p.push_back(e.sessionPath);
        return p;
    }
    orv::SessionTable found;
};

TEST_F(SearchTest, SubdirectorySessionsInListingOrderWithSortedFileLists) {
    SessionLayout layout = namedSession("b");
    layout.levelFiles[0].name = "c.csv";
    layout.levelFiles.push_back({"data.000", "A.CSV", {}, {}});
    layout.levelFiles.push_back({"data.001", "b.csv", {}, {}});
    layout.levelFiles.push_back({"data", "z.csv", {}, {}});
    layout.levelFiles.push_back({"other", "x.csv", {}, {}});  // not a data directory
    layout.extraDirs = {"data.000/dir.csv", "data.002"};      // not a file; visited last, empty
    layout.waveFiles = {"data.001/2.wav", "data.000/1.WAV", "data/a.wav"};
    session("b", layout);
    session("a");
    session("C");
    EXPECT_EQ(search({root}), added("C") + added("a") + added("b"));
    EXPECT_EQ(paths(), (Strings{root + "/C/", root + "/a/", root + "/b/"}));
    EXPECT_EQ(found.entries[2].dataFiles,
              (Strings{"data.000/A.CSV", "data.000/c.csv", "data.001/b.csv", "data/z.csv"}));
    EXPECT_TRUE(found.entries[2].waveFiles.empty());
    search({root}, false, true);
    // As with the level files, wave files may be in any of the data directories.
    EXPECT_EQ(found.entries[2].waveFiles,
              (Strings{"data.000/1.WAV", "data.001/2.wav", "data/a.wav"}));
}

TEST_F(SearchTest, CandidatesThatAreNotSessions) {
    SessionLayout data001 = namedSession("n1"), noInfo = data001, noCsv = data001, upper = data001;
    data001.levelFiles[0].dataDir = "data.001";
    noInfo.writeInfo = false;
    noCsv.levelFiles[0].name = "hour.txt";
    noCsv.waveFiles = {"data.000/x.wav"};
    upper.levelFiles[0].dataDir = "DATA.000";
    session("n1", data001);
    session("n2", noInfo);
    session("n3", noCsv);
    session("n4", upper);
    // Session paths of 259 characters fit, 260 do not.
    const std::string parent = std::string(246 - root.size(), 'd');
    session(parent + "/longsession");
    session(parent + "/longsessio");
    EXPECT_EQ(search({root, root + "/" + parent}, false, true),
              added("longsessio") + "ERR: Session path " + root + "/" + parent +
                  "/longsession/ is longer than 259 characters - session not added\r\n");
}

TEST_F(SearchTest, NestedSessionsOnlyWithRecursionAndNoLinkLoops) {
    session("group/S1");
    session("group/S1/inner/S2");
    session("S0");
    testing_support::TempDir other;
    testing_support::writeSession(other / "S3", namedSession("S3"));
    ASSERT_EQ(::symlink(root.c_str(), (root + "/loop").c_str()), 0);
    ASSERT_EQ(::symlink(other.path().c_str(), (root + "/link").c_str()), 0);
    EXPECT_EQ(search({root}), added("S0"));
    EXPECT_EQ(search({root}, true), added("S0") + added("S1") + added("S2") + added("S3"));
    EXPECT_EQ(paths(), (Strings{root + "/S0/", root + "/group/S1/", root + "/group/S1/inner/S2/",
                                real(other.path()) + "/S3/"}));
}

TEST_F(SearchTest, SearchPathThatIsItselfASession) {
    testing_support::CurrentDirGuard guard;
    session("top");
    ASSERT_TRUE(platform::setCurrentDirectory(root));
    EXPECT_EQ(search({"top", root + "/top/"}), added("top") + duplicate(root + "/top/"));
    EXPECT_EQ(paths(), Strings{"top/"});
    std::string cwd;
    ASSERT_TRUE(platform::getCurrentDirectory(cwd));
    EXPECT_EQ(cwd, root);
}

// The scan's result is its last candidate's: a search path that is a session and holds
// sessions is itself added only when the last of them was refused.
TEST_F(SearchTest, LastCandidateDecidesWhetherTheSearchPathIsTested) {
    session("P");
    session("P/A");
    EXPECT_EQ(search({root + "/P"}), added("A"));
    SessionLayout refused = namedSession("Z");
    refused.writeInfo = false;
    session("P/Z", refused);
    EXPECT_EQ(search({root + "/P"}), added("A") + added(root + "/P"));
}

TEST_F(SearchTest, DuplicatesCompareWholeDirectories) {
    session("x/S1");
    session("x/S10");
    const std::string x = root + "/x";
    EXPECT_EQ(search({x + "/S10", x + "/S1"}), added(x + "/S10") + added(x + "/S1"));
    EXPECT_EQ(search({x, x + "/./S1/"}), added("S1") + added("S10") + duplicate(x + "/./S1/"));
    const SessionLayout renamed = namedSession("not the directory name");
    session("y/S2", renamed);
    EXPECT_EQ(search({root + "/y/S2", root + "/y"}), added(root + "/y/S2") + duplicate("S2"));
    // A subdirectory named like an accepted session is a duplicate whatever it holds.
    session("z/S10", renamed);
    EXPECT_EQ(search({x, root + "/z"}), added("S1") + added("S10") + duplicate("S10"));
}

TEST_F(SearchTest, TableLimitRefusesFurtherSessions) {
    table.entries.resize(orv::SessionTable::kCapacity);
    table.entries[5].sessionName = "S1";
    session("S1");
    session("S2");
    session("S3");
    EXPECT_EQ(search({root}), duplicate("S1") +
                                  "MSG: Session limit reached - \"S2\" not added.\r\n"
                                  "MSG: Session limit reached - \"S3\" not added.\r\n");
    EXPECT_EQ(found.count(), 1024U);
}

TEST(SessionSearchParts, PathsAndFileOrder) {
    EXPECT_EQ(orv::buildSessionPath("S1", false, "/"), "/S1/");  // a root parent
    EXPECT_EQ(orv::buildSessionPath("S1", false, "/data"), "/data/S1/");
    EXPECT_EQ(orv::buildSessionPath("rel/S1/", true, ""), "rel/S1/");
    EXPECT_EQ(orv::comparePrefix("data", "data.000"), 0);
    EXPECT_GT(orv::comparePrefix("data.000", "data"), 0);
    EXPECT_GT(orv::comparePrefix("\xe9", "z"), 0);  // bytes compare unsigned
    Strings list{"data/a.csv", "data.000/b.csv.csv", "data.000/b.csv", "data.000/B.csv"};
    orv::sortFileList(list);
    EXPECT_EQ(list,
              (Strings{"data.000/B.csv", "data.000/b.csv", "data.000/b.csv.csv", "data/a.csv"}));
}

}  // namespace
