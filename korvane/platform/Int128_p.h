#pragma once

#include <cstdint>

namespace kv {

__extension__ typedef __int128 int128;
__extension__ typedef unsigned __int128 uint128;

/// |x|, also of the lowest number, whose magnitude has no signed form.
constexpr std::uint64_t magnitude(std::int64_t x) noexcept
{
    return x < 0 ? 0 - static_cast<std::uint64_t>(x) : static_cast<std::uint64_t>(x);
}

/// The number of that sign and magnitude, which fits.
constexpr std::int64_t withSign(bool negative, std::uint64_t magnitude) noexcept
{
    return static_cast<std::int64_t>(negative ? 0 - magnitude : magnitude);
}

/// The largest magnitude that a signed 64-bit number of that sign can have.
constexpr std::uint64_t greatestMagnitude(bool negative) noexcept
{
    return static_cast<std::uint64_t>(INT64_MAX) + (negative ? 1 : 0);
}

/// a / b toward zero; the one quotient that does not fit, of the lowest number by -1, becomes the
/// highest. `b` is not 0.
constexpr std::int64_t quotient(std::int64_t a, std::int64_t b) noexcept
{
    return b == -1 && a == INT64_MIN ? INT64_MAX : a / b;
}

} // namespace kv
