#include "Input.h"

#include "ToolError.h"

#include <cerrno>
#include <fcntl.h>
#include <string_view>
#include <sys/mman.h>
#include <sys/stat.h>
#include <unistd.h>

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

private:
    void close() noexcept
    {
        if (fd_ > STDERR_FILENO)
            ::close(fd_);
        fd_ = -1;
    }

    int fd_;
};

} // namespace

std::string readFile(std::string const& path)
{
    Descriptor const file(path);
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

void checkReadable(std::string const& path)
{
    Descriptor const file(path);
}

ReopenableFile::ReopenableFile(std::string const& path) : shown_(path), path_(path)
{
    if (path != "-") {
        checkReadable(path);
        return;
    }
    std::string const bytes = readFile(path);
    fd_ = memfd_create("korvane", MFD_CLOEXEC);
    if (fd_ < 0)
        throw inputOutput(path, errno);
    for (std::string_view rest(bytes); !rest.empty();) {
        ssize_t const count = write(fd_, rest.data(), rest.size());
        if (count < 0) {
            int const error = errno;
            close(fd_);
            throw inputOutput(path, error);
        }
        rest.remove_prefix(static_cast<std::size_t>(count));
    }
    path_ = "/proc/self/fd/" + std::to_string(fd_);
}

ReopenableFile::~ReopenableFile()
{
    if (fd_ >= 0)
        close(fd_);
}
