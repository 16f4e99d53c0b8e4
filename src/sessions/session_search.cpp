#include "sessions/session_search.h"

#include <algorithm>

#include "platform/directory.h"
#include "platform/path.h"
#include "sessions/session_info.h"

namespace orv {
namespace {

bool isWavePattern(std::string_view pattern) {
    constexpr std::string_view kWave = "*.wav";
    if (pattern.size() < kWave.size()) return false;
    for (std::size_t i = 0; i < kWave.size(); ++i) {
        const char c = pattern[i];
        if ((c >= 'A' && c <= 'Z' ? static_cast<char>(c - 'A' + 'a') : c) != kWave[i]) return false;
    }
    return true;
}

bool isAncestor(const SessionSearch& search, const std::string& dir) {
    return std::find(search.walk.begin(), search.walk.end(), dir) != search.walk.end();
}

// scanDirectory over a directory whose canonical path is known.
bool scanCanonical(SessionSearch& search, const std::string& dir) {
    std::vector<platform::DirEntry> entries;
    if (!platform::listDirectory(dir, "*.*", entries)) return false;
    search.walk.push_back(dir);
    bool result = false;
    for (const platform::DirEntry& entry : entries) {
        if (!entry.isDirectory) continue;
        const std::string child = platform::joinPath(dir, entry.name);
        if (hasDataDirectory(child)) result = addSession(search, entry.name, false, dir);
        if (search.settings.recursiveSearch != 0) {
            std::string childDir;
            if (!platform::canonicalDirectory(child, childDir)) {
                result = false;
            } else if (!isAncestor(search, childDir)) {
                result = scanCanonical(search, childDir);
            }
        }
    }
    search.walk.pop_back();
    return result;
}

}  // namespace

SessionSearch::SessionSearch(const ProcessingSettings& s, SessionTable& t, platform::Console& o)
    : settings(s), table(t), out(o) {
    for (const SessionRecord& record : table.entries) {
        std::string dir;
        platform::canonicalDirectory(record.sessionPath, dir);
        acceptedDirectories.push_back(dir);
    }
}

std::uint32_t findSessions(const SearchPathList& paths, const ProcessingSettings& settings,
                           SessionTable& table, platform::Console& out) {
    SessionSearch search(settings, table, out);
    for (const std::string& path : paths.paths) {
        if (!scanDirectory(search, path) && hasDataDirectory(path)) {
            addSession(search, path, true, std::string());
        }
    }
    return table.count();
}

bool scanDirectory(SessionSearch& search, const std::string& path) {
    std::string dir;
    if (!platform::canonicalDirectory(path, dir)) return false;
    return scanCanonical(search, dir);
}

bool hasDataDirectory(const std::string& path) {
    std::vector<platform::DirEntry> entries;
    if (!platform::listDirectory(path, "data.000", entries)) return false;
    // The pattern matches in any case; the name itself must be exact.
    return std::any_of(entries.begin(), entries.end(), [](const platform::DirEntry& e) {
        return e.isDirectory && e.name == "data.000";
    });
}

std::string buildSessionPath(const std::string& name, bool isGivenPath,
                             const std::string& parentDir) {
    std::string path = isGivenPath ? name : platform::joinPath(parentDir, name);
    if (path.empty() || path.back() != platform::kPathSeparator) path += platform::kPathSeparator;
    return path;
}

bool addSession(SessionSearch& search, const std::string& name, bool isGivenPath,
                const std::string& parentDir) {
    SessionTable& table = search.table;
    // Duplicates: the same directory as an accepted session (however it is spelt), or a
    // subdirectory named like an accepted session.
    std::string dir;
    platform::canonicalDirectory(isGivenPath ? name : platform::joinPath(parentDir, name), dir);
    for (std::size_t i = 0; i < table.entries.size(); ++i) {
        const bool sameName = !isGivenPath && table.entries[i].sessionName == name;
        const bool sameDir = !dir.empty() && dir == search.acceptedDirectories[i];
        if (sameName || sameDir) {
            search.out.print("MSG: Duplicate Session Found - \"%s\". Using first instance\r\n",
                             name.c_str());
            return true;
        }
    }

    SessionRecord candidate;
    candidate.sessionPath = buildSessionPath(name, isGivenPath, parentDir);
    if (candidate.sessionPath.size() > SessionRecord::kMaxPathLength) {
        search.out.print(
            "ERR: Session path %s is longer than %zu characters - session not added\r\n",
            candidate.sessionPath.c_str(), SessionRecord::kMaxPathLength);
        return false;
    }
    if (!readSessionInfoFile(candidate, search.out)) return false;
    if (!listSessionFiles(candidate, "*.csv")) return false;
    sortFileList(candidate.dataFiles);
    if (search.settings.needWaveFiles != 0 && listSessionFiles(candidate, "*.wav")) {
        sortFileList(candidate.waveFiles);
    }
    if (table.entries.size() >= SessionTable::kCapacity) {
        search.out.print("MSG: Session limit reached - \"%s\" not added.\r\n", name.c_str());
        return false;
    }
    table.entries.push_back(std::move(candidate));
    search.acceptedDirectories.push_back(std::move(dir));
    search.out.print("MSG: Added - \"%s\".\r\n", name.c_str());
    return true;
}

bool listSessionFiles(SessionRecord& record, const std::string& pattern) {
    std::vector<std::string>& list = isWavePattern(pattern) ? record.waveFiles : record.dataFiles;
    list.clear();
    std::vector<platform::DirEntry> entries;
    if (!platform::listDirectory(record.sessionPath, "*.*", entries)) return false;
    bool any = false;
    for (const platform::DirEntry& entry : entries) {
        if (entry.isDirectory && entry.name.starts_with("data") &&
            listFilesInDirectory(record.sessionPath, entry.name, pattern, list)) {
            any = true;
        }
    }
    return any;
}

bool listFilesInDirectory(const std::string& base, const std::string& dir,
                          const std::string& pattern, std::vector<std::string>& list) {
    std::vector<platform::DirEntry> entries;
    if (!platform::listDirectory(platform::joinPath(base, dir), pattern, entries)) return false;
    bool added = false;
    for (const platform::DirEntry& entry : entries) {
        if (entry.isDirectory) continue;  // only files are recordings
        list.push_back(dir + platform::kPathSeparator + entry.name);
        added = true;
    }
    return added;
}

int comparePrefix(std::string_view a, std::string_view b) {
    for (std::size_t i = 0; i < a.size(); ++i) {
        const auto ca = static_cast<unsigned char>(a[i]);
        const auto cb = i < b.size() ? static_cast<unsigned char>(b[i]) : 0U;
        if (ca != cb) return ca < cb ? -1 : 1;
    }
    return 0;
}

void sortFileList(std::vector<std::string>& list) {
    std::sort(list.begin(), list.end(), [](const std::string& a, const std::string& b) {
        const int c = comparePrefix(a, b);
        return c < 0 || (c == 0 && a.size() < b.size());
    });
}

}  // namespace orv
