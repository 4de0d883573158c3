#pragma once

#include <charconv>
#include <string>

/// The shortest decimal text that reads back as the same number.
template <class Number>
std::string shortest(Number value)
{
    char text[32];
    return {text, std::to_chars(text, text + sizeof text, value).ptr};
}
