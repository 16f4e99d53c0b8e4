// The system's text for an error code, as the C library's strerror gives it.
#pragma once

#include <string>

namespace platform {

// Thread-safe: the text is copied out of the library's buffer.
std::string errorText(int code);

}  // namespace platform
