// Client end of a progress FIFO (the counterpart of a named-pipe client).
#pragma once

#include <cstddef>
#include <string>

namespace platform {

class FifoWriter {
public:
    FifoWriter() = default;
    FifoWriter(const FifoWriter&) = delete;
    FifoWriter& operator=(const FifoWriter&) = delete;
    ~FifoWriter() { close(); }

    // The path is `name` when it contains a '/', else /tmp/<name>. Opens write-only,
    // non-blocking, close-on-exec; false (silently) when there is no FIFO or no reader.
    // SIGPIPE is ignored from then on, so a reader that goes away cannot end the process.
    bool open(const std::string& name);
    // One write call (atomic on a FIFO for small messages); false when not all was written.
    bool write(const void* data, std::size_t size);
    void close();
    bool isOpen() const { return fd_ >= 0; }

    static std::string pathFor(const std::string& name);

private:
    int fd_ = -1;
};

}  // namespace platform
