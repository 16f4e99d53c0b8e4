#include "sessions/search_paths.h"

#include <new>

#include "platform/directory.h"
#include "platform/path.h"

namespace orv {

std::string comparablePath(const std::string& path) {
    std::string canonical;
    if (platform::canonicalDirectory(path, canonical)) return canonical;
    std::string text = path;
    while (text.size() > 1 && text.back() == platform::kPathSeparator) text.pop_back();
    return text;
}

AddPathResult addSearchPath(SearchPathList& list, const std::string& path, platform::Console& out) {
    try {
        std::string key = comparablePath(path);
        if (list.comparable.contains(key)) {
            out.print("MSG: Duplicate Search Path Given - \"%s\".\r\n", path.c_str());
            return AddPathResult::Duplicate;
        }
        list.paths.push_back(path);
        try {
            list.comparable.insert(std::move(key));
        } catch (const std::bad_alloc&) {
            list.paths.pop_back();
            throw;
        }
        return AddPathResult::Added;
    } catch (const std::bad_alloc&) {
        out.print("ERROR - Unable to add %s\r\n", path.c_str());
        return AddPathResult::Failed;
    }
}

}  // namespace orv
