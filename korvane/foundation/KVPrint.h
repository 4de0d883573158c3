#pragma once

#include <korvane/foundation/KVString.h>

#include <cstdarg>
#include <cstddef>

// Diagnostics. KVPrint speaks to whoever runs the program; the log speaks to the
// system, and its latest line is kept where a crash report would find it. All may
// be called from any thread.

/// Prints to standard output. If the environment variable `kvPrintUseLogFile` is set (to anything)
/// at the first call of the process, all goes to the file "/tmp/output.<pid>.log" instead, flushed
/// after each message; while that file cannot be opened, messages are dropped.
KV_EXPORT void KVPrint(char const* format, ...) KV_PRINTF(1, 2);
/// The same for arguments that are at hand as a list.
KV_EXPORT void KVPrintVA(char const* format, std::va_list arguments);
/// Prints two blanks for each level of `depth`, then the message.
KV_EXPORT void KVPrintIndent(unsigned int depth, char const* format, ...) KV_PRINTF(2, 3);
/// Entry points kept for hosts that call them; they do nothing.
KV_EXPORT void KVPrintStack();
KV_EXPORT void KVPrintStackStart();
KV_EXPORT void KVPrintStackStop();

/// Logs one line. A message of up to 1022 bytes is followed by " (file: %s, line: %u)", as far as
/// 1023 bytes reach. Allocates nothing.
KV_EXPORT void _KVLogMessage(char const* file, unsigned int line, char const* format, ...)
    KV_PRINTF(3, 4);
/// The same for arguments that are at hand as a list.
KV_EXPORT void _KVLogMessageInternal(char const* file, unsigned int line, char const* format,
                                     std::va_list arguments);
/// Logs a text with "%@" for objects, as `KVString::sprintf` forms it; a null format does nothing.
KV_EXPORT void _KVNSLog(CFStringRef format, ...);
/// Logs the symbols of the calling thread's stack.
KV_EXPORT void _KVPrintBacktrace();

/// Where log lines go: by default to standard error, a line each. The line is not terminated by a
/// newline. Null restores the default. The sink may be called from any thread.
using KVLogSink = void (*)(char const* line, std::size_t length);
KV_EXPORT void KVSetLogSink(KVLogSink sink) noexcept;

/// Keeps `text` behind the prefix "Last Korvane Log: " in a static buffer of 1124 bytes, in place
/// of the text before. Allocates nothing. Of two threads that log at once the texts may mix there.
KV_EXPORT void _KVSetCrashReporterMessage(char const* text);
/// That buffer, zero-terminated, for crash handlers.
extern "C" KV_EXPORT char const* KVCrashReporterBuffer() noexcept;

/// Reports a failed assertion or an unexpected state and returns: under unit tests an assertion is
/// given to the test case that is running, all else is logged. With `breakInDebugger` the stack is
/// logged as well and an attached debugger is stopped.
KV_EXPORT void _KVHandleLogAssertion(int isAssertion, int breakInDebugger, char const* file,
                                     unsigned int line, char const* format, ...) KV_PRINTF(5, 6);
/// Raises SIGINT if a debugger was attached when this was first asked; otherwise does nothing.
KV_EXPORT void _KVBreakUnderDebugger(int logStack);
/// Empty: a place for a breakpoint.
KV_EXPORT void _KVLogAssertionBreak();

/// A running test case of the host's test framework.
class KV_EXPORT KVUnitTestCase {
public:
    virtual ~KVUnitTestCase();
    /// Records a failure; false if it cannot, and the failure is logged instead.
    virtual bool recordFailure(char const* file, unsigned int line, KVString const& message) = 0;
};

/// Sets the test case that is running, null for none; call it on the main thread. Not owned.
KV_EXPORT void _KVUnitTesting_SetCurrentCase(KVUnitTestCase* testCase);
/// Gives a failure to the test case that is running; logs it where there is none.
KV_EXPORT void _KVUnitTesting_HandleAssertionFailure(char const* file, unsigned int line,
                                                     KVString const& message);

/// Prints "File %s, line %d should not have been reached:\n\t" and `text`, and aborts the process.
[[noreturn]] KV_EXPORT void _KVShouldNotBeReached(char const* file, int line, char const* text);
