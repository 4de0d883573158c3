#include <korvane/foundation/KVPrint.h>

#include <korvane/foundation/KVInfo.h>
#include <korvane/foundation/KVLocale_p.h>
#include <korvane/foundation/KVStackSymbols_p.h>

#include <fcntl.h>
#include <pthread.h>
#include <sys/uio.h>
#include <unistd.h>

#include <algorithm>
#include <atomic>
#include <csignal>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <mutex>

// --- Printing ---

namespace {

/// The per-process log file, for when the environment asks for it.
class LogFile {
public:
    /// Asks the environment at the first call; the answer stands for the life of the process.
    static LogFile* get()
    {
        static bool const wanted = std::getenv("kvPrintUseLogFile") != nullptr;
        static auto* const instance = wanted ? new LogFile : nullptr;
        return instance;
    }

    void print(char const* format, std::va_list arguments)
    {
        std::scoped_lock const lock(mutex_);
        if (!file_)
            file_ = open();
        if (!file_)
            return;
        std::vfprintf(file_, format, arguments);
        std::fflush(file_);
    }

private:
    static std::FILE* open()
    {
        char path[64];
        std::snprintf(path, sizeof path, "/tmp/output.%d.log", static_cast<int>(::getpid()));
        // Anyone may plant a link in /tmp: it is not followed.
        int const descriptor =
            ::open(path, O_WRONLY | O_CREAT | O_TRUNC | O_NOFOLLOW | O_CLOEXEC, 0666);
        if (descriptor < 0)
            return nullptr;
        std::FILE* const file = ::fdopen(descriptor, "w");
        if (!file)
            ::close(descriptor);
        return file;
    }

    std::mutex mutex_;
    std::FILE* file_ = nullptr;
};

} // namespace

void KVPrintVA(char const* format, std::va_list arguments)
{
    if (LogFile* const log = LogFile::get())
        log->print(format, arguments);
    else
        std::vprintf(format, arguments);
}

void KVPrint(char const* format, ...)
{
    std::va_list arguments;
    va_start(arguments, format);
    KVPrintVA(format, arguments);
    va_end(arguments);
}

void KVPrintIndent(unsigned int depth, char const* format, ...)
{
    if (depth != 0) {
        int const width = static_cast<int>(std::min(depth, 0x3FFFFFFFu) * 2);
        KVPrint("%*.*s", width, width, "");
    }
    std::va_list arguments;
    va_start(arguments, format);
    KVPrintVA(format, arguments);
    va_end(arguments);
}

void KVPrintStack() {}
void KVPrintStackStart() {}
void KVPrintStackStop() {}

// --- Logging ---

namespace {

std::atomic<KVLogSink> logSink{nullptr};

void logLine(char const* line, std::size_t length)
{
    if (KVLogSink const sink = logSink)
        return sink(line, length);
    iovec pieces[2] = {{const_cast<char*>(line), length}, {const_cast<char*>("\n"), 1}};
    // Nobody could be told of a failure to log.
    [[maybe_unused]] ssize_t const written = ::writev(STDERR_FILENO, pieces, 2);
}

void logText(std::string const& text)
{
    logLine(text.data(), text.size());
}

constexpr std::size_t crashBufferSize = 1124;
constexpr char crashPrefix[] = "Last Korvane Log: ";
constexpr std::size_t crashPrefixLength = sizeof crashPrefix - 1;
char crashreporter_buffer[crashBufferSize];

} // namespace

void KVSetLogSink(KVLogSink sink) noexcept
{
    logSink = sink;
}

void _KVSetCrashReporterMessage(char const* text)
{
    static bool const prefixed = [] {
        std::memcpy(crashreporter_buffer, crashPrefix, crashPrefixLength);
        return true;
    }();
    static_cast<void>(prefixed);
    constexpr std::size_t room = crashBufferSize - crashPrefixLength - 1;
    std::size_t const length = text ? ::strnlen(text, room) : 0;
    char* const out = crashreporter_buffer + crashPrefixLength;
    if (length != 0)
        std::memcpy(out, text, length);
    out[length] = '\0';
    crashreporter_buffer[crashBufferSize - 1] = '\0';
}

char const* KVCrashReporterBuffer() noexcept
{
    return crashreporter_buffer;
}

