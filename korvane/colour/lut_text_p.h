#pragma once

#include <korvane/colour/text_word_p.h>

#include <algorithm>
#include <array>
#include <cstddef>
#include <cstdint>
#include <memory>
#include <string>
#include <string_view>

// The words and numbers of LUT files.

namespace cc {

/// Whether a header line is `key`, white space and a value, which may be empty. Lines of more than
/// 4096 bytes are no header lines.
bool tok(std::string_view line, std::string_view key, std::string_view& value);

/// With "A" to "Z" as small letters.
std::string toLower(std::string_view text);

/// Whether the text holds "pandora 3d lut file" or "3d cube file", in letters of any case.
bool namesMGA(std::string_view text);

/// What stands between the first and the last quote of a line; false unless there are two.
bool quoted(std::string_view line, std::string_view& text);

/// Finds the first place where `count` (at most 3) numbers follow each other, with or without white
/// space between them. A number is [-+]?\d*\.?\d+; the longest that lets all of them match is
/// taken, the first one first. So "100" holds the three numbers 1, 0 and 0.
bool findNumbers(std::string_view text, int count, float* numbers);
/// The same for three words of letters, digits and underscores.
bool findWords(std::string_view text, std::string_view (&words)[3]);

/// How many of a table's rows a file of so many bytes, -1 for an unknown number, has room for: a
/// row takes two bytes at least, the last one's end excepted.
inline std::size_t rowsThatFit(std::size_t rows, long long fileSize) noexcept
{
    return fileSize < 0 ? rows : std::min(rows, (static_cast<std::size_t>(fileSize) + 1) / 2);
}

/// The decimal integer at the start of the text, as `strtol` reads it; 0 for none.
long long leadingInteger(std::string_view text) noexcept;

constexpr bool isBlank(char c) noexcept
{
    return c == ' ' || c == '\t';
}

/// Reads a number of the usual form, which is a digit, a point and one to six digits up to a blank
/// or to `end`, and moves behind it. Where it finds no such number, or fewer than eight bytes, it
/// moves nowhere and gives false.
inline bool qdcstr2shortFloat(char const*& at, char const* end, float& value) noexcept
{
    static constexpr float powersOfTen[] = {1e0f, 1e1f, 1e2f, 1e3f, 1e4f, 1e5f, 1e6f};
    char const* p = at;
    if (p != end && isBlank(*p))
        ++p;
    if (end - p < static_cast<std::ptrdiff_t>(kWordSize) || p[1] != '.')
        return false;
    std::uint64_t const word = wordAt(p);
    std::uint64_t const withoutPoint = (word & 0xFF) | (word >> 16 << 8);
    std::size_t const count = leadingDigits(withoutPoint);
    p += count + 1;
    if (count < 2 || (p != end && !isBlank(*p)))
        return false;
    at = p;
    // Both are below 2^24, so they are exact and one rounding is all there is.
    value = static_cast<float>(static_cast<std::int32_t>(digitsValue(withoutPoint, count))) /
            powersOfTen[count - 1];
    return true;
}

/// The same for a number of any form, as told for `qdcstr2float`.
float qdcstr2anyFloat(char const*& at, char const* end) noexcept;

/// Reads the next number of a data row and moves behind it, to the next space or tab or to `end`.
/// What is no number is 0; a number ends where it stops being one, and what follows it up to the
/// blank is passed over. The result is the float nearest to the decimal, infinite beyond its range.
inline float qdcstr2float(char const*& at, char const* end) noexcept
{
    float value;
    if (qdcstr2shortFloat(at, end, value))
        return value;
    char const* place = at; // so that `at` itself can stay in a register
    value = qdcstr2anyFloat(place, end);
    at = place;
    return value;
}

/// Reads decimal digits behind spaces and tabs, modulo 2^64; 0 where there are none.
std::uint64_t qdcstr2unsigned(char const*& at, char const* end) noexcept;

/// Text on its way to a file, handed over in blocks. After a failed write the rest is dropped.
class lut_output_t {
public:
    explicit lut_output_t(int fd) : fd_(fd), block_(std::make_unique<char[]>(kBlock)) {}

    lut_output_t& operator<<(std::string_view text);
    lut_output_t& operator<<(char character)
    {
        *room(1) = character;
        ++used_;
        return *this;
    }
    lut_output_t& operator<<(std::uint64_t number);
    /// A line of three numbers as "%f" prints them: six digits behind the point, rounded half to
    /// even.
    lut_output_t& row(std::array<float, 3> const& numbers);

    /// Writes what is left; the `errno` of the first failure, 0 for none.
    int finish();

private:
    static constexpr std::size_t kBlock = std::size_t(1) << 16;
    /// The longest number: a sign, the 39 digits of the largest float, a point, six digits.
    static constexpr std::size_t kLongestNumber = 47;

    /// Where the next `size` bytes go, at most kBlock.
    char* room(std::size_t size)
    {
        if (kBlock - used_ < size)
            flush();
        return block_.get() + used_;
    }
    static char* printFixed(char* at, float number);
    void flush();

    int fd_;
    int error_ = 0;
    std::size_t used_ = 0;
    std::unique_ptr<char[]> block_;
};

} // namespace cc
