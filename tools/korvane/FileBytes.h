#pragma once

#include <cstdint>
#include <string>

/// A file read at any place. Throws ToolError with code 4 when it can not be opened or read.
class FileBytes {
public:
    explicit FileBytes(std::string path);
    FileBytes(FileBytes const&) = delete;
    FileBytes& operator=(FileBytes const&) = delete;
    ~FileBytes();

    std::uint64_t length() const noexcept { return length_; }
    /// As many bytes as there are from `offset` on, `count` at most.
    std::size_t read(std::uint64_t offset, void* bytes, std::size_t count) const;
    /// Whether both have these bytes, and they are equal. Takes a block of memory whatever `count`
    /// is.
    static bool same(FileBytes const& a, std::uint64_t offsetA, FileBytes const& b,
                     std::uint64_t offsetB, std::uint64_t count);
    /// Whether the two paths lead to one file, by whatever names.
    static bool isSameFile(std::string const& a, std::string const& b) noexcept;

private:
    std::string path_;
    int fd_;
    std::uint64_t length_ = 0;
};
