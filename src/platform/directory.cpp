#include "platform/directory.h"

#include <dirent.h>
#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <climits>
#include <cstdlib>

#include "platform/path.h"

namespace platform {
namespace {

char lower(char c) { return (c >= 'A' && c <= 'Z') ? static_cast<char>(c - 'A' + 'a') : c; }

bool wildcardMatch(const char* name, const char* pattern) {
    // Iterative matcher with backtracking to the last '*'.
    const char* starP = nullptr;
    const char* starN = nullptr;
    while (*name != '\0') {
        if (*pattern == '*') {
            starP = ++pattern;
            starN = name;
        } else if (*pattern == '?' || lower(*pattern) == lower(*name)) {
            ++pattern;
            ++name;
        } else if (starP != nullptr) {
            pattern = starP;
            name = ++starN;
        } else {
            return false;
        }
    }
    while (*pattern == '*') ++pattern;
    return *pattern == '\0';
}

}  // namespace

bool matchesPattern(const std::string& name, const std::string& pattern) {
    if (pattern == "*.*" || pattern == "*") return true;
    return wildcardMatch(name.c_str(), pattern.c_str());
}

bool listDirectory(const std::string& dir, const std::string& pattern, std::vector<DirEntry>& out) {
    out.clear();
    DIR* d = ::opendir(dir.empty() ? "." : dir.c_str());
    if (d == nullptr) return false;
    const int dfd = ::dirfd(d);
    while (const dirent* e = ::readdir(d)) {
        const std::string name = e->d_name;
        if (name == "." || name == "..") continue;
        if (!matchesPattern(name, pattern)) continue;
        DirEntry entry{name, false};
        if (e->d_type == DT_DIR) {
            entry.isDirectory = true;
        } else if (e->d_type == DT_UNKNOWN || e->d_type == DT_LNK) {
            struct stat st {};
            entry.isDirectory = ::fstatat(dfd, e->d_name, &st, 0) == 0 && S_ISDIR(st.st_mode);
        }
        out.push_back(std::move(entry));
    }
    ::closedir(d);
    std::sort(out.begin(), out.end(),
              [](const DirEntry& a, const DirEntry& b) { return a.name < b.name; });
    return true;
}

bool isDirectory(const std::string& path) {
    struct stat st {};
    return ::stat(path.c_str(), &st) == 0 && S_ISDIR(st.st_mode);
}

MakeDirResult makeDirectory(const std::string& path, int* error) {
    if (::mkdir(path.c_str(), 0777) == 0) return MakeDirResult::Created;
    if (errno == EEXIST) return MakeDirResult::AlreadyExists;
    if (error != nullptr) *error = errno;
    return MakeDirResult::Failed;
}

bool getCurrentDirectory(std::string& out) {
    char buffer[PATH_MAX];
    if (::getcwd(buffer, sizeof buffer) == nullptr) return false;
    out = buffer;
    return true;
}

bool setCurrentDirectory(const std::string& path) { return ::chdir(path.c_str()) == 0; }

bool canonicalDirectory(const std::string& path, std::string& out) {
    char* resolved = ::realpath(path.c_str(), nullptr);
    if (resolved == nullptr) return false;
    out = resolved;
    std::free(resolved);
    return isDirectory(out);
}

std::string joinPath(const std::string& dir, const std::string& name) {
    if (dir.empty() || dir.back() == kPathSeparator) return dir + name;
    return dir + kPathSeparator + name;
}

}  // namespace platform
