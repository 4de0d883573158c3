#pragma once

#include <korvane/korvane.h>

#include <string>

namespace CLI {
class App;
}

// What the commands that write a movie have in common.

struct RewriteOptions {
    std::string input, output;
    bool dryRun = false;
    bool noVerify = false;
    bool json = false;
};

void addRewriteOptions(CLI::App& command, RewriteOptions& options);

/// Throws ToolError when the output is the input, by whatever name.
void checkPaths(RewriteOptions const& options);

/// Throws ToolError when a sample description of the track does not come out of the library as it
/// went in: bytes would be lost.
void checkDescriptions(KVAtomBoxFile& file, KVAtomBox const& track, std::string const& path);

/// Writes what the tree of `file` holds, if that is safe, compares the samples and gives the output
/// its name; or only prints the plan. Throws ToolError, and then nothing has been written.
void rewrite(KVAtomBoxFile& file, RewriteOptions const& options);
