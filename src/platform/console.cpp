#include "platform/console.h"

#include <unistd.h>

#include <cerrno>
#include <cstdarg>
#include <cstdio>
#include <vector>

namespace platform {

void Console::print(const char* format, ...) {
    char small[512];
    va_list args;
    va_start(args, format);
    va_list copy;
    va_copy(copy, args);
    const int n = std::vsnprintf(small, sizeof small, format, args);
    va_end(args);
    if (n < 0) {
        va_end(copy);
        return;
    }
    if (static_cast<std::size_t>(n) < sizeof small) {
        va_end(copy);
        write(small, static_cast<std::size_t>(n));
        return;
    }
    std::vector<char> big(static_cast<std::size_t>(n) + 1);
    std::vsnprintf(big.data(), big.size(), format, copy);
    va_end(copy);
    write(big.data(), static_cast<std::size_t>(n));
}

void Console::write(const char* text, std::size_t length) {
    if (capture_ != nullptr) {
        capture_->append(text, length);
        return;
    }
    while (length > 0) {
        const ssize_t w = ::write(STDOUT_FILENO, text, length);
        if (w < 0) {
            if (errno == EINTR) continue;
            return;
        }
        text += w;
        length -= static_cast<std::size_t>(w);
    }
}

void makeStdoutUnbuffered() { std::setvbuf(stdout, nullptr, _IONBF, 0); }

}  // namespace platform
