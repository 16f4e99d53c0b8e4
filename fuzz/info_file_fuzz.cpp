// The session information file: the line rules over any text, and the name the session's
// result files then carry.
#include <cstddef>
#include <cstdint>
#include <string>
#include <string_view>

#include "fuzz_support.h"
#include "platform/console.h"
#include "results/result_files.h"
#include "sessions/session_info.h"

namespace {

// A name that keeps a result path inside its directory.
bool isUsableFileName(const std::string& name) {
    if (name.empty() || name[0] == '.') return false;
    for (const char c : name) {
        const auto u = static_cast<unsigned char>(c);
        if (c == '/' || c == '\\' || u < 0x20 || u == 0x7F) return false;
    }
    return true;
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
    const std::string_view text(reinterpret_cast<const char*>(data), size);
    orv::SessionRecord record;
    record.sessionPath = "/sessions/.S/";
    std::size_t badLine = 0;
    const bool ok = orv::parseSessionInfoText(text, record, &badLine);
    FUZZ_CHECK(ok == (badLine == 0));
    FUZZ_CHECK(badLine <= size + 1);
    FUZZ_CHECK(record.sessionName.size() <= orv::SessionRecord::kMaxNameLength);

    std::string console;
    platform::Console out(&console);
    orv::RunResults run(out);
    const std::string name = run.sessionFileName(record);
    FUZZ_CHECK(isUsableFileName(name));
    FUZZ_CHECK((name == record.sessionName) == console.empty());
    FUZZ_CHECK(run.sessionFileName(record) == name + "_2");
    return 0;
}
