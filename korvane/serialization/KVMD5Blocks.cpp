#include <korvane/serialization/KVMD5Blocks_p.h>

#include <bit>
#include <cstring>
#include <utility>

namespace kv {
namespace {

/// 2^32 times the absolute value of the sine of 1 to 64 radians, cut to an integer.
constexpr std::uint32_t sines[64] = {
    0xd76aa478u, 0xe8c7b756u, 0x242070dbu, 0xc1bdceeeu, 0xf57c0fafu, 0x4787c62au, 0xa8304613u,
    0xfd469501u, 0x698098d8u, 0x8b44f7afu, 0xffff5bb1u, 0x895cd7beu, 0x6b901122u, 0xfd987193u,
    0xa679438eu, 0x49b40821u, 0xf61e2562u, 0xc040b340u, 0x265e5a51u, 0xe9b6c7aau, 0xd62f105du,
    0x02441453u, 0xd8a1e681u, 0xe7d3fbc8u, 0x21e1cde6u, 0xc33707d6u, 0xf4d50d87u, 0x455a14edu,
    0xa9e3e905u, 0xfcefa3f8u, 0x676f02d9u, 0x8d2a4c8au, 0xfffa3942u, 0x8771f681u, 0x6d9d6122u,
    0xfde5380cu, 0xa4beea44u, 0x4bdecfa9u, 0xf6bb4b60u, 0xbebfbc70u, 0x289b7ec6u, 0xeaa127fau,
    0xd4ef3085u, 0x04881d05u, 0xd9d4d039u, 0xe6db99e5u, 0x1fa27cf8u, 0xc4ac5665u, 0xf4292244u,
    0x432aff97u, 0xab9423a7u, 0xfc93a039u, 0x655b59c3u, 0x8f0ccc92u, 0xffeff47du, 0x85845dd1u,
    0x6fa87e4fu, 0xfe2ce6e0u, 0xa3014314u, 0x4e0811a1u, 0xf7537e82u, 0xbd3af235u, 0x2ad7d2bbu,
    0xeb86d391u,
};

constexpr int shifts[4][4] = {{7, 12, 17, 22}, {5, 9, 14, 20}, {4, 11, 16, 23}, {6, 10, 15, 21}};

constexpr unsigned wordOfStep(unsigned step) noexcept
{
    unsigned const word[4] = {step, 5 * step + 1, 3 * step + 5, 7 * step};
    return word[step / 16] % 16;
}

/// Each step waits for the one before it through `b` alone, so the sum of all else is formed first
/// and what takes `b` is added last. clang would reorder the sums and so lengthen the chain by a
/// fifth; an empty statement that it cannot see through keeps them apart.
[[gnu::always_inline]] inline void formedBefore(std::uint32_t& sum) noexcept
{
#if defined(__GNUC__)
    __asm__("" : "+r"(sum));
#else
    static_cast<void>(sum);
#endif
}

template <unsigned Step, class Words>
[[gnu::always_inline]] inline void step(std::uint32_t& a, std::uint32_t b, std::uint32_t c,
                                        std::uint32_t d, Words words) noexcept
{
    constexpr unsigned round = Step / 16;
    a += words(wordOfStep(Step)) + sines[Step];
    if constexpr (round == 0) {
        formedBefore(a);
        a += d ^ (b & (c ^ d));
    } else if constexpr (round == 1) {
        // (b & d) | (c & ~d): the two halves share no bit, so they may be added one by one.
        a += c & ~d;
        formedBefore(a);
        a += b & d;
    } else if constexpr (round == 2) {
        formedBefore(a);
        a += b ^ (c ^ d);
    } else {
        formedBefore(a);
        a += c ^ (b | ~d);
    }
    a = std::rotl(a, shifts[round][Step % 4]) + b;
}

template <class Words, std::size_t... Four>
[[gnu::always_inline]] inline void allSteps(std::uint32_t (&s)[4], Words words,
                                            std::index_sequence<Four...>) noexcept
{
    std::uint32_t a = s[0], b = s[1], c = s[2], d = s[3];
    ((step<4 * Four>(a, b, c, d, words), step<4 * Four + 1>(d, a, b, c, words),
      step<4 * Four + 2>(c, d, a, b, words), step<4 * Four + 3>(b, c, d, a, words)),
     ...);
    s[0] += a;
    s[1] += b;
    s[2] += c;
    s[3] += d;
}

std::uint32_t littleEndian(unsigned char const* bytes) noexcept
{
    std::uint32_t word;
    std::memcpy(&word, bytes, sizeof word);
    return std::endian::native == std::endian::little ? word : __builtin_bswap32(word);
}

} // namespace

void md5Block(std::uint32_t (&state)[4], std::uint32_t const (&words)[16]) noexcept
{
    allSteps(
        state, [&](unsigned i) { return words[i]; }, std::make_index_sequence<16>());
}

void md5Blocks(std::uint32_t (&state)[4], unsigned char const* data, std::size_t count) noexcept
{
    std::uint32_t s[4] = {state[0], state[1], state[2], state[3]};
    for (; count > 0; --count, data += 64)
        allSteps(
            s, [data](unsigned i) { return littleEndian(data + 4 * i); },
            std::make_index_sequence<16>());
    std::memcpy(state, s, sizeof s);
}

} // namespace kv
