#include "ToolError.h"

#include <algorithm>
#include <iostream>
#include <system_error>

std::string inputName(std::string_view path)
{
    return path == "-" ? "standard input" : std::string(path);
}

ToolError badInput(std::string_view path, std::string_view text)
{
    return {ExitCode::BadInput, inputName(path).append(": ").append(text)};
}

ToolError badInput(std::string_view path, unsigned long line, std::string_view text)
{
    return {ExitCode::BadInput,
            inputName(path).append(":").append(std::to_string(line)).append(": ").append(text)};
}

ToolError inputOutput(std::string_view path, std::string_view text)
{
    return {ExitCode::InputOutput, inputName(path).append(": ").append(text)};
}

ToolError inputOutput(std::string_view path, int error)
{
    return inputOutput(path, std::generic_category().message(error));
}

std::string inOneLine(std::string_view text)
{
    std::string line(text);
    std::replace_if(
        line.begin(), line.end(),
        [](char c) { return static_cast<unsigned char>(c) < ' ' || c == '\x7F'; }, '?');
    return line;
}

void printMessage(std::string_view message)
{
    std::cerr << "korvane: " << inOneLine(message) << '\n';
}
