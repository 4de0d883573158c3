#include "AtomicOutput.h"

#include "ToolError.h"

#include <cerrno>
#include <climits>
#include <csignal>
#include <cstdlib>
#include <cstring>
#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>
#include <utility>

namespace {

constexpr std::size_t bufferBytes = 65536;

/// What a signal removes; set and cleared with those signals blocked.
char temporaryToRemove[PATH_MAX];

sigset_t endingSignals()
{
    sigset_t set;
    sigemptyset(&set);
    for (int signal : {SIGINT, SIGTERM, SIGHUP})
        sigaddset(&set, signal);
    return set;
}

void setTemporaryToRemove(std::string const& path)
{
    sigset_t const ending = endingSignals();
    sigset_t before;
    pthread_sigmask(SIG_BLOCK, &ending, &before);
    std::size_t const length = path.size() < sizeof temporaryToRemove ? path.size() : 0;
    std::memcpy(temporaryToRemove, path.data(), length);
    temporaryToRemove[length] = '\0';
    pthread_sigmask(SIG_SETMASK, &before, nullptr);
}

void removeTemporaryAndEnd(int signal)
{
    if (temporaryToRemove[0] != '\0')
        unlink(temporaryToRemove);
    // The handler was reset when it was entered: this ends the process.
    raise(signal);
}

/// Where a path leads once its symbolic links are followed; itself when it leads nowhere yet.
std::string followLinks(std::string const& path)
{
    char* const resolved = realpath(path.c_str(), nullptr);
    if (resolved == nullptr)
        return path;
    std::string target(resolved);
    std::free(resolved);
    return target;
}

mode_t modeOfNewFiles()
{
    mode_t const mask = umask(0);
    umask(mask);
    return 0666 & ~mask;
}

void syncFolderOf(std::string const& path)
{
    std::size_t const slash = path.rfind('/');
    std::string const folder = slash == std::string::npos ? "." : path.substr(0, slash + 1);
    int const fd = open(folder.c_str(), O_RDONLY | O_DIRECTORY | O_CLOEXEC);
    if (fd >= 0) {
        fsync(fd);
        close(fd);
    }
}

} // namespace

AtomicOutput::AtomicOutput(std::string path) : path_(std::move(path)), target_(path_)
{
    if (path_ == "-") {
        fd_ = STDOUT_FILENO;
        return;
    }

    target_ = followLinks(path_);
    struct stat status;
    bool const exists = stat(target_.c_str(), &status) == 0;
    if (exists && !S_ISREG(status.st_mode)) {
        fd_ = open(target_.c_str(), O_WRONLY | O_CLOEXEC);
        if (fd_ < 0)
            fail(errno);
        return;
    }
    if (exists && access(target_.c_str(), W_OK) != 0)
        fail(errno);

    temporary_ = target_ + ".XXXXXX";
    fd_ = mkostemp(temporary_.data(), O_CLOEXEC);
    if (fd_ < 0) {
        int const error = errno;
        temporary_.clear();
        fail(error);
    }
    setTemporaryToRemove(temporary_);
    fchmod(fd_, exists ? status.st_mode & 07777 : modeOfNewFiles());
}

AtomicOutput::~AtomicOutput()
{
    discard();
}

void AtomicOutput::write(void const* bytes, std::size_t size)
{
    buffer_.append(static_cast<char const*>(bytes), size);
    if (buffer_.size() >= bufferBytes)
        flush();
}

std::string const& AtomicOutput::temporaryPath() const
{
    if (temporary_.empty())
        throw inputOutput(path_ == "-" ? "standard output" : path_, "must be a regular file");
    return temporary_;
}

void AtomicOutput::fail(int error)
{
    buffer_.clear();
    discard();
    if (error == EPIPE)
        throw ToolError(ExitCode::InputOutput, ""); // the reader has had enough: nothing to say
    throw inputOutput(path_ == "-" ? "standard output" : path_, error);
}

void AtomicOutput::commit()
{
    flush();
    if (temporary_.empty()) {
        // A write that was put off shows itself when the last descriptor closes.
        if (close(std::exchange(fd_, -1)) != 0)
            fail(errno);
        return;
    }
    if (fsync(fd_) != 0 || close(std::exchange(fd_, -1)) != 0)
        fail(errno);
    if (rename(temporary_.c_str(), target_.c_str()) != 0)
        fail(errno);
    temporary_.clear();
    setTemporaryToRemove("");
    syncFolderOf(target_);
}

void AtomicOutput::flush()
{
    char const* next = buffer_.data();
    std::size_t left = buffer_.size();
    while (left > 0) {
        ssize_t const written = ::write(fd_, next, left);
        if (written < 0 && errno == EINTR)
            continue;
        if (written < 0)
            fail(errno);
        next += written;
        left -= static_cast<std::size_t>(written);
    }
    buffer_.clear();
}

void AtomicOutput::discard() noexcept
{
    if (fd_ > STDERR_FILENO)
        close(fd_);
    fd_ = -1;
    if (!temporary_.empty()) {
        unlink(temporary_.c_str());
        temporary_.clear();
        setTemporaryToRemove("");
    }
}

void printOutput(std::string_view text)
{
    AtomicOutput output("-");
    output.write(text);
    output.commit();
}

void prepareProcess()
{
    for (int fd : {STDIN_FILENO, STDOUT_FILENO, STDERR_FILENO})
        if (fcntl(fd, F_GETFD) < 0 && errno == EBADF) {
            // The wrong way round, so that its use still fails.
            int const taken = open("/dev/null", fd == STDIN_FILENO ? O_WRONLY : O_RDONLY);
            if (taken < 0)
                _exit(static_cast<int>(ExitCode::InputOutput));
        }

    struct sigaction action = {};
    action.sa_handler = removeTemporaryAndEnd;
    action.sa_flags = static_cast<int>(SA_RESETHAND | SA_NODEFER);
    for (int signal : {SIGINT, SIGTERM, SIGHUP})
        sigaction(signal, &action, nullptr);
    action.sa_handler = SIG_IGN;
    action.sa_flags = 0;
    sigaction(SIGPIPE, &action, nullptr);
}
