// The one console print routine: printf-style text to standard output, unbuffered, with no
// line ends of its own (every message carries its "\r\n"). Worker threads print too: each
// message goes out whole, never interleaved with another.
#pragma once

#include <mutex>
#include <string>

namespace platform {

class Console {
public:
    // Writes to file descriptor 1.
    Console() = default;
    // Collects the text in `capture` instead (tests).
    explicit Console(std::string* capture) : capture_(capture) {}

    void print(const char* format, ...) __attribute__((format(printf, 2, 3)));
    void write(const char* text, std::size_t length);

private:
    std::string* capture_ = nullptr;
    std::mutex mutex_;
};

// Makes the C stdout stream unbuffered, for any library text that bypasses Console.
void makeStdoutUnbuffered();

}  // namespace platform
