#include "sessions/session_search.h"

#include <gtest/gtest.h>

#include <unistd.h>

#include "platform/directory.h"
#include "support/session_builder.h"
#include "support/test_support.h"

namespace {

using testing_support::namedSession;
using testing_support::SessionSpec;
using testing_support::TempDir;
using testing_support::writeFile;
using testing_support::writeSession;
using Strings = std::vector<std::string>;

struct SearchResult {
    std::uint32_t found = 0;
    std::string out;
    orv::SessionTable table;

    Strings paths() const {
        Strings p;
        for (const auto& e : table.entries)
            p.push_back(e.sessionPath);
        return p;
    }
};

SearchResult search(const Strings& paths, bool recursive = false, bool needWave = false,
                    orv::SessionTable table = {}) {
    SearchResult r;
    r.table = std::move(table);
    orv::ProcessingSettings settings;
    settings.recursiveSearch = recursive ? 1 : 0;
    settings.needWaveFiles = needWave ? 1 : 0;
    orv::SearchPathList list;
    list.paths = paths;
    platform::Console console(&r.out);
    r.found = orv::findSessions(list, settings, r.table, console);
    return r;
}

std::string real(const std::string& path) {
    std::string out;
    platform::canonicalDirectory(path, out);
    return out;
}

std::string added(const std::string& name) {
    return "MSG: Added - \"" + name + "\".\r\n";
}
std::string duplicate(const std::string& name) {
    return "MSG: Duplicate Session Found - \"" + name + "\". Using first instance\r\n";
}

class SessionSearchTest : public ::testing::Test {
  protected:
    TempDir tmp;
    std::string root = real(tmp.path());

