#pragma once

#include <filesystem>
#include <string>
#include <string_view>
#include <vector>

/// How a run of the tool went.
struct ToolResult {
    int exitCode = -1; ///< as the shell would tell it: 128 and the signal's number for a signal
    std::string out;
    std::string messages;
};

/// Runs the built `korvane` with these arguments and this standard input, to its end. A run that
/// takes longer than a minute is killed.
ToolResult runTool(std::vector<std::string> const& arguments, std::string_view input = {});

/// Runs a shell line in which "$KORVANE" is the built tool, for redirections and pipes.
ToolResult runShell(std::string const& line);

/// A folder of its own, gone with the object.
class ScratchFolder {
public:
    ScratchFolder();
    ScratchFolder(ScratchFolder const&) = delete;
    ScratchFolder& operator=(ScratchFolder const&) = delete;
    ~ScratchFolder();

    std::string path(std::string const& name) const { return (folder_ / name).string(); }
    /// Makes a file with these bytes and gives its path.
    std::string write(std::string const& name, std::string_view bytes) const;
    std::string read(std::string const& name) const;
    /// The names of the files in it, sorted.
    std::vector<std::string> names() const;

private:
    std::filesystem::path folder_;
};
