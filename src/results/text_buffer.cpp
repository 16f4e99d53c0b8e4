#include "results/text_buffer.h"

#include <cstdarg>

#include "platform/format.h"

namespace orv {

void TextBuffer::append(const char* format, ...) {
    va_list args;
    va_start(args, format);
    platform::appendFormatV(text_, format, args);
    va_end(args);
}

}  // namespace orv