    std::string session(const std::string& rel, const SessionSpec& spec) {
        return writeSession(root + "/" + rel, spec);
    }
    std::string session(const std::string& rel) {
        return session(rel, namedSession(rel.substr(rel.find_last_of('/') + 1)));
    }
};

TEST_F(SessionSearchTest, SubdirectorySessionsInListingOrderWithSortedFileLists) {
    SessionSpec spec = namedSession("b");
    spec.levelFiles[0].name = "c.csv";
    spec.levelFiles.push_back({"data.000", "A.CSV", {}, {}});
    spec.levelFiles.push_back({"data.001", "b.csv", {}, {}});
    spec.levelFiles.push_back({"data", "z.csv", {}, {}});
    spec.levelFiles.push_back({"other", "x.csv", {}, {}});  // not a data directory
    spec.extraDirs = {"data.000/dir.csv"};                  // a directory is not a file
    spec.waveFiles = {"data.001/2.wav", "data.000/1.WAV"};
    session("b", spec);
    session("a");
    session("C");
    writeFile(root + "/loose.csv", "");

    SearchResult r = search({root});
    EXPECT_EQ(r.out, added("C") + added("a") + added("b"));
    EXPECT_EQ(r.found, 3U);
    EXPECT_EQ(r.paths(), (Strings{root + "/C/", root + "/a/", root + "/b/"}));
    EXPECT_EQ(r.table.entries[2].dataFiles,
              (Strings{"data.000/A.CSV", "data.000/c.csv", "data.001/b.csv", "data/z.csv"}));
    EXPECT_TRUE(r.table.entries[2].waveFiles.empty());
    EXPECT_EQ(r.table.entries[2].sessionName, "b");

    r = search({root}, false, true);
    EXPECT_EQ(r.table.entries[2].waveFiles, (Strings{"data.000/1.WAV", "data.001/2.wav"}));
}

TEST_F(SessionSearchTest, CandidatesThatAreNotSessions) {
    SessionSpec onlyData001 = namedSession("n1");
    onlyData001.levelFiles[0].dataDir = "data.001";
    session("n1", onlyData001);
    SessionSpec noInfo = namedSession("n2");
    noInfo.writeInfo = false;
    session("n2", noInfo);
    SessionSpec noCsv = namedSession("n3");
    noCsv.levelFiles[0].name = "hour.txt";
    noCsv.waveFiles = {"data.000/x.wav"};
    session("n3", noCsv);
    SessionSpec upperData = namedSession("n4");
    upperData.levelFiles[0].dataDir = "DATA.000";
    session("n4", upperData);
    // Session paths of 259 characters fit, 260 do not.
    const std::string parent = std::string(246 - root.size(), 'd');
    session(parent + "/longsession");
    session(parent + "/longsessio");
    ASSERT_EQ((root + "/" + parent + "/longsession/").size(), 260U);
    const SearchResult r = search({root, root + "/" + parent}, false, true);
    EXPECT_EQ(r.out, added("longsessio"));
}

TEST_F(SessionSearchTest, DataFilesInAnyDataDirectoryCount) {
    SessionSpec spec = namedSession("S");
    spec.levelFiles[0].dataDir = "data.000";
    spec.waveFiles = {"data.000/b.wav", "data.001/a.wav"};
    spec.extraDirs = {"data.002"};  // the last data directory holds nothing
    session("S", spec);
    const SearchResult r = search({root}, false, true);
    ASSERT_EQ(r.found, 1U);
    EXPECT_EQ(r.table.entries[0].waveFiles, (Strings{"data.000/b.wav", "data.001/a.wav"}));
}

TEST_F(SessionSearchTest, NestedSessionsOnlyWithRecursion) {
    session("group/S1");
    session("group/S1/inner/S2");
    session("S0");
    EXPECT_EQ(search({root}).out, added("S0"));
    const SearchResult r = search({root}, true);
    EXPECT_EQ(r.out, added("S0") + added("S1") + added("S2"));
    EXPECT_EQ(r.paths(),
              (Strings{root + "/S0/", root + "/group/S1/", root + "/group/S1/inner/S2/"}));
}

TEST_F(SessionSearchTest, RecursionFollowsLinksButNotLoops) {
    session("S1");
    TempDir other;
    writeSession(other / "S2", namedSession("S2"));
    ASSERT_EQ(::symlink(root.c_str(), (root + "/loop").c_str()), 0);
    ASSERT_EQ(::symlink(other.path().c_str(), (root + "/elsewhere").c_str()), 0);
    const SearchResult r = search({root}, true);
    EXPECT_EQ(r.out, added("S1") + added("S2"));
    EXPECT_EQ(r.paths(), (Strings{root + "/S1/", real(other.path()) + "/S2/"}));
}

TEST_F(SessionSearchTest, SearchPathThatIsItselfASession) {
    testing_support::CurrentDirGuard guard;
    session("top");
    ASSERT_TRUE(platform::setCurrentDirectory(root));
    const SearchResult r = search({"top", root + "/top/"});
    EXPECT_EQ(r.out, added("top") + duplicate(root + "/top/"));
    EXPECT_EQ(r.paths(), Strings{"top/"});
    std::string cwd;
    ASSERT_TRUE(platform::getCurrentDirectory(cwd));
    EXPECT_EQ(cwd, root);
}

// The scan's result is its last candidate's: a search path that is a session and holds
// sessions is itself added only when the last of them was refused.
TEST_F(SessionSearchTest, LastCandidateDecidesWhetherTheSearchPathIsTested) {
    session("P");
    session("P/A");
    EXPECT_EQ(search({root + "/P"}).out, added("A"));
    SessionSpec refused = namedSession("Z");
    refused.writeInfo = false;
    session("P/Z", refused);
    EXPECT_EQ(search({root + "/P"}).out, added("A") + added(root + "/P"));
}

TEST_F(SessionSearchTest, DuplicatesCompareWholeDirectories) {
    session("x/S1");
    session("x/S10");
    // A path that is a leading part of an accepted one is a different session.
    SearchResult r = search({root + "/x/S10", root + "/x/S1"});
    EXPECT_EQ(r.out, added(root + "/x/S10") + added(root + "/x/S1"));
    // Reached through its parent and given directly, in either order.
    r = search({root + "/x", root + "/x/./S1/"});
    EXPECT_EQ(r.out, added("S1") + added("S10") + duplicate(root + "/x/./S1/"));
    SessionSpec renamed = namedSession("not the directory name");
    session("y/S2", renamed);
    r = search({root + "/y/S2", root + "/y"});
    EXPECT_EQ(r.out, added(root + "/y/S2") + duplicate("S2"));
    // A subdirectory named like an accepted session is a duplicate whatever it holds.
    session("z/S10", renamed);
    r = search({root + "/x", root + "/z"});
    EXPECT_EQ(r.out, added("S1") + added("S10") + duplicate("S10"));
}

TEST_F(SessionSearchTest, TableLimitRefusesFurtherSessions) {
    orv::SessionTable full;
    full.entries.resize(orv::SessionTable::kCapacity);
    full.entries[5].sessionName = "S1";
    session("S1");
    session("S2");
    session("S3");
    const SearchResult r = search({root}, false, false, std::move(full));
    EXPECT_EQ(r.found, 1024U);
    EXPECT_EQ(r.out, duplicate("S1") + "MSG: Session limit reached - \"S2\" not added.\r\n" +
                         "MSG: Session limit reached - \"S3\" not added.\r\n");
}

TEST(SessionPaths, BuiltWithOneSeparator) {
    EXPECT_EQ(orv::buildSessionPath("S1", false, "/"), "/S1/");
    EXPECT_EQ(orv::buildSessionPath("S1", false, "/data"), "/data/S1/");
    EXPECT_EQ(orv::buildSessionPath("rel/S1", true, ""), "rel/S1/");
    EXPECT_EQ(orv::buildSessionPath("/", true, ""), "/");
}

TEST(FileLists, ComparePrefixAndByteOrder) {
    EXPECT_EQ(orv::comparePrefix("data", "data.000"), 0);
    EXPECT_GT(orv::comparePrefix("data.000", "data"), 0);
    EXPECT_LT(orv::comparePrefix("a", "b"), 0);
    EXPECT_GT(orv::comparePrefix("\xe9", "z"), 0);  // bytes compare unsigned
    Strings list{"data/a.csv", "data.000/b.csv.csv", "data.000/b.csv", "data.000/B.csv"};
    orv::sortFileList(list);
    EXPECT_EQ(list,
              (Strings{"data.000/B.csv", "data.000/b.csv", "data.000/b.csv.csv", "data/a.csv"}));
}

TEST(SessionSearchRun, RelativeSearchPathAndFoundCount) {
    TempDir tmp;
    testing_support::CurrentDirGuard guard;
    writeSession(tmp / "sessions/S1", namedSession("S1"));
    writeSession(tmp / "sessions/S2", namedSession("S2"));
    ASSERT_TRUE(platform::setCurrentDirectory(tmp.path()));
    const auto r = testing_support::runTool({"-s", "sessions", "-d", "out"});
    EXPECT_NE(r.output.find("Finding Sessions...\r\n" + added("S1") + added("S2") +
                            "Found 2 Session(s)\r\n"),
              std::string::npos)
        << r.output;
    std::string cwd;
    ASSERT_TRUE(platform::getCurrentDirectory(cwd));
    EXPECT_EQ(cwd, real(tmp.path()));
}

}  // namespace
