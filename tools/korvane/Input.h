#pragma once

#include <string>

/// All bytes of a file, or of standard input where `path` is "-". Throws ToolError with
/// code 4 and the path for what is missing, a directory or not readable; an empty file
/// gives an empty string.
std::string readFile(std::string const& path);

/// A file under a name that the library can open, and seek in, again and again. Standard input and
/// pipes are read to their end and kept in memory under such a name; so is a file open whose own
/// name is not UTF-8, which the library does not take. Throws what `readFile` would.
class ReopenableFile {
public:
    explicit ReopenableFile(std::string const& path);
    ReopenableFile(ReopenableFile const&) = delete;
    ReopenableFile& operator=(ReopenableFile const&) = delete;
    ~ReopenableFile();

    /// As it was given, for messages.
    std::string const& shown() const noexcept { return shown_; }
    /// To open it by; holds as long as this lives.
    std::string const& path() const noexcept { return path_; }
    /// Whether that is another name than the one that was given.
    bool isRenamed() const noexcept { return fd_ >= 0; }

private:
    std::string shown_;
    std::string path_;
    int fd_ = -1;
};

/// Keeps what the library prints on standard error from there as long as this lives, for calls
/// whose failures the tool tells in its own words.
class QuietLibrary {
public:
    QuietLibrary();
    QuietLibrary(QuietLibrary const&) = delete;
    QuietLibrary& operator=(QuietLibrary const&) = delete;
    ~QuietLibrary();

private:
    int standardError_;
};
