#include <korvane/serialization/KVHash128.h>

#include <korvane/serialization/KVMD5Blocks_p.h>

#include <algorithm>
#include <cstdlib>
#include <cstring>
#include <ostream>

namespace {

constexpr std::size_t digitCount = 32;

void formDigits(KVHash128State const& hash, char* out) noexcept
{
    for (auto word : hash.words)
        for (int shift = 28; shift >= 0; shift -= 4)
            *out++ = "0123456789abcdef"[(word >> shift) & 15];
}

int digitValue(char16_t unit) noexcept
{
    if (unit >= '0' && unit <= '9')
        return unit - '0';
    unit |= 0x20;
    return unit >= 'a' && unit <= 'f' ? unit - 'a' + 10 : -1;
}

void startIfNeeded(KVHash128State& hash) noexcept
{
    if (hash == KVHash128State())
        std::copy(std::begin(kv::md5InitialWords), std::end(kv::md5InitialWords), hash.words);
}

} // namespace

KVHash128::KVHash128(KVString const& text) noexcept
{
    auto const units = text.view();
    if (units.size() < digitCount)
        return;
    KVHash128State parsed;
    for (std::size_t i = 0; i < digitCount; ++i) {
        int const digit = digitValue(units[i]);
        if (digit < 0)
            return;
        auto& word = parsed.words[i / 8];
        word = word << 4 | static_cast<std::uint32_t>(digit);
    }
    *this = parsed;
}

void KVHash128::addData(unsigned char const* data, unsigned int length) noexcept
{
    startIfNeeded(*this);
    kv::md5Blocks(words, data, length / 64);
    unsigned int const rest = length % 64;
    if (rest == 0)
        return;
    unsigned char last[64] = {};
    std::memcpy(last, data + (length - rest), rest);
    last[rest] = 0x80;
    kv::md5Blocks(words, last, 1);
}

void KVHash128::transform(unsigned int const* block) noexcept
{
    std::uint32_t copy[16];
    std::memcpy(copy, block, sizeof copy);
    kv::md5Block(words, copy);
}

KVHash128& KVHash128::operator+=(KVHash128 const& other) noexcept
{
    startIfNeeded(*this);
    // Behind the four words stands a whole word with its top bit set, not the byte 0x80 of addData.
    unsigned int const block[16] = {other.words[0], other.words[1], other.words[2], other.words[3],
                                    0x80000000u};
    transform(block);
    return *this;
}

KVString KVHash128::getString() const
{
    char digits[digitCount];
    formDigits(*this, digits);
    return KVString::fromUTF8({digits, digitCount});
}

std::ostream& operator<<(std::ostream& stream, KVHash128 const& hash)
{
    char digits[digitCount];
    formDigits(hash, digits);
    return stream.write(digits, digitCount);
}

char* KVHash128CreateCString(KVHash128State const* hash)
{
    auto* text = hash ? static_cast<char*>(std::malloc(digitCount + 1)) : nullptr;
    if (!text)
        return nullptr;
    formDigits(*hash, text);
    text[digitCount] = '\0';
    return text;
}

KVHash128State KVHash128Add(KVHash128State a, KVHash128State b) noexcept
{
    KVHash128 sum(a);
    sum += b;
    return sum;
}
