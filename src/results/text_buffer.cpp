#include "results/text_buffer.h"

#include <cstdarg>
#include <cstdio>

namespace orv {

void TextBuffer::append(const char* format, ...) {
    char small[256];
    va_list args;
    va_start(args, format);
    va_list copy;
    va_copy(copy, args);
    const int n = std::vsnprintf(small, sizeof small, format, args);
    va_end(args);
    if (n >= 0 && static_cast<std::size_t>(n) < sizeof small) {
        text_.append(small, static_cast<std::size_t>(n));
    } else if (n > 0) {
        const std::size_t at = text_.size();
        text_.resize(at + static_cast<std::size_t>(n) + 1);
        std::vsnprintf(text_.data() + at, static_cast<std::size_t>(n) + 1, format, copy);
        text_.resize(at + static_cast<std::size_t>(n));
    }
    va_end(copy);
}

}  // namespace orv
