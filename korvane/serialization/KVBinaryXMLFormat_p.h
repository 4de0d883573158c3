#pragma once

#include <korvane/platform/CMTime.h>

#include <bit>
#include <cstddef>
#include <cstdint>
#include <cstring>

// The binary scene format, in short; docs/scene-binary.md tells it whole.
//
//     document   "VZBML 5.10" 0, then elements
//     element    token (varint), size (4 bytes), attribute count (varint), attributes, body
//     attribute  token (varint), tag, payload
//     body       tag and payload of values; tag 0 and an element for each child
//
// All numbers are little-endian.

namespace kv::binary {

/// The byte in front of a value.
enum Tag : std::uint8_t {
    childTag = 0,
    /// 8 to 15: an integer of `tag - 7` bytes.
    firstIntegerTag = 8,
    lastIntegerTag = 15,
    floatTag = 40,
    doubleTag = 41,
    uuidTag = 42,
    stringTag = 43,
    timeTag = 50,
    zeroTag = 128,
    oneTag = 129,
};

/// With it, an integer's tag is 24 to 31 and the bytes are the magnitude of a negative number.
inline constexpr unsigned int negativeBit = 16;

inline constexpr std::size_t headerLimit = 32;
inline constexpr unsigned int sizeFieldLength = 4;
inline constexpr char magic[] = "VZBML";

constexpr bool isIntegerTag(unsigned int tag) noexcept
{
    unsigned int const positive = tag & ~negativeBit;
    return positive >= firstIntegerTag && positive <= lastIntegerTag;
}

constexpr unsigned int integerLength(unsigned int tag) noexcept
{
    return (tag & ~negativeBit) - firstIntegerTag + 1;
}

/// The sizes of a time's fields, as its descriptor byte gives them.
struct TimeSizes {
    unsigned int value;
    unsigned int timescale;
    unsigned int flags;
    unsigned int epoch;

    static constexpr TimeSizes of(unsigned int descriptor) noexcept
    {
        return {1u << (descriptor & 3), (descriptor >> 2 & 3) + 1, (descriptor >> 4 & 3) + 1,
                1u << (descriptor >> 6 & 3)};
    }
    constexpr unsigned int sum() const noexcept { return value + timescale + flags + epoch; }
};

/// How many bytes a number needs; 1 for zero.
constexpr unsigned int byteLength(std::uint64_t value) noexcept
{
    return (64 - static_cast<unsigned int>(__builtin_clzll(value | 1)) + 7) / 8;
}

/// Whatever the length, 8 bytes must be readable.
inline std::uint64_t loadLittleEndian(unsigned char const* bytes, unsigned int length) noexcept
{
    std::uint64_t value;
    std::memcpy(&value, bytes, sizeof value);
    if constexpr (std::endian::native == std::endian::big)
        value = __builtin_bswap64(value);
    return length == 8 ? value : value & ((std::uint64_t{1} << 8 * length) - 1);
}

/// Writes `length` bytes and returns the place behind them. There must be room for 8.
inline unsigned char* storeLittleEndian(unsigned char* out, std::uint64_t value,
                                        unsigned int length) noexcept
{
    if constexpr (std::endian::native == std::endian::big)
        value = __builtin_bswap64(value);
    std::memcpy(out, &value, sizeof value);
    return out + length;
}

} // namespace kv::binary
