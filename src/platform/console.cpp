#include "platform/console.h"

#include <unistd.h>

#include <cerrno>
#include <cstdarg>
#include <cstdio>

#include "platform/format.h"

namespace platform {

void Console::print(const char* format, ...) {
    std::string text;
    va_list args;
    va_start(args, format);
    appendFormatV(text, format, args);
    va_end(args);
    write(text.data(), text.size());
}

void Console::write(const char* text, std::size_t length) {
    const std::lock_guard<std::mutex> lock(mutex_);
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
