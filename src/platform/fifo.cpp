#include "platform/fifo.h"

#include <fcntl.h>
#include <signal.h>
#include <sys/stat.h>
#include <unistd.h>

namespace platform {

std::string FifoWriter::pathFor(const std::string& name) {
    if (name.find('/') != std::string::npos) return name;
    return "/tmp/" + name;
}

bool FifoWriter::open(const std::string& name) {
    close();
    ::signal(SIGPIPE, SIG_IGN);
    const std::string path = pathFor(name);
    const int fd = ::open(path.c_str(), O_WRONLY | O_NONBLOCK | O_CLOEXEC);
    if (fd < 0) return false;
    struct stat st {};
    if (::fstat(fd, &st) != 0 || !S_ISFIFO(st.st_mode)) {
        ::close(fd);
        return false;
    }
    fd_ = fd;
    return true;
}

bool FifoWriter::write(const void* data, std::size_t size) {
    if (fd_ < 0) return false;
    const ssize_t w = ::write(fd_, data, size);
    return w == static_cast<ssize_t>(size);
}

void FifoWriter::close() {
    if (fd_ >= 0) ::close(fd_);
    fd_ = -1;
}

}  // namespace platform
