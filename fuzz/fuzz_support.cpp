#include "fuzz_support.h"

#include <cstdlib>
#include <filesystem>

namespace fuzz {

namespace {

struct Scratch {
    Scratch() {
        std::string pattern = (std::filesystem::temp_directory_path() / "orv_fuzz_XXXXXX").string();
        if (::mkdtemp(pattern.data()) == nullptr) std::abort();
        path = pattern;
    }
    ~Scratch() {
        std::error_code ec;
        std::filesystem::remove_all(path, ec);
    }
    std::string path;
};

}  // namespace

const std::string& scratchDirectory() {
    static const Scratch scratch;
    return scratch.path;
}

void emptyDirectory(const std::string& dir) {
    std::error_code ec;
    for (const auto& entry : std::filesystem::directory_iterator(dir, ec)) {
        std::filesystem::remove_all(entry.path(), ec);
    }
}

}  // namespace fuzz
