#include "MatrixText.h"

#include "ToolError.h"

#include <algorithm>
#include <charconv>
#include <cmath>

namespace {

/// Stores the number that has `index` others before it; else says what is wrong with it.
std::string store(std::string_view word, std::size_t index, Matrix& matrix)
{
    std::string const which = "number " + std::to_string(index + 1);
    std::string const shown = " \"" + std::string(word.substr(0, 40)) + "\" ";
    if (index > 15)
        return which + shown + "is one too many: a matrix has sixteen";
    std::string_view const digits = word.substr(word.starts_with('+') ? 1 : 0);
    double value = 0;
    auto const [end, error] = std::from_chars(digits.data(), digits.data() + digits.size(), value);
    if (error == std::errc::invalid_argument || end != digits.data() + digits.size())
        return which + shown + "is not a number";
    if (error != std::errc() || !std::isfinite(value))
        return which + shown + "is out of range";
    matrix.data()[index] = value;
    return {};
}

std::string missing(std::size_t count)
{
    if (count >= 16)
        return {};
    return "number " + std::to_string(count + 1) + " is missing: a matrix has sixteen, here are " +
           std::to_string(count);
}

} // namespace

Matrix readMatrix(std::string const& path, std::string_view text)
{
    constexpr char separators[] = " \t\r\n,;()[]";
    Matrix matrix;
    std::size_t count = 0;
    unsigned long line = 1;
    std::size_t end = 0;
    for (;;) {
        std::size_t const start = std::min(text.find_first_not_of(separators, end), text.size());
        line +=
            static_cast<unsigned long>(std::count(text.data() + end, text.data() + start, '\n'));
        if (start == text.size())
            break;
        end = std::min(text.find_first_of(separators, start), text.size());
        if (std::string const fault = store(text.substr(start, end - start), count++, matrix);
            !fault.empty())
            throw badInput(path, line, fault);
    }
    if (std::string const fault = missing(count); !fault.empty())
        throw badInput(path, line, fault);
    return matrix;
}

Matrix matrixOf(std::vector<std::string> const& words)
{
    Matrix matrix;
    for (std::size_t i = 0; i < words.size(); ++i)
        if (std::string const fault = store(words[i], i, matrix); !fault.empty())
            throw ToolError(ExitCode::BadInput, fault);
    if (std::string const fault = missing(words.size()); !fault.empty())
        throw ToolError(ExitCode::BadInput, fault);
    return matrix;
}
