#pragma once

#include <string>

/// All bytes of a file, or of standard input where `path` is "-". Throws ToolError with
/// code 4 and the path for what is missing, a directory or not readable; an empty file
/// gives an empty string.
std::string readFile(std::string const& path);

/// Throws what `readFile` would for a file that cannot be opened, without reading it: for
/// commands that hand the path to the library.
void checkReadable(std::string const& path);

/// A file under a name that can be opened, and sought in, again and again. Standard input is read
/// to its end and kept in memory under such a name. Throws what `readFile` would.
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
    bool isStandardInput() const noexcept { return fd_ >= 0; }

private:
    std::string shown_;
    std::string path_;
    int fd_ = -1;
};
