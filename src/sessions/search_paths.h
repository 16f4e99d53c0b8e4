// The ordered list of search paths given with -s.
#pragma once

#include <string>
#include <unordered_set>
#include <vector>

#include "platform/console.h"

namespace orv {

struct SearchPathList {
    std::vector<std::string> paths;
    // The comparable form of every entry, computed once when it was added.
    std::unordered_set<std::string> comparable{};

    void clear() {
        paths = {};
        comparable = {};
    }
};

enum class AddPathResult { Added, Duplicate, Failed };

// Adds one path. A path naming the same directory as an earlier entry (compared as
// canonical absolute paths, so a trailing separator or a relative spelling makes no
// difference) is a duplicate: "MSG: Duplicate Search Path Given" is printed and it is
// dropped. A failure to store prints "ERROR - Unable to add %s".
AddPathResult addSearchPath(SearchPathList& list, const std::string& path, platform::Console& out);

// The comparable form of a path: its canonical absolute path when it names an existing
// directory, else the text without trailing separators.
std::string comparablePath(const std::string& path);

}  // namespace orv
