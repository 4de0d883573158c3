#include "Input.h"

#include "ToolError.h"

#include <korvane/foundation/KVString.h>

#include <cerrno>
#include <fcntl.h>
#include <string_view>
#include <sys/mman.h>
#include <sys/stat.h>
#include <unistd.h>
#include <utility>

namespace {

/// An open file descriptor; standard input's is left open.
class Descriptor {
public:
    explicit Descriptor(std::string const& path)
        : fd_(path == "-" ? STDIN_FILENO : open(path.c_str(), O_RDONLY | O_CLOEXEC))
    {
        struct stat status;
        if (fd_ < 0)
            throw inputOutput(path, errno);
        if (fstat(fd_, &status) == 0 && S_ISDIR(status.st_mode)) {
            close();
            throw inputOutput(path, EISDIR);
        }
    }

    Descriptor(Descriptor const&) = delete;
    Descriptor& operator=(Descriptor const&) = delete;
    ~Descriptor() { close(); }

    int get() const noexcept { return fd_; }
    /// The same, left to the caller.
    int release() noexcept { return std::exchange(fd_, -1); }

private:
    void close() noexcept
    {
        if (fd_ > STDERR_FILENO)
            ::close(fd_);
        fd_ = -1;
    }

    int fd_;
};

bool isPipe(int fd)
{
    struct stat status;
    return fstat(fd, &status) == 0 && S_ISFIFO(status.st_mode);
}

std::string readAll(Descriptor const& file, std::string const& path)
{
    std::string bytes;
    struct stat status;
    if (fstat(file.get(), &status) == 0 && S_ISREG(status.st_mode))
        bytes.reserve(static_cast<std::size_t>(status.st_size) + 1);

    char block[65536];
    for (;;) {
        ssize_t const got = read(file.get(), block, sizeof block);
        if (got == 0)
            return bytes;
        if (got > 0)
            bytes.append(block, static_cast<std::size_t>(got));
        else if (errno != EINTR)
            throw inputOutput(path, errno);
    }
}

/// A file without a name in any folder that holds these bytes.
int fileInMemory(std::string_view bytes, std::string const& path)
{
    int const fd = memfd_create("korvane", MFD_CLOEXEC);
    if (fd < 0)
        throw inputOutput(path, errno);
    while (!bytes.empty()) {
        ssize_t const count = write(fd, bytes.data(), bytes.size());
        if (count < 0) {
            int const error = errno;
            close(fd);
            throw inputOutput(path, error);
        }
        bytes.remove_prefix(static_cast<std::size_t>(count));
    }
    return fd;
}

} // namespace

std::string readFile(std::string const& path)
{
    return readAll(Descriptor(path), path);
}

ReopenableFile::ReopenableFile(std::string const& path) : shown_(path), path_(path)
{
    Descriptor file(path);
    if (path == "-" || isPipe(file.get()))
        fd_ = fileInMemory(readAll(file, path), path);
    else if (KVString::fromUTF8(path).isNull())
        fd_ = file.release();
    else
        return;
    path_ = "/proc/self/fd/" + std::to_string(fd_);
}

ReopenableFile::~ReopenableFile()
{
    if (fd_ >= 0)
        close(fd_);
}

QuietLibrary::QuietLibrary() : standardError_(fcntl(STDERR_FILENO, F_DUPFD_CLOEXEC, 3))
{
    if (int const nowhere = open("/dev/null", O_WRONLY | O_CLOEXEC); nowhere >= 0) {
        dup2(nowhere, STDERR_FILENO);
        close(nowhere);
    }
}

QuietLibrary::~QuietLibrary()
{
    if (standardError_ >= 0) {
        dup2(standardError_, STDERR_FILENO);
        close(standardError_);
    }
}
