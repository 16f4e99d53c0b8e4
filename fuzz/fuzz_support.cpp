#include "fuzz_support.h"

#include <cstdlib>
#include <filesystem>

namespace fuzz {

namespace {

struct Scratch {
    // In memory where the system offers it: the targets create and delete files at every
    // input, which a disk file system makes several times slower.
    Scratch() {
        for (const std::filesystem::path& dir :
             {std::filesystem::path("/dev/shm"), std::filesystem::temp_directory_path()}) {
            std::string pattern = (dir / "orv_fuzz_XXXXXX").string();
            if (::mkdtemp(pattern.data()) != nullptr) {
                path = pattern;
                return;
            }
        }
        std::abort();
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
