#pragma once

#include <korvane/platform/CMTime.h>

#include <stdexcept>
#include <string_view>

/// What is wrong with a text that should tell a time, and where: a byte offset in it.
class TimeSyntaxError : public std::runtime_error {
public:
    TimeSyntaxError(std::size_t offset, std::string const& what);
};

/// A time as it is written: "3", "3.52" (352/100, up to nine places), "1001/30000" without blanks,
/// each with a sign or without; "inf", "-inf", "indef", "inval". Throws TimeSyntaxError.
CMTime parseTime(std::string_view text);

/// Calculates with times, exactly where that can be: + - * / and parentheses, blanks between them.
/// "1001/30000" is one number, "1001 / 30000" a division. The rounded bit stays on from either
/// operand. Throws TimeSyntaxError.
CMTime evaluateTime(std::string_view expression);
