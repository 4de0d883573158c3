#pragma once

#include <korvane/foundation/KVURL.h>

#include <cstdint>
#include <string>
#include <sys/mman.h>
#include <unistd.h>

/// A file in memory, for readers that open one by its path.
class MemoryFile {
public:
    explicit MemoryFile(std::uint8_t const* bytes = nullptr, std::size_t size = 0)
        : fd_(memfd_create("fuzz", 0)),
          path_("/proc/self/fd/" + std::to_string(fd_)),
          url_(path_.c_str())
    {
        for (std::size_t done = 0; done < size;) {
            ssize_t const put = write(fd_, bytes + done, size - done);
            if (put <= 0)
                __builtin_trap();
            done += static_cast<std::size_t>(put);
        }
    }
    MemoryFile(MemoryFile const&) = delete;
    MemoryFile& operator=(MemoryFile const&) = delete;
    ~MemoryFile() { close(fd_); }

    std::string const& path() const { return path_; }
    CFURLRef url() const { return url_.cf_url(); }

private:
    int fd_;
    std::string path_;
    KVURL url_;
};
