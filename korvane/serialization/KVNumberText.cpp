#include <korvane/serialization/KVNumberText_p.h>

#include <algorithm>
#include <bit>
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

/// Numbers of up to ten binary places, such as 3, 0.5 and 249.75, whose decimals end after as many.
/// Null for others, and where "%g" would round them or write an exponent.
char* formatShort(char* out, double value, int digits) noexcept
{
    constexpr double most = 1ull << 40;
    double const scaled = std::abs(value) * 1024;
    if (!(scaled < most))
        return nullptr;
    auto const exact = static_cast<std::uint64_t>(scaled);
    if (static_cast<double>(exact) != scaled)
        return nullptr;
    if (std::signbit(value))
        *out++ = '-';
    char* const start = out;
    out = formatInteger(out, exact >> 10);
    std::uint64_t fraction = (exact & 1023) * 9765625; // ten digits
    if (fraction == 0)
        return out;
    *out++ = '.';
    for (std::uint64_t power = 1'000'000'000; fraction != 0; power /= 10) {
        *out++ = static_cast<char>('0' + fraction / power);
        fraction %= power;
    }
    return out - start - 1 <= digits ? out : nullptr;
}

/// 16 or more for what is no hexadecimal digit.
constexpr unsigned int digitValue(char c) noexcept
{
    unsigned int const decimal = static_cast<unsigned char>(c) - unsigned('0');
    if (decimal < 10)
        return decimal;
    unsigned int const letter = (static_cast<unsigned char>(c) | 0x20u) - unsigned('a');
    return letter < 6 ? letter + 10 : 16;
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

template <unsigned int base>
Integer readInteger(char const* text) noexcept
{
    Integer result;
    text = skipSpace(text);
    if (*text == '-' || *text == '+')
        result.negative = *text++ == '-';
    if (base == 16 && text[0] == '0' && (text[1] | 0x20) == 'x' && digitValue(text[2]) < 16)
        text += 2;
    char const* const start = text;
    unsigned int digit;
    // So many digits fit without a look.
    char const* const safeEnd = start + (base == 16 ? 16 : 19);
    while (text != safeEnd && (digit = digitValue(*text)) < base) {
        result.magnitude = result.magnitude * base + digit;
        ++text;
    }
    for (; (digit = digitValue(*text)) < base; ++text)
        result.overflow |= __builtin_mul_overflow(result.magnitude, base, &result.magnitude) ||
                           __builtin_add_overflow(result.magnitude, digit, &result.magnitude);
    if (text != start)
        result.end = text;
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

/// A decimal number without a sign: `digits` times ten to the power of `exponent`.
struct Decimal {
    unsigned long long digits = 0;
    long exponent = 0;
    /// `digits` holds all that there are.
    bool isWhole = true;
    /// Behind it; null if what stands there is no plain decimal number.
    char const* end = nullptr;
};

Decimal readDecimal(char const* text) noexcept
{
    Decimal result;
    constexpr unsigned long long most = (std::numeric_limits<unsigned long long>::max() - 9) / 10;
    auto const takeDigits = [&](bool areDecimals) {
        for (unsigned int digit; (digit = digitValue(*text)) < 10; ++text) {
            if (result.digits <= most) {
                result.digits = result.digits * 10 + digit;
                result.exponent -= areDecimals;
            } else {
                result.isWhole = false;
            }
        }
    };
    char const* const start = text;
    takeDigits(false);
    if (text == start || (*text | 0x20) == 'x')
        return result;
    if (*text == '.') {
        ++text;
        takeDigits(true);
    }
    if ((*text | 0x20) == 'e') {
        char const* digits = text + 1;
        bool const negative = *digits == '-';
        digits += negative || *digits == '+';
        if (digitValue(*digits) < 10) {
            long exponent = 0;
            for (text = digits; digitValue(*text) < 10; ++text)
                exponent = std::min(exponent * 10 + *text - '0', 1'000'000l);
            result.exponent += negative ? -exponent : exponent;
        }
    }
    result.end = text;
    return result;
}

/// The nearest double, where two exact ones make it in one operation (Clinger, How to read
/// floating point numbers accurately, 1990).
bool toDouble(Decimal const& decimal, double& value) noexcept
{
    static constexpr double powers[] = {1e0,  1e1,  1e2,  1e3,  1e4,  1e5,  1e6,  1e7,
                                        1e8,  1e9,  1e10, 1e11, 1e12, 1e13, 1e14, 1e15,
                                        1e16, 1e17, 1e18, 1e19, 1e20, 1e21, 1e22};
    if (!decimal.isWhole || decimal.digits > 1ull << 53 || decimal.exponent < -22 ||
        decimal.exponent > 22)
        return false;
    auto const digits = static_cast<double>(decimal.digits);
    value = decimal.exponent < 0 ? digits / powers[-decimal.exponent]
                                 : digits * powers[decimal.exponent];
    return true;
}

bool convertQuickly(Decimal const& decimal, double& value) noexcept
{
    return toDouble(decimal, value);
}

/// Rounding twice gives another float than rounding once only where the double lies half-way
/// between two floats.
bool convertQuickly(Decimal const& decimal, float& value) noexcept
{
    double wide;
    if (!toDouble(decimal, wide))
        return false;
    constexpr std::uint64_t lostBits = (1u << 29) - 1;
    constexpr std::uint64_t halfWay = 1u << 28;
    bool const isNormal = wide == 0 || (wide >= std::numeric_limits<float>::min() &&
                                        wide <= std::numeric_limits<float>::max());
    if (!isNormal || (std::bit_cast<std::uint64_t>(wide) & lostBits) == halfWay)
        return false;
    value = static_cast<float>(wide);
    return true;
}

template <class T>
bool parseFloat(char const*& cursor, T& value) noexcept
{
    char const* const text = skipSpace(cursor);
    bool const negative = *text == '-';
    Decimal const decimal = readDecimal(text + negative);
    if (decimal.end) {
        if (convertQuickly(decimal, value)) {
            if (negative)
                value = -value;
            cursor = decimal.end;
            return true;
        }
        if (std::from_chars(text, decimal.end, value).ec == std::errc()) {
            cursor = decimal.end;
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
    if (char* const end = formatShort(out, value, digits))
        return end;
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
    // Most numbers are short.
    char const* text = skipSpace(cursor);
    bool const negative = *text == '-';
    char const* const start = text += negative;
    long long magnitude = 0;
    for (unsigned int digit; (digit = digitValue(*text)) < 10 && text - start < 18; ++text)
        magnitude = magnitude * 10 + digit;
    if (text != start && digitValue(*text) >= 10) {
        value = negative ? -magnitude : magnitude;
        cursor = text;
        return true;
    }
    using Limits = std::numeric_limits<long long>;
    Integer const integer = readInteger<10>(cursor);
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
    Integer const integer = base == 16 ? readInteger<16>(cursor) : readInteger<10>(cursor);
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
