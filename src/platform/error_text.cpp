#include "platform/error_text.h"

#include <cstring>

namespace platform {
namespace {

// strerror_r comes in two flavours: the GNU one returns the text, the XSI one fills the
// buffer and returns a status. Overloads pick whichever this C library declares.
[[maybe_unused]] const char* pickText(const char* result, const char* /*buffer*/) { return result; }
[[maybe_unused]] const char* pickText(int result, const char* buffer) {
    return result == 0 ? buffer : "Unknown error";
}

}  // namespace

std::string errorText(int code) {
    char buffer[256] = {};
    return pickText(::strerror_r(code, buffer, sizeof buffer), buffer);
}

}  // namespace platform
