// A growable text line built from printf-style pieces. Rows are never cut or dropped for
// length: the buffer grows instead.
#pragma once

#include <string>

namespace orv {

class TextBuffer {
public:
    void append(const char* format, ...) __attribute__((format(printf, 2, 3)));
    void append(const std::string& text) { text_ += text; }
    void clear() { text_.clear(); }
    const std::string& str() const { return text_; }
    const char* data() const { return text_.data(); }
    std::size_t size() const { return text_.size(); }

private:
    std::string text_;
};

}  // namespace orv
