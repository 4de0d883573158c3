#include "Markup.h"

#include <algorithm>
#include <array>
#include <charconv>
#include <iterator>

namespace {

constexpr char kReplacement[] = "\xEF\xBF\xBD";

bool isContinuation(char c)
{
    return (static_cast<unsigned char>(c) & 0xC0) == 0x80;
}

/// The length of the well-formed UTF-8 sequence at the start of a text that is not empty; 0 where
/// there is none (Unicode 15, table 3-7).
std::size_t sequenceLength(std::string_view text)
{
    struct Row {
        unsigned char first, last, secondFirst, secondLast;
        std::size_t length;
    };
    constexpr Row rows[] = {{0xC2, 0xDF, 0x80, 0xBF, 2}, {0xE0, 0xE0, 0xA0, 0xBF, 3},
                            {0xE1, 0xEC, 0x80, 0xBF, 3}, {0xED, 0xED, 0x80, 0x9F, 3},
                            {0xEE, 0xEF, 0x80, 0xBF, 3}, {0xF0, 0xF0, 0x90, 0xBF, 4},
                            {0xF1, 0xF3, 0x80, 0xBF, 4}, {0xF4, 0xF4, 0x80, 0x8F, 4}};
    auto const lead = static_cast<unsigned char>(text[0]);
    if (lead < 0x80)
        return 1;
    for (Row const& row : rows) {
        if (lead < row.first || lead > row.last || text.size() < row.length)
            continue;
        auto const second = static_cast<unsigned char>(text[1]);
        bool const isWhole =
            second >= row.secondFirst && second <= row.secondLast &&
            std::all_of(text.begin() + 2, text.begin() + static_cast<std::ptrdiff_t>(row.length),
                        isContinuation);
        return isWhole ? row.length : 0;
    }
    return 0;
}

} // namespace

std::string escaped(std::string_view text)
{
    std::string result;
    result.reserve(text.size());
    while (!text.empty()) {
        std::size_t const length = sequenceLength(text);
        auto const c = static_cast<unsigned char>(text[0]);
        if (length == 0)
            result += kReplacement;
        else if (length > 1 && c == 0xC2 && static_cast<unsigned char>(text[1]) < 0xA0)
            result += kReplacement; // the controls U+0080 to U+009F
        else if (c == '&')
            result += "&amp;";
        else if (c == '<')
            result += "&lt;";
        else if (c == '>')
            result += "&gt;";
        else if (c == '"')
            result += "&quot;";
        else if (c == '\'')
            result += "&#39;";
        else if (c == 0x7F)
            result += "\u2421";
        else if (c < ' ' && c != '\n')
            result += {'\xE2', '\x90', static_cast<char>(0x80 + c)};
        else
            result += text.substr(0, length);
        text.remove_prefix(std::max<std::size_t>(length, 1));
    }
    return result;
}

std::string clipped(std::string_view text, std::size_t most)
{
    std::size_t end = 0;
    for (std::size_t count = 0; end < text.size(); ++end)
        if (!isContinuation(text[end]) && count++ == most)
            break;
    // Bytes that only continue count as nothing, and could be many.
    end = std::min(end, 4 * most);
    return std::string(text.substr(0, end)) + (end < text.size() ? "\u2026" : "");
}

std::string decimal(double value, int digits)
{
    std::array<char, 400> text{};
    char* end =
        std::to_chars(text.begin(), text.end(), value, std::chars_format::fixed, digits).ptr;
    if (std::find(text.begin(), end, '.') != end) {
        while (end[-1] == '0')
            --end;
        if (end[-1] == '.')
            --end;
    }
    std::string const result(text.begin(), end);
    return result == "-0" ? "0" : result;
}
