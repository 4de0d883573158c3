#pragma once

#include <support/TemporaryFolder.h>

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

using ScratchFolder = TemporaryFolder;
