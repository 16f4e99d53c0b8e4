#include "platform/directory.h"

#include <gtest/gtest.h>

#include "platform/files.h"
#include "support/test_support.h"

namespace {

using testing_support::TempDir;
using testing_support::writeFile;

std::vector<std::string> names(const std::vector<platform::DirEntry>& entries) {
    std::vector<std::string> out;
    for (const auto& e : entries) out.push_back(e.name + (e.isDirectory ? "/" : ""));
    return out;
}

TEST(DirectoryListing, SortedByteOrderWithoutDotEntriesAndOnlyOfDirectories) {
    TempDir dir;
    for (const char* n : {"b.csv", "a.CSV", "B.csv", "c.txt", "_x.csv", "a10.csv", "a2.csv"}) {
        writeFile(dir / n, "x");
    }
    testing_support::makeDirs(dir / "data.000");
    testing_support::makeDirs(dir / "Data.001");
    std::vector<platform::DirEntry> entries;
    ASSERT_TRUE(platform::listDirectory(dir.path(), "*.*", entries));
    EXPECT_EQ(names(entries),
              (std::vector<std::string>{"B.csv", "Data.001/", "_x.csv", "a.CSV", "a10.csv",
                                        "a2.csv", "b.csv", "c.txt", "data.000/"}));
    ASSERT_TRUE(platform::listDirectory(dir.path(), "*.csv", entries));
    EXPECT_EQ(names(entries),
              (std::vector<std::string>{"B.csv", "_x.csv", "a.CSV", "a10.csv", "a2.csv", "b.csv"}));
    ASSERT_TRUE(platform::listDirectory(dir.path(), "*.wav", entries));
    EXPECT_TRUE(entries.empty());
    // A missing directory, or a file, cannot be listed.
    EXPECT_FALSE(platform::listDirectory(dir / "nope", "*.*", entries));
    EXPECT_FALSE(platform::listDirectory(dir / "c.txt", "*.*", entries));
}

TEST(DirectoryListing, PatternMatch) {
    using platform::matchesPattern;
    EXPECT_TRUE(matchesPattern("noext", "*.*"));
    EXPECT_TRUE(matchesPattern("20200917_083000.WAV", "*.wav"));
    EXPECT_TRUE(matchesPattern("x.wav", "*.WAV"));
    EXPECT_FALSE(matchesPattern("x.wave", "*.wav"));
    EXPECT_FALSE(matchesPattern("xwav", "*.wav"));
    EXPECT_TRUE(matchesPattern(".csv", "*.csv"));
    EXPECT_TRUE(matchesPattern("a.b.csv", "*.csv"));
    EXPECT_TRUE(matchesPattern("data.000", "data.???"));
    EXPECT_FALSE(matchesPattern("data.0000", "data.???"));
}

TEST(Directories, CreateAndResolve) {
    TempDir dir;
    EXPECT_EQ(platform::makeDirectory(dir / "out"), platform::MakeDirResult::Created);
    EXPECT_EQ(platform::makeDirectory(dir / "out"), platform::MakeDirResult::AlreadyExists);
    int error = 0;
    EXPECT_EQ(platform::makeDirectory(dir / "missing/deeper", &error),
              platform::MakeDirResult::Failed);
    EXPECT_NE(error, 0);

    std::string canonical;
    ASSERT_TRUE(platform::canonicalDirectory(dir / "out/", canonical));
    std::string viaDots;
    ASSERT_TRUE(platform::canonicalDirectory(dir / "out/../out", viaDots));
    EXPECT_EQ(canonical, viaDots);
    EXPECT_NE(canonical.back(), '/');
    writeFile(dir / "plain", "x");
    EXPECT_FALSE(platform::canonicalDirectory(dir / "plain", canonical));

    EXPECT_EQ(platform::joinPath("/a", "b"), "/a/b");
    EXPECT_EQ(platform::joinPath("/a/", "b"), "/a/b");
    EXPECT_EQ(platform::joinPath("/", "b"), "/b");
}

TEST(Files, ResultFilesReplaceOldContentAndTextModeReadsCrLf) {
    TempDir dir;
    const std::string path = dir / "r.csv";
    writeFile(path, "old content that is long");
    {
        platform::File f = platform::createResultFile(path);
        ASSERT_TRUE(f.valid());
        EXPECT_EQ(f.write(std::string("new")), 3U);
    }
    EXPECT_EQ(testing_support::readFile(path), "new");

    writeFile(path, "a\r\nb\rc\n\r\n");
    std::string text;
    ASSERT_EQ(platform::readTextFile(path, text, 100), platform::ReadResult::Ok);
    EXPECT_EQ(text, "a\nb\rc\n\n");
}

}  // namespace
