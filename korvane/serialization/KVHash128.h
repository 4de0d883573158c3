#pragma once

#include <korvane/foundation/KVString.h>

#include <compare>
#include <cstdint>
#include <iosfwd>

/// The four words of a hash as a plain record, for functions that pass it by value.
struct KVHash128State {
    std::uint32_t words[4] = {0, 0, 0, 0};
};

/// A 128-bit fingerprint, and the running state that makes it. All words zero means not started.
///
///     KVHash128 hash;
///     hash.addData(bytes, 4096);
///     hash += partHash;
///     hash.getString();                 // 32 hexadecimal digits
///
/// The compression function and the initial words are those of MD5 (RFC 1321, 3.3 and 3.4), but
/// the padding is its own: results are not MD5 digests (see KVMD5 for those). Fingerprints are
/// stored and compared, so the same calls give the same words in every version. It tells values
/// apart and is no protection against forgery.
class KV_EXPORT KVHash128 : public KVHash128State {
public:
    constexpr KVHash128() noexcept = default;
    constexpr KVHash128(KVHash128State const& state) noexcept : KVHash128State(state) {}
    constexpr KVHash128(unsigned int word0, unsigned int word1, unsigned int word2,
                        unsigned int word3) noexcept
        : KVHash128State{{word0, word1, word2, word3}}
    {}
    /// Not started, then `addData`.
    KVHash128(unsigned char const* data, unsigned int length) noexcept { addData(data, length); }
    /// From the first 32 characters, hexadecimal digits of either case, eight a word; what follows
    /// is not looked at. Any other character, or a shorter text, gives all zero.
    explicit KVHash128(KVString const& text) noexcept;

    /// Loads the initial words if the hash is not started (also for a length of 0), then folds in
    /// blocks of 64 bytes. What remains is closed at once with a byte 0x80 and zeros, without a
    /// length: the result depends on how the data is cut into calls, and only lengths that are a
    /// multiple of 64 join.
    void addData(unsigned char const* data, unsigned int length) noexcept;
    /// One round of the compression function over 16 words. Does not load the initial words.
    void transform(unsigned int const* block) noexcept;
    /// Folds another hash in. Not commutative; a hash that is not started begins from the initial
    /// words, so the result is no copy of `other`.
    KVHash128& operator+=(KVHash128 const& other) noexcept;

    /// The words in order, eight lower-case hexadecimal digits each.
    KVString getString() const;
};

/// -1, 0 or 1: by the words as unsigned numbers, the first one deciding first.
constexpr int KVHash128Compare(KVHash128State const& a, KVHash128State const& b) noexcept
{
    for (int i = 0; i < 4; ++i)
        if (a.words[i] != b.words[i])
            return a.words[i] < b.words[i] ? -1 : 1;
    return 0;
}

constexpr int compare(KVHash128 const& a, KVHash128 const& b) noexcept
{
    return KVHash128Compare(a, b);
}

constexpr bool operator==(KVHash128State const& a, KVHash128State const& b) noexcept
{
    return KVHash128Compare(a, b) == 0;
}

constexpr std::strong_ordering operator<=>(KVHash128State const& a,
                                           KVHash128State const& b) noexcept
{
    return KVHash128Compare(a, b) <=> 0;
}

/// The text of `getString`, the stream's flags untouched.
KV_EXPORT std::ostream& operator<<(std::ostream&, KVHash128 const&);

/// The text of `getString` as a `malloc`ed C string, which the caller frees. Null gives null.
KV_EXPORT char* KVHash128CreateCString(KVHash128State const* hash);
/// A copy of `a` with `b` folded in.
KV_EXPORT KVHash128State KVHash128Add(KVHash128State a, KVHash128State b) noexcept;

/// Keys for hash tables: the words, or pairs of them with the first one on top, joined by exclusive
/// or.
constexpr std::uint32_t KVHash128Aligned32(KVHash128State hash) noexcept
{
    return hash.words[0] ^ hash.words[1] ^ hash.words[2] ^ hash.words[3];
}
constexpr std::uint64_t KVHash128Aligned64(KVHash128State hash) noexcept
{
    return ((static_cast<std::uint64_t>(hash.words[0]) << 32) | hash.words[1]) ^
           ((static_cast<std::uint64_t>(hash.words[2]) << 32) | hash.words[3]);
}
/// The key of the machine's word size, which is 64 bits.
constexpr std::uint64_t KVHash128AlignedLocal(KVHash128State hash) noexcept
{
    return KVHash128Aligned64(hash);
}
