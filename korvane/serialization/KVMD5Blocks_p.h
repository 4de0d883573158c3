#pragma once

#include <cstddef>
#include <cstdint>

namespace kv {

/// The state before the first block (RFC 1321, 3.3).
inline constexpr std::uint32_t md5InitialWords[4] = {0x67452301u, 0xEFCDAB89u, 0x98BADCFEu,
                                                     0x10325476u};

/// The compression function (RFC 1321, 3.4) over `count` blocks of 64 bytes, words little-endian,
/// at any address.
void md5Blocks(std::uint32_t (&state)[4], unsigned char const* data, std::size_t count) noexcept;

/// The same over 16 words.
void md5Block(std::uint32_t (&state)[4], std::uint32_t const (&words)[16]) noexcept;

} // namespace kv
