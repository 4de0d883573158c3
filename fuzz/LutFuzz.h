#pragma once

#include <korvane/colour/lut_t.h>

#include <cstddef>
#include <cstdint>
#include <cstdlib>
#include <string>

#include <sys/mman.h>
#include <unistd.h>

/// A file in memory, for readers that take a path.
class MemoryFile {
public:
    MemoryFile() : fd_(::memfd_create("fuzz", 0)) {}
    MemoryFile(std::uint8_t const* data, std::size_t size) : MemoryFile()
    {
        if (size != 0 && ::write(fd_, data, size) != static_cast<ssize_t>(size))
            std::abort();
    }
    MemoryFile(MemoryFile const&) = delete;
    MemoryFile& operator=(MemoryFile const&) = delete;
    ~MemoryFile() { ::close(fd_); }

    int fd() const { return fd_; }
    std::string path() const { return "/proc/self/fd/" + std::to_string(fd_); }

private:
    int fd_;
};

inline void require(bool condition)
{
    if (!condition)
        std::abort();
}

/// Writes and fills a table that may hold fewer rows than its size tells.
inline void useTable(cc::lut_t& lut)
{
    class Identity final : public cc::lut_t::processor_t {
        cc::rgb_t process(cc::rgb_t const& colour) const override { return colour; }
    };
    MemoryFile const file;
    lut.writeCUBE(file.fd(), "f");
    lut.writeMGA(file.fd(), "f");
    lut.process(Identity());
}
