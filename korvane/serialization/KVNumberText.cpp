#include <korvane/serialization/KVNumberText_p.h>

#include <cerrno>
#include <charconv>
#include <clocale>
#include <cmath>
#include <cstdlib>
#include <limits>

#include <locale.h>

namespace {

template <class T>
char* formatInteger(char* out, T value) noexcept
{
    return std::to_chars(out, out + kvNumberTextSize, value).ptr;
}

char* formatHexWord(char* out, std::uint32_t word) noexcept
{
    for (int shift = 28; shift >= 0; shift -= 4)
        *out++ = "0123456789abcdef"[word >> shift & 15];
    return out;
}

/// 16 for what is no hexadecimal digit.
constexpr unsigned int digitValue(char c) noexcept
{
    if (c >= '0' && c <= '9')
        return static_cast<unsigned int>(c - '0');
    char const lower = static_cast<char>(c | 0x20);
    if (lower >= 'a' && lower <= 'f')
        return static_cast<unsigned int>(lower - 'a' + 10);
    return 16;
}

char const* skipSpace(char const* text) noexcept
{
    while (kvIsSpace(*text))
        ++text;
    return text;
}

/// An integer in the form that strtoll and strtoull read.
struct Integer {
    unsigned long long magnitude = 0;
    bool negative = false;
    bool overflow = false;
    /// Behind the last digit; null when there is no digit.
    char const* end = nullptr;
};

Integer readInteger(char const* text, unsigned int base) noexcept
{
    Integer result;
    text = skipSpace(text);
    if (*text == '-' || *text == '+')
        result.negative = *text++ == '-';
    if (base == 16 && text[0] == '0' && (text[1] | 0x20) == 'x' && digitValue(text[2]) < 16)
        text += 2;
    for (unsigned int digit; (digit = digitValue(*text)) < base; result.end = ++text)
        result.overflow |= __builtin_mul_overflow(result.magnitude, base, &result.magnitude) ||
                           __builtin_add_overflow(result.magnitude, digit, &result.magnitude);
    return result;
}

locale_t cLocale() noexcept
{
    static locale_t const locale = newlocale(LC_ALL_MASK, "C", nullptr);
    return locale;
}

float convert(char const* text, char** end, float) noexcept
{
    return strtof_l(text, end, cLocale());
}

double convert(char const* text, char** end, double) noexcept
{
    return strtod_l(text, end, cLocale());
}

/// Behind a plain decimal number at `text`; null if what stands there is none.
char const* endOfDecimal(char const* text) noexcept
{
    char const* const start = text;
    while (digitValue(*text) < 10)
        ++text;
    if (text == start || (*text | 0x20) == 'x')
        return nullptr;
    if (*text == '.')
        while (digitValue(*++text) < 10)
            ;
    if ((*text | 0x20) == 'e') {
        char const* exponent = text + 1;
        if (*exponent == '-' || *exponent == '+')
            ++exponent;
        if (digitValue(*exponent) < 10) {
            while (digitValue(*exponent) < 10)
                ++exponent;
            return exponent;
        }
    }
    return text;
}

template <class T>
bool parseFloat(char const*& cursor, T& value) noexcept
{
    char const* text = skipSpace(cursor);
    bool const negative = *text == '-';
    if (char const* const end = endOfDecimal(text + negative)) {
        auto const [last, error] = std::from_chars(text, end, value);
        if (error == std::errc()) {
            cursor = last;
            return true;
        }
    }
    // Signs, infinities, NaN, hexadecimal forms, numbers out of range, and no number at all.
    char* end;
    int const savedErrno = errno;
    errno = 0;
    value = convert(cursor, &end, value);
    // glibc reports ERANGE for every inexact subnormal too, which is a result like any other.
    bool const outOfRange = errno == ERANGE && (value == 0 || std::isinf(value));
    errno = savedErrno;
    if (outOfRange)
        return false;
    cursor = end;
    return true;
}

} // namespace

char* kvFormat(char* out, int value) noexcept
{
    return formatInteger(out, value);
}

char* kvFormat(char* out, unsigned int value) noexcept
{
    return formatInteger(out, value);
}

char* kvFormat(char* out, long long value) noexcept
{
    return formatInteger(out, value);
}

char* kvFormat(char* out, unsigned long long value) noexcept
{
    return formatInteger(out, value);
}

char* kvFormat(char* out, float value) noexcept
{
    return kvFormat(out, static_cast<double>(value), 10);
}

char* kvFormat(char* out, double value, int digits) noexcept
{
    return std::to_chars(out, out + kvNumberTextSize, value, std::chars_format::general, digits)
        .ptr;
}

char* kvFormat(char* out, KVUUID const& value) noexcept
{
    for (std::uint32_t const word : value.words)
        out = formatHexWord(out, word);
    return out;
}

char* kvFormat(char* out, CMTime const& value) noexcept
{
    out = formatInteger(out, value.value);
    *out++ = ' ';
    out = formatInteger(out, value.timescale);
    *out++ = ' ';
    out = std::to_chars(out, out + 8, value.flags, 16).ptr;
    *out++ = ' ';
    return formatInteger(out, value.epoch);
}

bool kvParseInt(char const*& cursor, long long& value) noexcept
{
    using Limits = std::numeric_limits<long long>;
    Integer const integer = readInteger(cursor, 10);
    unsigned long long const most =
        static_cast<unsigned long long>(Limits::max()) + (integer.negative ? 1 : 0);
    if (integer.overflow || integer.magnitude > most) {
        value = integer.negative ? Limits::min() : Limits::max();
        return false;
    }
    value = static_cast<long long>(integer.negative ? 0 - integer.magnitude : integer.magnitude);
    if (integer.end)
        cursor = integer.end;
    return true;
}

bool kvParseUInt(char const*& cursor, unsigned long long& value, unsigned int base) noexcept
{
    Integer const integer = readInteger(cursor, base);
    if (integer.overflow) {
        value = std::numeric_limits<unsigned long long>::max();
        return false;
    }
    value = integer.negative ? 0 - integer.magnitude : integer.magnitude;
    if (integer.end)
        cursor = integer.end;
    return true;
}

bool kvParseFloat(char const*& cursor, float& value) noexcept
{
    return parseFloat(cursor, value);
}

bool kvParseFloat(char const*& cursor, double& value) noexcept
{
    return parseFloat(cursor, value);
}

bool kvParseUUID(char const* text, KVUUID& value) noexcept
{
    KVUUID result;
    for (std::uint32_t& word : result.words) {
        for (int i = 0; i < 8; ++i, ++text) {
            unsigned int const digit = digitValue(*text);
            if (digit > 15)
                return false;
            word = word << 4 | digit;
        }
    }
    value = result;
    return true;
}