void _KVLogMessageInternal(char const* file, unsigned int line, char const* format,
                           std::va_list arguments)
{
    char buffer[1024];
    int const length = std::vsnprintf(buffer, sizeof buffer, format, arguments);
    if (length < 0) {
        buffer[0] = '\0';
    } else if (length <= 1022) {
        auto const used = static_cast<std::size_t>(length);
        std::snprintf(buffer + used, sizeof buffer - used, " (file: %s, line: %u)",
                      file ? file : "(null)", line);
    }
    _KVSetCrashReporterMessage(buffer);
    logLine(buffer, std::strlen(buffer));
}

void _KVLogMessage(char const* file, unsigned int line, char const* format, ...)
{
    std::va_list arguments;
    va_start(arguments, format);
    _KVLogMessageInternal(file, line, format, arguments);
    va_end(arguments);
}

void _KVNSLog(CFStringRef format, ...)
{
    if (!format)
        return;
    std::va_list arguments;
    va_start(arguments, format);
    logText(kv::formatWithObjects(CFStringGetUTF8(format), arguments));
    va_end(arguments);
}

void _KVPrintBacktrace()
{
    logText(kv::callStackText());
}

// --- Assertions ---

namespace {

std::atomic<KVUnitTestCase*> currentTestCase{nullptr};

bool onMainThread() noexcept
{
    return ::gettid() == ::getpid();
}

/// Whether the kernel says that another process traces this one.
bool isTraced()
{
    bool traced = false;
    std::FILE* const status = std::fopen("/proc/self/status", "re");
    if (!status)
        return false;
    char line[256];
    while (std::fgets(line, sizeof line, status)) {
        constexpr char key[] = "TracerPid:";
        if (std::strncmp(line, key, sizeof key - 1) == 0)
            traced = std::strtol(line + sizeof key - 1, nullptr, 10) != 0;
    }
    std::fclose(status);
    return traced;
}

} // namespace

KVUnitTestCase::~KVUnitTestCase() = default;

void _KVUnitTesting_SetCurrentCase(KVUnitTestCase* testCase)
{
    if (!onMainThread())
        _KVHandleLogAssertion(0, 0, __FILE__, __LINE__,
                              "_KVUnitTesting_SetCurrentCase called from a non-main thread");
    currentTestCase.exchange(testCase);
}

void _KVUnitTesting_HandleAssertionFailure(char const* file, unsigned int line,
                                           KVString const& message)
{
    KVUnitTestCase* const testCase = currentTestCase;
    if (testCase && testCase->recordFailure(file, line, message))
        return;
    KVString text;
    KVString const stack = kv::callStackText();
    text.sprintf(
        KVString("%@ (file: %s, line: %u) :: No Current Test Case - backtrace: %@").cf_str(),
        message.cf_str(), file, line, stack.cf_str());
    logText(text.toUTF8());
}

void _KVHandleLogAssertion(int isAssertion, int breakInDebugger, char const* file,
                           unsigned int line, char const* format, ...)
{
    std::va_list arguments;
    va_start(arguments, format);
    if (isAssertion && KVInfo_IsUnitTesting()) {
        KVString const message = kv::formatWithObjects(format, arguments);
        va_end(arguments);
        return _KVUnitTesting_HandleAssertionFailure(file, line, message);
    }
    _KVLogMessageInternal(file, line, format, arguments);
    va_end(arguments);
    if (breakInDebugger) {
        _KVPrintBacktrace();
        _KVBreakUnderDebugger(0);
    }
}

void _KVBreakUnderDebugger(int logStack)
{
    static bool const traced = isTraced();
    if (!traced)
        return;
    if (logStack)
        _KVPrintBacktrace();
    if (onMainThread()) {
        ::pthread_kill(::pthread_self(), SIGINT);
        return;
    }
    std::fputs("*** Attempting to break in the debugger on a thread which is not the main thread. "
               "Use the backtrace to find where the break attempt occurred as the thread is not "
               "paused at that location. ***",
               stderr);
    std::raise(SIGINT);
}

void _KVLogAssertionBreak() {}

void _KVShouldNotBeReached(char const* file, int line, char const* text)
{
    KVPrint("File %s, line %d should not have been reached:\n\t", file, line);
    KVPrint("%s", text);
    std::fflush(stdout);
    std::abort();
}
