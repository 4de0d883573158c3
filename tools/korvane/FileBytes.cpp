#include "FileBytes.h"

#include "ToolError.h"

#include <algorithm>
#include <cerrno>
#include <cstring>
#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>
#include <utility>
#include <vector>

FileBytes::FileBytes(std::string path)
    : path_(std::move(path)), fd_(open(path_.c_str(), O_RDONLY | O_CLOEXEC))
{
    struct stat status = {};
    if (fd_ < 0)
        throw inputOutput(path_, errno);
    if (fstat(fd_, &status) == 0)
        length_ = static_cast<std::uint64_t>(status.st_size);
}

FileBytes::~FileBytes()
{
    close(fd_);
}

std::size_t FileBytes::read(std::uint64_t offset, void* bytes, std::size_t count) const
{
    std::size_t done = 0;
    while (done < count && offset + done < length_) {
        ssize_t const got = pread(fd_, static_cast<char*>(bytes) + done, count - done,
                                  static_cast<off_t>(offset + done));
        if (got < 0 && errno == EINTR)
            continue;
        if (got < 0)
            throw inputOutput(path_, errno);
        if (got == 0)
            break;
        done += static_cast<std::size_t>(got);
    }
    return done;
}

bool FileBytes::same(FileBytes const& a, std::uint64_t offsetA, FileBytes const& b,
                     std::uint64_t offsetB, std::uint64_t count)
{
    constexpr std::uint64_t kBlock = 256 * 1024;
    if (offsetA > a.length_ || count > a.length_ - offsetA || offsetB > b.length_ ||
        count > b.length_ - offsetB)
        return false;
    auto const size = static_cast<std::size_t>(std::min(count, kBlock));
    std::vector<char> bytesA(size), bytesB(size);
    for (std::uint64_t done = 0; done < count;) {
        auto const piece = static_cast<std::size_t>(std::min<std::uint64_t>(size, count - done));
        if (a.read(offsetA + done, bytesA.data(), piece) != piece ||
            b.read(offsetB + done, bytesB.data(), piece) != piece ||
            std::memcmp(bytesA.data(), bytesB.data(), piece) != 0)
            return false;
        done += piece;
    }
    return true;
}

bool FileBytes::isSameFile(std::string const& a, std::string const& b) noexcept
{
    struct stat statusA = {}, statusB = {};
    return stat(a.c_str(), &statusA) == 0 && stat(b.c_str(), &statusB) == 0 &&
           statusA.st_dev == statusB.st_dev && statusA.st_ino == statusB.st_ino;
}
