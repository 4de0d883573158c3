#pragma once

#include <string>

/// All bytes of a file, or of standard input where `path` is "-". Throws ToolError with
/// code 4 and the path for what is missing, a directory or not readable; an empty file
/// gives an empty string.
std::string readFile(std::string const& path);

/// Throws what `readFile` would for a file that cannot be opened, without reading it: for
/// commands that hand the path to the library.
void checkReadable(std::string const& path);
