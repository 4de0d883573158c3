#include <korvane/captions/KVSubRipText_p.h>

#include <korvane/platform/CFString.h>

#include <algorithm>
#include <cmath>
#include <limits>

namespace KVSubRip {

CharacterSet::CharacterSet(std::u16string_view characters)
{
    for (char16_t unit : characters) {
        if (unit < ascii_.size())
            ascii_[unit] = true;
        else
            others_ += unit;
    }
}

// --- Numbers and times ---

std::optional<double> parseNumber(std::u16string_view text) noexcept
{
    bool const isNegative = text.starts_with(u'-');
    if (isNegative)
        text.remove_prefix(1);
    if (text.empty())
        return std::nullopt;
    double value = 0;
    for (char16_t unit : text) {
        if (unit < u'0' || unit > u'9')
            return std::nullopt;
        value = value * 10 + (unit - u'0');
    }
    return isNegative ? -value : value;
}

std::u16string_view trimmed(std::u16string_view text) noexcept
{
    while (!text.empty() && CFCharacterIsWhitespace(text.front()))
        text.remove_prefix(1);
    while (!text.empty() && CFCharacterIsWhitespace(text.back()))
        text.remove_suffix(1);
    return text;
}

std::optional<std::array<std::u16string_view, 2>> splitInTwo(std::u16string_view text,
                                                             std::u16string_view separator) noexcept
{
    std::size_t const first = text.find(separator);
    if (first == text.npos)
        return std::nullopt;
    std::size_t const second = first + separator.size();
    if (text.find(separator, second) != text.npos)
        return std::nullopt;
    return std::array{text.substr(0, first), text.substr(second)};
}

namespace {

/// A number as single precision holds it, widened again.
std::optional<double> parseSingle(std::u16string_view text) noexcept
{
    std::optional<double> const number = parseNumber(text);
    if (number && std::abs(*number) > std::numeric_limits<float>::max())
        return std::copysign(std::numeric_limits<double>::infinity(), *number);
    return number ? std::optional<double>(static_cast<float>(*number)) : std::nullopt;
}

} // namespace

std::optional<double> parseTimecode(std::u16string_view text) noexcept
{
    std::size_t const colon = text.find(u':');
    if (colon == text.npos)
        return std::nullopt;
    auto const rest = splitInTwo(text.substr(colon + 1), u":");
    if (!rest)
        return std::nullopt;
    auto last = splitInTwo((*rest)[1], u",");
    if (!last)
        last = splitInTwo((*rest)[1], u".");
    if (!last)
        return std::nullopt;
    auto const hours = parseSingle(text.substr(0, colon));
    auto const minutes = parseSingle((*rest)[0]);
    auto const seconds = parseSingle((*last)[0]);
    auto const milliseconds = parseSingle((*last)[1]);
    if (!hours || !minutes || !seconds || !milliseconds)
        return std::nullopt;
    return *hours * 60 * 60 + *minutes * 60 + *seconds + *milliseconds / 1000.0;
}

// --- Tags ---

namespace {

constexpr char16_t lower(char16_t unit) noexcept
{
    return unit >= u'A' && unit <= u'Z' ? static_cast<char16_t>(unit + 0x20) : unit;
}

/// Whether the text is `expected` (given in lower case) but for the case of ASCII letters.
bool equalsIgnoringCase(std::u16string_view text, std::u16string_view expected) noexcept
{
    return std::equal(text.begin(), text.end(), expected.begin(), expected.end(),
                      [](char16_t a, char16_t b) { return lower(a) == b; });
}

std::u16string_view firstWord(std::u16string_view text) noexcept
{
    text = trimmed(text);
    auto const end = std::find_if(text.begin(), text.end(), CFCharacterIsWhitespace);
    return text.substr(0, static_cast<std::size_t>(end - text.begin()));
}

} // namespace

Tag tagFromToken(std::u16string_view token, CharacterSet const& starts,
                 CharacterSet const& ends) noexcept
{
    if (token.size() < 3 || !starts.contains(token.front()) || !ends.contains(token.back()))
        return Tag::notATag;
    std::u16string_view const inner = token.substr(1, token.size() - 2);
    struct Short {
        std::u16string_view name;
        Tag tag;
    };
    static constexpr Short shorts[] = {
        {u"b", Tag::boldOn},     {u"i", Tag::italicOn},   {u"u", Tag::underlineOn},
        {u"/b", Tag::boldOff},   {u"/i", Tag::italicOff}, {u"/u", Tag::underlineOff},
        {u"br", Tag::lineBreak},
    };
    if (inner.size() <= 2) {
        for (Short const& candidate : shorts) {
            if (equalsIgnoringCase(inner, candidate.name))
                return candidate.tag;
        }
        return Tag::notATag;
    }
    if (equalsIgnoringCase(inner, u"br/"))
        return Tag::lineBreak;
    return firstWord(inner) == u"font" ? Tag::font : Tag::unknownTag;
}

std::optional<std::u16string_view> colorText(std::u16string_view inner) noexcept
{
    constexpr std::u16string_view key = u"color=";
    for (std::size_t i = 0; i + key.size() < inner.size(); ++i) {
        if (!equalsIgnoringCase(inner.substr(i, key.size()), key))
            continue;
        std::u16string_view const rest = inner.substr(i + key.size());
        auto const lineEnd = std::find_if(rest.begin(), rest.end(), CFCharacterIsNewline);
        if (lineEnd != rest.begin())
            return rest.substr(0, static_cast<std::size_t>(lineEnd - rest.begin()));
    }
    return std::nullopt;
}

std::u16string withoutQuotes(std::u16string_view text)
{
    std::u16string result(text);
    std::erase_if(result, [](char16_t unit) {
        return unit == u'"' || unit == u'\'' || unit == u'\u2018' || unit == u'\u201C';
    });
    return result;
}

} // namespace KVSubRip
