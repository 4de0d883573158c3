#pragma once

#include <concepts>
#include <limits>

/// A floating-point number as an integer, cut toward zero: NaN gives 0, what is out of range the
/// nearest end of it.
template <std::integral To, std::floating_point From>
constexpr To kvSaturatingCast(From value) noexcept
{
    using Limits = std::numeric_limits<To>;
    // The first power of two above the range: exact in any floating-point type, unlike the maximum.
    constexpr From end = static_cast<From>(Limits::max() / 2 + 1) * 2;
    if (value != value)
        return 0;
    if (value >= end)
        return Limits::max();
    if (value < (Limits::is_signed ? -end : From(0)))
        return Limits::min();
    return static_cast<To>(value);
}
