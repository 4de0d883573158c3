#pragma once

#include <bit>
#include <cstddef>
#include <cstdint>
#include <cstring>

// Text eight bytes at a time, within plain 64-bit words.

namespace cc {

inline constexpr std::size_t kWordSize = sizeof(std::uint64_t);

/// The eight bytes from `text` on, the first one lowest.
inline std::uint64_t wordAt(char const* text) noexcept
{
    std::uint64_t word;
    std::memcpy(&word, text, kWordSize);
    if constexpr (std::endian::native == std::endian::big)
        word = __builtin_bswap64(word);
    return word;
}

/// The same byte eight times.
constexpr std::uint64_t repeated(unsigned char byte) noexcept
{
    return 0x0101010101010101u * byte;
}

/// The number of bytes in front of the first one whose top bit is set, 8 if none is.
inline std::size_t bytesBefore(std::uint64_t topBits) noexcept
{
    return static_cast<std::size_t>(std::countr_zero(topBits & repeated(0x80))) / 8;
}

/// The top bit of the first byte that is 0, maybe of some behind it, and of none in front of it.
constexpr std::uint64_t zeroBytes(std::uint64_t word) noexcept
{
    return (word - repeated(1)) & ~word;
}

/// The number of decimal digits at the start, 0 to 8.
inline std::size_t leadingDigits(std::uint64_t word) noexcept
{
    // Digits become 0 to 9, which 0x76 leaves below the top bit.
    std::uint64_t const values = word ^ repeated('0');
    return bytesBefore(values | (values + repeated(0x76)));
}

/// The number that the first `count` bytes, 0 to 8 digits, stand for.
inline std::uint64_t digitsValue(std::uint64_t word, std::size_t count) noexcept
{
    if (count == 0)
        return 0;
    // Zeros come in front of the digits; then two, four and eight of them become one number.
    std::uint64_t values = (word ^ repeated('0')) << (8 * (kWordSize - count));
    values = (values * 10 + (values >> 8)) & 0x00FF00FF00FF00FFu;
    values = (values * 100 + (values >> 16)) & 0x0000FFFF0000FFFFu;
    return (values * 10000 + (values >> 32)) & 0xFFFFFFFFu;
}

} // namespace cc
