// Files: open, read whole, create, write, delete. Error codes are the system's (errno).
#pragma once

#include <cstddef>
#include <cstdint>
#include <string>
#include <vector>

namespace platform {

// An open file descriptor, closed on destruction. Invalid when default constructed.
class File {
public:
    File() = default;
    explicit File(int fd) : fd_(fd) {}
    File(const File&) = delete;
    File& operator=(const File&) = delete;
    File(File&& other) noexcept : fd_(other.release()) {}
    File& operator=(File&& other) noexcept;
    ~File() { close(); }

    bool valid() const { return fd_ >= 0; }
    int fd() const { return fd_; }
    // Closes the descriptor; the system's error code when closing reported one (a write that
    // could not be completed may show only here), else 0.
    int close();
    int release();

    // Writes all bytes; returns how many were written (fewer on error; `error` gets errno).
    std::size_t write(const void* data, std::size_t size, int* error = nullptr);
    std::size_t write(const std::string& text, int* error = nullptr) {
        return write(text.data(), text.size(), error);
    }
    // Reads up to size bytes, looping until done or end of file.
    std::size_t read(void* data, std::size_t size, int* error = nullptr);
    // Reads up to size bytes at `offset` without moving the file position; safe to call from
    // several threads on one file at once.
    std::size_t readAt(std::uint64_t offset, void* data, std::size_t size,
                       int* error = nullptr) const;
    bool seekRelative(std::int64_t offset);
    std::uint64_t size() const;

private:
    int fd_ = -1;
};

// Opens an existing file for reading.
File openForRead(const std::string& path, int* error = nullptr);

enum class ReadResult {
    Ok,
    OpenFailed,  // `error` holds the reason
    NotRegular,  // a directory, FIFO, device or socket
    TooLarge,    // larger than the caller's bound
    NoMemory,    // the bytes cannot be held in memory
    ReadFailed,  // `error` holds the reason (EIO when the file ended early)
};
// Reads a whole regular file. It is opened without blocking, so a FIFO or device in its
// place cannot stall the caller, and is refused unless it is a regular file no larger than
// `maxSize` bytes; nothing is allocated for a refused file.
ReadResult readRegularFile(const std::string& path, std::vector<char>& out, std::uint64_t maxSize,
                           int* error = nullptr);
// readRegularFile, then as a text-mode reader does: every CR LF becomes LF, a lone CR stays.
ReadResult readTextFile(const std::string& path, std::string& out, std::uint64_t maxSize,
                        int* error = nullptr);
// Result files: delete any old file of the name, then create it, truncated to nothing when
// the old file could not be deleted (mode 0666, umask applies). From the first call on,
// SIGXFSZ is ignored, so a write beyond the process's file size limit fails with EFBIG and is
// reported like a full disk instead of ending the process.
File createResultFile(const std::string& path, int* error = nullptr);
bool deleteFile(const std::string& path);

}  // namespace platform
