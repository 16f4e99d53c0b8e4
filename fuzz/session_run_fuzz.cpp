// A whole run of the tool over sessions written from the input into a scratch tree. The
// run must end normally and write nothing outside its output directory, nor anything into
// its sessions.
//
// Input: sections separated by "\n@@", each beginning with a tag byte. 'O': options (space
// separated; -s, -d, -r and -npn are left out, the run adds its own -s and -d); 'I': the
// information file of a new session; 'L' / 'M': a level data file of the current session in
// data.000 / data.001; 'W': a wave file of the current session in data.000, its name's time
// made of the section's first six bytes (each taken modulo 10 as a digit), the rest the file;
// the first wave of a session starts a recording, the others are its continuation parts.
// At most 4 sessions of at most 6 level files and 4 wave files each.
#include <cstddef>
#include <cstdint>
#include <filesystem>
#include <string>
#include <string_view>
#include <vector>

#include "app/run_state.h"
#include "fuzz_support.h"
#include "platform/console.h"

namespace fs = std::filesystem;

namespace {

// Deep enough that no session name (at most 79 characters, so at most 26 "../") could
// reach above the scratch directory from the output directory.
constexpr int kDepth = 30;

struct Tree {
    std::string base;  // <scratch>/d/d/.../d
    std::string in() const { return base + "/in"; }
    std::string out() const { return base + "/out"; }
};

const Tree& tree() {
    static const Tree t = [] {
        Tree made{fuzz::scratchDirectory()};
        for (int i = 0; i < kDepth; ++i) made.base += "/d";
        fs::create_directories(made.base);
        return made;
    }();
    return t;
}

void writeFile(const std::string& path, std::string_view content) {
    std::FILE* f = std::fopen(path.c_str(), "wb");
    FUZZ_CHECK(f != nullptr);
    FUZZ_CHECK(std::fwrite(content.data(), 1, content.size(), f) == content.size());
    std::fclose(f);
}

bool isOptionLeftOut(const std::string& token) {
    if (token.size() < 2 || token[0] != '-') return false;
    const char c = static_cast<char>(token[1] | 0x20);  // lower case
    return c == 's' || c == 'd' || c == 'r' || c == 'n';
}

// Counts the entries below `dir`.
std::size_t countEntries(const std::string& dir) {
    std::size_t n = 0;
    for (auto it = fs::recursive_directory_iterator(dir); it != fs::recursive_directory_iterator();
         ++it)
        ++n;
    return n;
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
    const Tree& t = tree();
    fs::remove_all(t.in());
    fs::remove_all(t.out());
    fs::create_directories(t.in());

    std::vector<std::string> args{"-s", t.in(), "-d", t.out()};
    const std::string_view input(reinterpret_cast<const char*>(data), size);
    int sessions = 0;
    int files = 0;
    int waves = 0;
    std::size_t written = 0;  // entries created below in/
    std::string session;
    for (std::size_t pos = 0; pos < input.size();) {
        std::size_t end = input.find("\n@@", pos);
        if (end == std::string_view::npos) end = input.size();
        const std::string_view section = input.substr(pos, end - pos);
        pos = end + 3;
        if (section.empty()) continue;
        const std::string_view content = section.substr(1);
        switch (section[0]) {
            case 'O': {
                std::string token;
                for (std::size_t i = 0; i <= content.size() && args.size() < 24; ++i) {
                    if (i < content.size() && content[i] != ' ') {
                        token.push_back(content[i]);
                        continue;
                    }
                    if (!token.empty() && !isOptionLeftOut(token)) args.push_back(token);
                    token.clear();
                }
                break;
            }
            case 'I':
                if (sessions == 4) break;
                session = t.in() + "/S" + std::to_string(sessions++);
                fs::create_directories(session + "/data.000");
                fs::create_directories(session + "/data.001");
                writeFile(session + "/session.inf", content);
                files = 0;
                waves = 0;
                written += 4;
                break;
            case 'L':
            case 'M':
                if (session.empty() || files == 6) break;
                writeFile(session + (section[0] == 'L' ? "/data.000/" : "/data.001/") + "f" +
                              std::to_string(files++) + ".csv",
                          content);
                ++written;
                break;
            case 'W': {
                if (session.empty() || waves == 4 || content.size() < 6) break;
                std::string name = "/data.000/20240305_";
                for (const char c : content.substr(0, 6)) {
                    name.push_back(static_cast<char>('0' + static_cast<unsigned char>(c) % 10));
                }
                // The first starts a recording, the others are continuation parts.
                if (waves > 0) name += "_" + std::to_string(waves);
                name += ".wav";
                ++waves;
                writeFile(session + name, content.substr(6));
                ++written;
                break;
            }
            default:
                break;
        }
    }

    std::vector<const char*> argv{"orv_cmd"};
    for (const std::string& a : args) argv.push_back(a.c_str());
    std::string console;
    platform::Console out(&console);
    orv::RunEnvironment environment;
    environment.filterErrorPause = std::chrono::milliseconds(0);
    const int status = orv::runOrvCmd(static_cast<int>(argv.size()), argv.data(), out, environment);
    FUZZ_CHECK(status == orv::kExitOk || status == orv::kExitResultsLost ||
               status == orv::kExitRefused);

    // Nothing but the chain of directories down to base, base/in (as written) and base/out.
    FUZZ_CHECK(countEntries(t.in()) == written);
    std::string dir = fuzz::scratchDirectory();
    for (int level = 0; level <= kDepth; ++level) {
        std::size_t expected = 1;
        if (level == kDepth) expected = fs::exists(t.out()) ? 2 : 1;
        std::size_t n = 0;
        for (const auto& entry : fs::directory_iterator(dir)) {
            (void)entry;
            ++n;
        }
        FUZZ_CHECK(n == expected);
        if (level < kDepth) dir += "/d";
    }
    return 0;
}
