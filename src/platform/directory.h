// Directories: create, list (sorted, with pattern match) and the current directory.
#pragma once

#include <string>
#include <vector>

namespace platform {

struct DirEntry {
    std::string name;
    bool isDirectory = false;
};

// Lists `dir` (relative to the current directory, or absolute) for names matching
// `pattern`: '*' and '?' wildcards; "*.*" and "*" match every name. Matching ignores
// ASCII case, as on the logger's media. "." and ".." never appear; entries come sorted by
// name in byte order. False when the directory cannot be opened.
bool listDirectory(const std::string& dir, const std::string& pattern, std::vector<DirEntry>& out);
bool matchesPattern(const std::string& name, const std::string& pattern);

bool isDirectory(const std::string& path);

enum class MakeDirResult { Created, AlreadyExists, Failed };
MakeDirResult makeDirectory(const std::string& path, int* error = nullptr);

bool getCurrentDirectory(std::string& out);
bool setCurrentDirectory(const std::string& path);

// The canonical absolute path of an existing directory (symbolic links resolved, no
// trailing separator except for the root). False when it does not exist.
bool canonicalDirectory(const std::string& path, std::string& out);

// Joins a directory and a name with one separator (none added when dir already ends
// with one, or is empty).
std::string joinPath(const std::string& dir, const std::string& name);

}  // namespace platform
