#pragma once

#include <cstddef>
#include <cstdint>

// Big-endian numbers in memory, and the one reader of atom headers.

/// The number in the `count` (at most 8) bytes at `bytes`.
inline std::uint64_t readBigEndian(std::uint8_t const* bytes, int count) noexcept
{
    std::uint64_t value = 0;
    for (int i = 0; i < count; ++i)
        value = value << 8 | bytes[i];
    return value;
}

/// Writes the low `count` bytes of `value`.
inline void writeBigEndian(std::uint8_t* bytes, int count, std::uint64_t value) noexcept
{
    for (int i = count - 1; i >= 0; --i, value >>= 8)
        bytes[i] = static_cast<std::uint8_t>(value);
}

/// The most children that are read of one atom; a file could hold one in every 8 bytes.
inline constexpr int kMostChildAtoms = 1 << 22;

struct AtomHeader {
    unsigned int type = 0;
    std::uint64_t size = 0;
    std::uint64_t payloadSize = 0;
};

/// Reads the header of an atom in a parent with `available` bytes left (ISO/IEC 14496-12, 4.2).
/// `read` fills the eight bytes that it is given with the next ones of the source and answers 0 or
/// a code. Answers 0, the code of the first read, or -1 for a size that the parent can not hold or
/// that does not hold its own header.
template <class Read>
int readAtomHeader(Read read, std::uint64_t available, AtomHeader& header)
{
    std::uint8_t bytes[8];
    if (available < 8)
        return -1;
    if (int const code = read(bytes))
        return code;
    auto const size = static_cast<std::uint32_t>(readBigEndian(bytes, 4));
    header.type = static_cast<unsigned int>(readBigEndian(bytes + 4, 4));
    switch (size) {
    case 0:
        header.size = available;
        header.payloadSize = available - 8;
        break;
    case 1:
        if (available < 16 || read(bytes) != 0)
            return -1;
        header.size = readBigEndian(bytes, 8);
        // Below 16 this wraps to above the size, which the last test refuses.
        header.payloadSize = header.size - 16;
        break;
    default:
        header.size = size;
        header.payloadSize = size < 8 ? size : size - 8;
        break;
    }
    return header.size <= available && header.size > header.payloadSize ? 0 : -1;
}
