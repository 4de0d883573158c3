#pragma once

#include <cstddef>
#include <string>
#include <string_view>

/// A file that appears whole or not at all.
///
///     AtomicOutput output(path);          // "-" is standard output
///     output.write("first line\n");
///     output.commit();
///
/// The bytes go to a temporary file beside the target, which `commit` flushes to the disk and
/// gives its final name, with the mode of the file that it replaces. Without `commit`, and
/// when a signal ends the tool, the temporary file is removed and the target is untouched.
/// Standard output and what is no regular file (a pipe, /dev/full) are written directly.
///
/// Every failure is a ToolError with code 4 and the target's path. One output at a time is
/// removed on a signal: the last one made.
class AtomicOutput {
public:
    explicit AtomicOutput(std::string path);
    AtomicOutput(AtomicOutput const&) = delete;
    AtomicOutput& operator=(AtomicOutput const&) = delete;
    ~AtomicOutput();

    void write(void const* bytes, std::size_t size);
    void write(std::string_view text) { write(text.data(), text.size()); }

    /// Where library code that opens files by name is to write, instead of `write`: the
    /// temporary file. Throws where the bytes go out directly, as to standard output.
    std::string const& temporaryPath() const;

    /// Where library code that has a descriptor to write to is to write, instead of `write`. It
    /// leaves it open; what it fails with is for `fail`.
    int descriptor() const noexcept { return fd_; }
    /// Gives the output up and throws, with what the system says about `error`, an `errno` value.
    [[noreturn]] void fail(int error);

    /// Writes what is still held back and makes the target whole. Nothing is written after.
    void commit();

private:
    void flush();
    void discard() noexcept;

    std::string path_;      // as given, for messages
    std::string target_;    // with symbolic links followed
    std::string temporary_; // empty: written directly
    std::string buffer_;
    int fd_ = -1;
};

/// Standard output with every write checked; code 4 where it is closed or full.
void printOutput(std::string_view text);

/// Lets SIGINT, SIGTERM and SIGHUP remove a temporary file before they end the tool, turns
/// SIGPIPE into a failed write, and keeps descriptors 0 to 2 taken, so that no file is opened
/// in the place of a closed standard output. Called once by `main`.
void prepareProcess();
