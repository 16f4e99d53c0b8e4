#include "platform/files.h"

#include <fcntl.h>
#include <signal.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <new>

namespace platform {

File& File::operator=(File&& other) noexcept {
    if (this != &other) {
        close();
        fd_ = other.release();
    }
    return *this;
}

int File::close() {
    int error = 0;
    if (fd_ >= 0 && ::close(fd_) != 0 && errno != EINTR) error = errno;
    fd_ = -1;
    return error;
}

int File::release() {
    const int fd = fd_;
    fd_ = -1;
    return fd;
}

std::size_t File::write(const void* data, std::size_t size, int* error) {
    const char* p = static_cast<const char*>(data);
    std::size_t done = 0;
    while (done < size) {
        const ssize_t w = ::write(fd_, p + done, size - done);
        if (w < 0) {
            if (errno == EINTR) continue;
            if (error != nullptr) *error = errno;
            break;
        }
        done += static_cast<std::size_t>(w);
    }
    return done;
}

namespace {

// Calls `once(buffer, count, done)` (one read of at most count bytes) until `size` bytes have
// arrived, the end of the file is reached or an error other than an interruption occurs.
template <typename ReadOnce>
std::size_t readFully(void* data, std::size_t size, int* error, ReadOnce once) {
    char* p = static_cast<char*>(data);
    std::size_t done = 0;
    while (done < size) {
        const ssize_t r = once(p + done, size - done, done);
        if (r < 0) {
            if (errno == EINTR) continue;
            if (error != nullptr) *error = errno;
            break;
        }
        if (r == 0) break;
        done += static_cast<std::size_t>(r);
    }
    return done;
}

}  // namespace

std::size_t File::read(void* data, std::size_t size, int* error) {
    return readFully(data, size, error,
                     [this](char* p, std::size_t n, std::size_t) { return ::read(fd_, p, n); });
}

std::size_t File::readAt(std::uint64_t offset, void* data, std::size_t size, int* error) const {
    return readFully(data, size, error, [this, offset](char* p, std::size_t n, std::size_t done) {
        return ::pread(fd_, p, n, static_cast<off_t>(offset + done));
    });
}

bool File::seekRelative(std::int64_t offset) {
    return ::lseek(fd_, static_cast<off_t>(offset), SEEK_CUR) != static_cast<off_t>(-1);
}

std::uint64_t File::size() const {
    struct stat st {};
    if (::fstat(fd_, &st) != 0) return 0;
    return static_cast<std::uint64_t>(st.st_size);
}

File openForRead(const std::string& path, int* error) {
    const int fd = ::open(path.c_str(), O_RDONLY | O_CLOEXEC);
    if (fd < 0 && error != nullptr) *error = errno;
    return File(fd);
}

ReadResult readRegularFile(const std::string& path, std::vector<char>& out, std::uint64_t maxSize,
                           int* error) {
    const int fd = ::open(path.c_str(), O_RDONLY | O_NONBLOCK | O_CLOEXEC);
    if (fd < 0) {
        if (error != nullptr) *error = errno;
        return ReadResult::OpenFailed;
    }
    File f(fd);
    struct stat st {};
    if (::fstat(fd, &st) != 0) {
        if (error != nullptr) *error = errno;
        return ReadResult::OpenFailed;
    }
    if (!S_ISREG(st.st_mode)) return ReadResult::NotRegular;
    const auto size = static_cast<std::uint64_t>(st.st_size);
    if (size > maxSize) return ReadResult::TooLarge;
    try {
        out.resize(static_cast<std::size_t>(size));
    } catch (const std::bad_alloc&) {
        return ReadResult::NoMemory;
    }
    int readError = 0;
    if (f.read(out.data(), out.size(), &readError) != out.size()) {
        if (error != nullptr) *error = readError != 0 ? readError : EIO;
        return ReadResult::ReadFailed;
    }
    return ReadResult::Ok;
}

ReadResult readTextFile(const std::string& path, std::string& out, std::uint64_t maxSize,
                        int* error) {
    std::vector<char> bytes;
    const ReadResult result = readRegularFile(path, bytes, maxSize, error);
    if (result != ReadResult::Ok) return result;
    try {
        out.clear();
        out.reserve(bytes.size());
    } catch (const std::bad_alloc&) {
        return ReadResult::NoMemory;
    }
    for (std::size_t i = 0; i < bytes.size(); ++i) {
        if (bytes[i] == '\r' && i + 1 < bytes.size() && bytes[i + 1] == '\n') continue;
        out.push_back(bytes[i]);
    }
    return ReadResult::Ok;
}

File createResultFile(const std::string& path, int* error) {
    ::signal(SIGXFSZ, SIG_IGN);
    deleteFile(path);
    const int fd = ::open(path.c_str(), O_WRONLY | O_CREAT | O_TRUNC | O_CLOEXEC, 0666);
    if (fd < 0 && error != nullptr) *error = errno;
    return File(fd);
}

bool deleteFile(const std::string& path) { return ::unlink(path.c_str()) == 0; }

}  // namespace platform
