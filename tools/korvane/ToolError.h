#pragma once

#include <stdexcept>
#include <string>
#include <string_view>

/// How the tool ends. `korvane --help` and the manual page tell them in the same words.
enum class ExitCode : int {
    Done = 0,
    Failed = 1,      ///< the work was done and its answer is no
    Usage = 2,       ///< the command line is wrong
    BadInput = 3,    ///< a file was read and is not what it should be
    InputOutput = 4, ///< a file could not be read or written
};

/// Ends a command with a message and an exit code. The message reads
/// `PATH:LINE: text`, `PATH: text` or `text`; `main` prints it behind `korvane: `.
class ToolError : public std::runtime_error {
public:
    ToolError(ExitCode code, std::string const& message) : std::runtime_error(message), code_(code)
    {}

    ExitCode code() const noexcept { return code_; }

private:
    ExitCode code_;
};

/// What messages call an input: "standard input" for "-", else its path.
std::string inputName(std::string_view path);

/// Code 3, `PATH: text`.
ToolError badInput(std::string_view path, std::string_view text);
/// Code 3, `PATH:LINE: text`; lines count from 1.
ToolError badInput(std::string_view path, unsigned long line, std::string_view text);
/// Code 4, `PATH: text`.
ToolError inputOutput(std::string_view path, std::string_view text);
/// Code 4, `PATH: ` and what the system says about `error`, an `errno` value.
ToolError inputOutput(std::string_view path, int error);

/// A text from a file, or a file's name, in one line: "?" for each control character.
std::string inOneLine(std::string_view text);

/// A message on standard error, in one line behind `korvane: `.
void printMessage(std::string_view message);
