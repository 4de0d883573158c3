#pragma once

#include <string>
#include <string_view>

/// Text from anywhere as the content of HTML, SVG and XML elements and of their quoted attributes.
/// What is no UTF-8 becomes U+FFFD; control characters become their pictures (U+2400 on), but for
/// the line end.
std::string escaped(std::string_view text);

/// The first characters of a text, and "…" where there are more than `most`. Cuts what is no UTF-8
/// anywhere.
std::string clipped(std::string_view text, std::size_t most);

/// A number with at most so many decimals, without zeros at its end: "12.5".
std::string decimal(double value, int digits = 2);
