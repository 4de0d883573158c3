#include <korvane/colour/lut_text_p.h>

#include <algorithm>
#include <array>
#include <bit>
#include <cerrno>
#include <charconv>
#include <cmath>
#include <cstring>
#include <iterator>
#include <limits>
#include <string>
#include <unistd.h>

namespace cc {

namespace {

constexpr std::size_t longestHeaderLine = 4096;

constexpr bool isDigit(char c) noexcept
{
    return c >= '0' && c <= '9';
}

constexpr bool isSpace(char c) noexcept
{
    return c == ' ' || (c >= '\t' && c <= '\r');
}

constexpr char lowerOf(char c) noexcept
{
    return c >= 'A' && c <= 'Z' ? static_cast<char>(c - 'A' + 'a') : c;
}

constexpr bool isWordCharacter(char c) noexcept
{
    return isDigit(c) || c == '_' || (lowerOf(c) >= 'a' && lowerOf(c) <= 'z');
}

template <class Predicate>
std::size_t skip(std::string_view text, std::size_t at, Predicate predicate)
{
    while (at < text.size() && predicate(text[at]))
        ++at;
    return at;
}

// --- Tokens in a row ---

/// Where a token that begins at some place may end: anywhere in the first range, else anywhere in
/// the second one, in each as far back as can be. A range holds its end and not its begin.
struct Ends {
    std::size_t begin[2] = {0, 0};
    std::size_t end[2] = {0, 0};
};

/// [-+]?\d*\.?\d+
Ends numberEnds(std::string_view text, std::size_t at)
{
    Ends ends;
    if (at < text.size() && (text[at] == '-' || text[at] == '+'))
        ++at;
    std::size_t const digits = skip(text, at, isDigit);
    if (digits < text.size() && text[digits] == '.') {
        ends.begin[0] = digits + 1;
        ends.end[0] = skip(text, digits + 1, isDigit);
    }
    ends.begin[1] = at;
    ends.end[1] = digits;
    return ends;
}

/// \w+
Ends wordEnds(std::string_view text, std::size_t at)
{
    Ends ends;
    ends.begin[0] = at;
    ends.end[0] = skip(text, at, isWordCharacter);
    return ends;
}

using FindEnds = Ends (*)(std::string_view, std::size_t);

/// Three characters of a token are enough for three tokens, so this gives back little before it
/// succeeds, and never tries more than a few ends before it fails.
bool matchTokens(std::string_view text, std::size_t at, FindEnds findEnds, int count,
                 std::string_view* tokens)
{
    if (count == 0)
        return true;
    Ends const ends = findEnds(text, at);
    for (int range = 0; range < 2; ++range)
        for (std::size_t end = ends.end[range]; end > ends.begin[range]; --end)
            if (matchTokens(text, count == 1 ? end : skip(text, end, isSpace), findEnds, count - 1,
                            tokens + 1)) {
                *tokens = text.substr(at, end - at);
                return true;
            }
    return false;
}

bool findTokens(std::string_view text, FindEnds findEnds, int count, std::string_view* tokens)
{
    for (std::size_t at = 0; at < text.size(); ++at)
        if (matchTokens(text, at, findEnds, count, tokens))
            return true;
    return false;
}

// --- Numbers ---

/// A number beyond the range of float: whether it is so by its size, not by its smallness. The text
/// is digits, a point, digits and an exponent, as from_chars has accepted it.
bool isHuge(std::string_view text)
{
    std::size_t const exponentAt = std::min(text.find_first_of("eE"), text.size());
    std::string_view const digits = text.substr(0, exponentAt);
    std::size_t const point = std::min(digits.find('.'), digits.size());
    std::size_t const first = std::min(digits.find_first_of("123456789"), digits.size());
    long long exponent = leadingInteger(text.substr(std::min(exponentAt + 1, text.size())));
    exponent = std::clamp(exponent, -1000000000000ll, 1000000000000ll);
    return exponent + static_cast<long long>(point) - static_cast<long long>(first) > 0;
}

/// The float nearest to the number at the start of the text, which begins with a digit or a point.
float nearestFloat(std::string_view text)
{
    float value = 0;
    auto const [end, error] = std::from_chars(text.data(), text.data() + text.size(), value);
    if (error == std::errc::result_out_of_range)
        return isHuge({text.data(), static_cast<std::size_t>(end - text.data())})
                   ? std::numeric_limits<float>::infinity()
                   : 0.0f;
    return error == std::errc() ? value : 0.0f;
}

constexpr double powersOfTen[] = {1e0,  1e1,  1e2,  1e3,  1e4,  1e5,  1e6,  1e7,
                                  1e8,  1e9,  1e10, 1e11, 1e12, 1e13, 1e14, 1e15,
                                  1e16, 1e17, 1e18, 1e19, 1e20, 1e21, 1e22};

/// The float nearest to digits / 10^places by one division of exact doubles; false where that does
/// not decide it. The double is the one nearest to the quotient. Rounding it once more is wrong
/// only if it lies half-way between two floats, which the 29 bits that float has not tell.
/// (Clinger, How to read floating point numbers accurately, 1990.)
bool divideExactly(std::uint64_t digits, int places, float& result)
{
    constexpr std::uint64_t exactIntegers = std::uint64_t(1) << 53;
    if (digits > exactIntegers || places >= static_cast<int>(std::size(powersOfTen)))
        return false;
    double const quotient = static_cast<double>(digits) / powersOfTen[places];
    constexpr std::uint64_t lostBits = (std::uint64_t(1) << 29) - 1;
    if ((std::bit_cast<std::uint64_t>(quotient) & lostBits) == (lostBits >> 1) + 1)
        return false;
    result = static_cast<float>(quotient);
    return true;
}

/// "00" to "99".
constexpr auto digitPairs = [] {
    std::array<char, 200> pairs{};
    for (std::size_t i = 0; i < pairs.size(); ++i)
        pairs[i] = static_cast<char>('0' + (i % 2 ? i / 2 % 10 : i / 20));
    return pairs;
}();

} // namespace

// --- Header lines ---

bool tok(std::string_view line, std::string_view key, std::string_view& value)
{
    if (line.size() > longestHeaderLine || !line.starts_with(key))
        return false;
    std::size_t const start = skip(line, key.size(), isSpace);
    if (start == key.size())
        return false;
    value = line.substr(start);
    return true;
}

std::string toLower(std::string_view text)
{
    std::string lower(text);
    std::transform(lower.begin(), lower.end(), lower.begin(), lowerOf);
    return lower;
}

bool namesMGA(std::string_view text)
{
    std::string const lower = toLower(text);
    return lower.find("pandora 3d lut file") != std::string::npos ||
           lower.find("3d cube file") != std::string::npos;
}

bool quoted(std::string_view line, std::string_view& text)
{
    std::size_t const first = line.find('"');
    std::size_t const last = line.rfind('"');
    if (first == last)
        return false;
    text = line.substr(first + 1, last - first - 1);
    return true;
}

bool findNumbers(std::string_view text, int count, float* numbers)
{
    std::string_view tokens[3];
    if (!findTokens(text, numberEnds, count, tokens))
        return false;
    for (int i = 0; i < count; ++i) {
        char const* at = tokens[i].data();
        numbers[i] = qdcstr2float(at, at + tokens[i].size());
    }
    return true;
}

bool findWords(std::string_view text, std::string_view (&words)[3])
{
    return findTokens(text, wordEnds, 3, words);
}

long long leadingInteger(std::string_view text) noexcept
{
    std::size_t at = skip(text, 0, isSpace);
    bool const negative = at < text.size() && text[at] == '-';
    if (at < text.size() && (text[at] == '-' || text[at] == '+'))
        ++at;
    if (at == text.size() || !isDigit(text[at]))
        return 0;
    unsigned long long value = 0;
    auto const [end, error] = std::from_chars(text.data() + at, text.data() + text.size(), value);
    constexpr auto largest = std::numeric_limits<long long>::max();
    bool const tooLarge = error != std::errc() || value > static_cast<unsigned long long>(largest);
    long long const magnitude = tooLarge ? largest : static_cast<long long>(value);
    return negative ? -magnitude : magnitude;
}

// --- Data rows ---

float qdcstr2anyFloat(char const*& at, char const* end) noexcept
{
    while (at != end && isBlank(*at))
        ++at;
    char const* p = at;
    bool const negative = p != end && *p == '-';
    if (p != end && (*p == '-' || *p == '+'))
        ++p;
    char const* const number = p;

    std::uint64_t digits = 0;
    while (p != end && isDigit(*p))
        digits = digits * 10 + static_cast<std::uint64_t>(*p++ - '0');
    char const* const integerEnd = p;
    int places = 0;
    if (p != end && *p == '.') {
        ++p;
        while (p != end && isDigit(*p))
            digits = digits * 10 + static_cast<std::uint64_t>(*p++ - '0');
        places = static_cast<int>(std::min<std::ptrdiff_t>(p - integerEnd - 1, 100));
    }
    // Up to 19 digits cannot have overflowed 64 bits.
    bool const plain = (p == end || isBlank(*p)) && p - number <= 19;
    while (p != end && !isBlank(*p))
        ++p;
    at = p;

    float value = 0;
    if (!plain || !divideExactly(digits, places, value)) {
        bool const isNumber = number != p && (isDigit(*number) || *number == '.');
        value = isNumber ? nearestFloat({number, static_cast<std::size_t>(p - number)}) : 0.0f;
    }
    return negative ? -value : value;
}

std::uint64_t qdcstr2unsigned(char const*& at, char const* end) noexcept
{
    while (at != end && isBlank(*at))
        ++at;
    std::uint64_t value = 0;
    while (at != end && isDigit(*at))
        value = value * 10 + static_cast<std::uint64_t>(*at++ - '0');
    return value;
}

// --- Writing ---

lut_output_t& lut_output_t::operator<<(std::string_view text)
{
    while (!text.empty()) {
        std::size_t const count = std::min(text.size(), kBlock);
        std::memcpy(room(count), text.data(), count);
        used_ += count;
        text.remove_prefix(count);
    }
    return *this;
}

lut_output_t& lut_output_t::operator<<(std::uint64_t number)
{
    char* const text = room(kLongestNumber);
    used_ +=
        static_cast<std::size_t>(std::to_chars(text, text + kLongestNumber, number).ptr - text);
    return *this;
}

inline char* lut_output_t::printFixed(char* at, float number)
{
    // A float below 2^23 is a 24-bit integer over a power of two, so its millionths are the
    // quotient of a 44-bit integer, rounded on its exact remainder.
    auto const bits = std::bit_cast<std::uint32_t>(number);
    int const exponent = static_cast<int>(bits >> 23 & 0xFF);
    if (int const shift = 150 - std::max(exponent, 1); shift > 0) {
        std::uint64_t const integer = (bits & 0x7FFFFF) | (exponent ? 0x800000u : 0u);
        std::uint64_t millionths = 0;
        if (shift < 64) {
            std::uint64_t const scaled = integer * 1000000;
            std::uint64_t const half = std::uint64_t(1) << (shift - 1);
            std::uint64_t const rest = scaled & (2 * half - 1);
            millionths = scaled >> shift;
            millionths += rest + (millionths & 1) > half; // half to even, without a branch
        }
        if (bits >> 31)
            *at++ = '-';
        auto const whole = static_cast<std::uint32_t>(millionths / 1000000);
        auto const fraction = static_cast<std::uint32_t>(millionths % 1000000);
        if (whole < 10)
            *at++ = static_cast<char>('0' + whole);
        else
            at = std::to_chars(at, at + 7, whole).ptr;
        *at++ = '.';
        for (std::uint32_t const pair : {fraction / 10000, fraction / 100 % 100, fraction % 100}) {
            std::memcpy(at, &digitPairs[2 * pair], 2);
            at += 2;
        }
        return at;
    }
    auto const value = static_cast<double>(number);
    return std::to_chars(at, at + kLongestNumber, value, std::chars_format::fixed, 6).ptr;
}

lut_output_t& lut_output_t::row(std::array<float, 3> const& numbers)
{
    char* at = room(numbers.size() * (kLongestNumber + 1));
    for (float const number : numbers) {
        at = printFixed(at, number);
        *at++ = ' ';
    }
    at[-1] = '\n';
    used_ = static_cast<std::size_t>(at - block_.get());
    return *this;
}

int lut_output_t::finish()
{
    flush();
    return error_;
}

void lut_output_t::flush()
{
    char const* at = block_.get();
    char const* const end = at + used_;
    while (at != end && error_ == 0) {
        ssize_t const count = ::write(fd_, at, static_cast<std::size_t>(end - at));
        if (count > 0)
            at += count;
        else if (count == 0)
            error_ = EIO;
        else if (errno != EINTR)
            error_ = errno;
    }
    used_ = 0;
}

} // namespace cc
