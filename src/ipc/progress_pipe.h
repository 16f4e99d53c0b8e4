// Client end of the progress channel a front end listens on.
#pragma once

#include <cstdint>
#include <string>

#include "platform/fifo.h"

namespace orv {

// 12 bytes, little-endian: code 0 (progress), total length 12, percent complete (f32).
struct ProgressMessage {
    std::uint32_t messageCode = 0;
    std::uint32_t messageLength = 12;
    float percentComplete = 0.0F;
};
static_assert(sizeof(ProgressMessage) == 12, "the message is 12 packed bytes");

class ProgressPipe {
public:
    ProgressPipe() = default;
    explicit ProgressPipe(std::string name) : name_(std::move(name)) {}

    // Opens the client end; false (silently) when there is no name, no such pipe or no
    // reader. The run goes on the same way without it.
    bool open();
    // One message per call when the pipe is open; failures are ignored.
    void sendProgress(float percent);
    void close() { fifo_.close(); }
    bool isOpen() const { return fifo_.isOpen(); }

private:
    std::string name_;
    platform::FifoWriter fifo_;
};

}  // namespace orv
