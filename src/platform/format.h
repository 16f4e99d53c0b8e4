// printf-style formatting appended to a string, whatever the length of the result.
#pragma once

#include <cstdarg>
#include <string>

namespace platform {

void appendFormatV(std::string& out, const char* format, va_list args)
    __attribute__((format(printf, 2, 0)));

}  // namespace platform
