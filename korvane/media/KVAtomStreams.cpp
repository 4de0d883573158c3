#include <korvane/media/KVAtomStreams_p.h>

#include <algorithm>
#include <cerrno>
#include <cstring>
#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

namespace {

int openFile(std::string const& path, int flags)
{
    // A zero byte inside would end the path early and lead to another file.
    if (path.find('\0') != std::string::npos) {
        errno = EINVAL;
        return -1;
    }
    errno = 0;
    return ::open(path.c_str(), flags | O_CLOEXEC, 0666);
}

} // namespace

std::unique_ptr<KVAtomInputStream> KVAtomInputStream::open(std::string const& path)
{
    // Looked at first: merely opening a pipe would wait for its other end.
    struct stat info = {};
    errno = 0;
    if (::stat(path.c_str(), &info) != 0)
        return nullptr;
    if (!S_ISREG(info.st_mode) || info.st_size <= 0) {
        errno = 0;
        return nullptr;
    }
    int const file = openFile(path, O_RDONLY);
    if (file < 0)
        return nullptr;
    return std::unique_ptr<KVAtomInputStream>(new KVAtomInputStream(
        file, static_cast<std::uint64_t>(info.st_size), info.st_dev, info.st_ino));
}

KVAtomInputStream::KVAtomInputStream(int file, std::uint64_t length, std::uint64_t device,
                                     std::uint64_t node) noexcept
    : file_(file), length_(length), device_(device), node_(node)
{}

KVAtomInputStream::~KVAtomInputStream()
{
    ::close(file_);
}

bool KVAtomInputStream::isSameFile(int file) const noexcept
{
    struct stat info = {};
    return ::fstat(file, &info) == 0 && info.st_dev == device_ && info.st_ino == node_;
}

bool KVAtomInputStream::read(std::uint8_t* bytes, std::size_t count)
{
    while (count > 0) {
        if (position_ < windowStart_ || position_ >= windowStart_ + windowLength_) {
            std::uint64_t const left = position_ < length_ ? length_ - position_ : 0;
            std::size_t const length =
                static_cast<std::size_t>(std::min<std::uint64_t>(left, kWindow));
            errno = 0;
            windowLength_ = 0;
            if (length == 0 || !readAt(position_, window_, length))
                return false;
            windowStart_ = position_;
            windowLength_ = length;
        }
        auto const start = static_cast<std::size_t>(position_ - windowStart_);
        std::size_t const piece = std::min(count, windowLength_ - start);
        std::memcpy(bytes, window_ + start, piece);
        bytes += piece;
        count -= piece;
        position_ += piece;
    }
    return true;
}

bool KVAtomInputStream::readAt(std::uint64_t position, std::uint8_t* bytes, std::size_t count)
{
    while (count > 0) {
        errno = 0;
        ssize_t const got = ::pread(file_, bytes, count, static_cast<off_t>(position));
        if (got < 0 && errno == EINTR)
            continue;
        if (got <= 0)
            return false;
        bytes += got;
        position += static_cast<std::uint64_t>(got);
        count -= static_cast<std::size_t>(got);
    }
    return true;
}

std::uint64_t KVAtomInputStream::holeAt(std::uint64_t position, std::uint64_t limit)
{
    if (position >= denseStart_ && position < denseEnd_)
        return 0;
    off_t const data = ::lseek(file_, static_cast<off_t>(position), SEEK_DATA);
    if (data < 0) {
        // No data up to the end, or a file system that does not tell.
        if (errno == ENXIO && position < length_)
            return std::min(limit, length_ - position);
        denseStart_ = 0;
        denseEnd_ = length_;
        return 0;
    }
    auto const dataStart = static_cast<std::uint64_t>(data);
    if (dataStart > position)
        return std::min(limit, dataStart - position);
    off_t const hole = ::lseek(file_, data, SEEK_HOLE);
    denseStart_ = position;
    denseEnd_ = hole < 0 ? length_ : static_cast<std::uint64_t>(hole);
    return 0;
}

void KVAtomInputStream::expectSequentialReads() noexcept
{
    ::posix_fadvise(file_, 0, 0, POSIX_FADV_SEQUENTIAL);
}

std::unique_ptr<KVAtomOutputStream> KVAtomOutputStream::open(std::string const& path,
                                                             KVAtomInputStream const* input)
{
    Block block(new std::uint8_t[kBlock]);
    // Emptied only once it is known not to be the input, whatever names the two go by.
    int const file = openFile(path, O_WRONLY | O_CREAT);
    if (file < 0)
        return nullptr;
    struct stat info = {};
    bool const regular = ::fstat(file, &info) == 0 && S_ISREG(info.st_mode);
    std::unique_ptr<KVAtomOutputStream> stream(
        new KVAtomOutputStream(file, regular, std::move(block)));
    if (input && input->isSameFile(file)) {
        errno = 0;
        return nullptr;
    }
    return stream->rewind() ? std::move(stream) : nullptr;
}

KVAtomOutputStream::KVAtomOutputStream(int file, bool regular, Block block) noexcept
    : file_(file), regular_(regular), block_(std::move(block))
{}

KVAtomOutputStream::~KVAtomOutputStream()
{
    ::close(file_);
}

bool KVAtomOutputStream::rewind()
{
    filled_ = 0;
    length_ = 0;
    endsInHole_ = false;
    errno = 0;
    return !regular_ || (::lseek(file_, 0, SEEK_SET) == 0 && ::ftruncate(file_, 0) == 0);
}

bool KVAtomOutputStream::write(std::uint8_t const* bytes, std::size_t count)
{
    while (count > 0) {
        std::size_t const piece = std::min(count, room());
        std::memcpy(free(), bytes, piece);
        if (!commit(piece))
            return false;
        bytes += piece;
        count -= piece;
    }
    return true;
}

bool KVAtomOutputStream::commit(std::size_t count)
{
    filled_ += count;
    return filled_ < kBlock || flush();
}

bool KVAtomOutputStream::skip(std::uint64_t count)
{
    if (!flush() || ::lseek(file_, static_cast<off_t>(count), SEEK_CUR) < 0)
        return false;
    length_ += count;
    endsInHole_ = true;
    return true;
}

bool KVAtomOutputStream::finish()
{
    if (!flush())
        return false;
    errno = 0;
    return !endsInHole_ || ::ftruncate(file_, static_cast<off_t>(length_)) == 0;
}

bool KVAtomOutputStream::flush()
{
    std::uint8_t const* bytes = block_.get();
    while (filled_ > 0) {
        errno = 0;
        ssize_t const put = ::write(file_, bytes, filled_);
        if (put < 0 && errno == EINTR)
            continue;
        if (put <= 0)
            return false;
        bytes += put;
        filled_ -= static_cast<std::size_t>(put);
        length_ += static_cast<std::uint64_t>(put);
        endsInHole_ = false;
    }
    return true;
}
