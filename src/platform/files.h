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
    void close();
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
// Reads a whole file; false (with errno in `error`) when it cannot be opened or fewer bytes
// than its size arrive.
bool readWholeFile(const std::string& path, std::vector<char>& out, int* error = nullptr);
// Opens for writing, creating it when missing (mode 0666, umask applies), without truncating.
File openAlways(const std::string& path, int* error = nullptr);
// Result files: delete any old file of the name, then create it anew.
File createResultFile(const std::string& path, int* error = nullptr);
// Reads a text file as a text-mode reader does: every CR LF becomes LF, a lone CR stays.
bool readTextFile(const std::string& path, std::string& out, int* error = nullptr);
bool deleteFile(const std::string& path);

}  // namespace platform
