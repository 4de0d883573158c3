#include <korvane/serialization/KVFileDescriptor_p.h>

#include <cerrno>
#include <limits>

#include <fcntl.h>
#include <unistd.h>

namespace {

// What a single call moves at most on Linux is a little below 2 GiB; ask for less than that.
constexpr unsigned long long mostOfCall = 1u << 30;

bool fitsOffset(unsigned long long position) noexcept
{
    return position <= static_cast<unsigned long long>(std::numeric_limits<off_t>::max());
}

/// Calls `move(bytes, length)` until all is moved, it answers 0 or it fails.
template <class Byte, class Move>
int moveAll(Byte* data, unsigned long long length, unsigned long long* count, Move move) noexcept
{
    *count = 0;
    while (*count < length) {
        unsigned long long const left = length - *count;
        ssize_t const moved = move(data + *count, left < mostOfCall ? left : mostOfCall);
        if (moved > 0)
            *count += static_cast<unsigned long long>(moved);
        else if (moved == 0)
            return 0;
        else if (errno != EINTR)
            return errno;
    }
    return 0;
}

} // namespace

int KVFileDescriptor::openForReading(KVURL const& url)
{
    return open(url, O_RDONLY);
}

int KVFileDescriptor::openForWriting(KVURL const& url)
{
    return open(url, O_WRONLY | O_CREAT | O_TRUNC);
}

int KVFileDescriptor::open(KVURL const& url, int flags)
{
    std::string const path = url.getAsFileSystemString();
    if (path.empty() || path.find('\0') != std::string::npos)
        return ENOENT;
    do
        descriptor_ = ::open(path.c_str(), flags | O_CLOEXEC, 0666);
    while (descriptor_ < 0 && errno == EINTR);
    return descriptor_ < 0 ? errno : 0;
}

int KVFileDescriptor::close() noexcept
{
    if (!isOpen())
        return 0;
    int const result = ::close(descriptor_);
    descriptor_ = -1;
    // The descriptor is gone also when a signal interrupted the call.
    return result != 0 && errno != EINTR ? errno : 0;
}

int KVFileDescriptor::seek(unsigned long long position) noexcept
{
    if (!fitsOffset(position))
        return EINVAL;
    return lseek(descriptor_, static_cast<off_t>(position), SEEK_SET) < 0 ? errno : 0;
}

int KVFileDescriptor::writeAll(void const* data, unsigned long long length) noexcept
{
    unsigned long long count;
    return moveAll(
        static_cast<char const*>(data), length, &count,
        [this](char const* bytes, std::size_t size) { return ::write(descriptor_, bytes, size); });
}

int KVFileDescriptor::writeAllAt(void const* data, unsigned long long length,
                                 unsigned long long position) noexcept
{
    if (!fitsOffset(position))
        return EINVAL;
    unsigned long long count;
    char const* const start = static_cast<char const*>(data);
    return moveAll(start, length, &count, [&](char const* bytes, std::size_t size) {
        return pwrite(descriptor_, bytes, size, static_cast<off_t>(position) + (bytes - start));
    });
}

int KVFileDescriptor::read(void* data, unsigned long long length,
                           unsigned long long* count) noexcept
{
    return moveAll(static_cast<char*>(data), length, count, [this](char* bytes, std::size_t size) {
        return ::read(descriptor_, bytes, size);
    });
}
