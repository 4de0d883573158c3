#pragma once

#include <cstddef>

/// A run of UTF-16 units: `location` is the first one, `length` how many there are.
struct NSRange {
    std::size_t location;
    std::size_t length;

    friend constexpr bool operator==(NSRange const&, NSRange const&) = default;
};

constexpr NSRange NSMakeRange(std::size_t location, std::size_t length) noexcept
{
    return {location, length};
}

/// The first unit behind the range.
constexpr std::size_t NSMaxRange(NSRange range) noexcept
{
    return range.location + range.length;
}
