#include "ToolError.h"

#include <iostream>
#include <system_error>

namespace {

std::string nameOf(std::string_view path)
{
    return path == "-" ? "standard input" : std::string(path);
}

} // namespace

ToolError badInput(std::string_view path, std::string_view text)
{
    return {ExitCode::BadInput, nameOf(path).append(": ").append(text)};
}

ToolError badInput(std::string_view path, unsigned long line, std::string_view text)
{
    return {ExitCode::BadInput,
            nameOf(path).append(":").append(std::to_string(line)).append(": ").append(text)};
}

ToolError inputOutput(std::string_view path, std::string_view text)
{
    return {ExitCode::InputOutput, nameOf(path).append(": ").append(text)};
}

ToolError inputOutput(std::string_view path, int error)
{
    return inputOutput(path, std::generic_category().message(error));
}

void printMessage(std::string_view message)
{
    std::cerr << "korvane: " << message << '\n';
}
