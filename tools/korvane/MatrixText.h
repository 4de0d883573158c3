#pragma once

#include <korvane/numerics/KVMatrix44Double.h>

#include <string>
#include <string_view>
#include <vector>

using Matrix = KVMatrix44Tmpl<double>;

/// The order of the angles: about z, then x, then y, as extendedDescription tells them.
inline constexpr int rotationOrder = 4;

/// Sixteen numbers, row by row, from the text of a file. They stand apart by blanks, line ends,
/// commas, semicolons or brackets, so that a matrix that was printed can be read again. Throws
/// ToolError with code 3, the line and the number that is wrong; `path` is for messages.
Matrix readMatrix(std::string const& path, std::string_view text);
/// The same from numbers that stand alone.
Matrix matrixOf(std::vector<std::string> const& words);
