#include "ipc/progress_pipe.h"

#include <cstring>

namespace orv {

bool ProgressPipe::open() { return fifo_.open(name_); }

void ProgressPipe::sendProgress(float percent) {
    if (!fifo_.isOpen()) return;
    ProgressMessage message;
    message.percentComplete = percent;
    unsigned char bytes[sizeof message];
    std::memcpy(bytes, &message, sizeof message);  // the platform is little-endian
    fifo_.write(bytes, sizeof bytes);
}

}  // namespace orv
