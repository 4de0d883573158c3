#pragma once

#include <korvane/captions/KVSRTCaptionsImporter.h>

#include <array>
#include <cstdint>
#include <optional>
#include <string>
#include <string_view>

/// The small grammar of SubRip text, on views of UTF-16; it knows nothing of captions.
namespace KVSubRip {

/// A few characters, asked for often.
class CharacterSet {
public:
    explicit CharacterSet(std::u16string_view characters);
    bool contains(char16_t unit) const noexcept
    {
        return unit < ascii_.size() ? ascii_[unit] : others_.find(unit) != others_.npos;
    }

private:
    std::array<bool, 128> ascii_{};
    std::u16string others_;
};

/// An optional "-" and ASCII digits, nothing else; a number too large for a `double` is an
/// infinity.
std::optional<double> parseNumber(std::u16string_view text) noexcept;

/// Without the blanks (Zs and tab) at both ends.
std::u16string_view trimmed(std::u16string_view text) noexcept;

/// Exactly two parts around the separator; nothing for another number of parts.
std::optional<std::array<std::u16string_view, 2>>
splitInTwo(std::u16string_view text, std::u16string_view separator) noexcept;

/// "hours:minutes:seconds,milliseconds" in seconds, each field a single-precision number.
std::optional<double> parseTimecode(std::u16string_view text) noexcept;

/// Cuts text into tags and what stands between them: `emit` gets each token, none empty, which
/// together are the text.
template <class Emit>
void tokenize(std::u16string_view text, CharacterSet const& starts, CharacterSet const& ends,
              Emit emit)
{
    std::size_t tokenStart = 0;
    bool insideTag = false;
    for (std::size_t i = 0; i < text.size(); ++i) {
        if (!insideTag && starts.contains(text[i])) {
            if (i > tokenStart)
                emit(text.substr(tokenStart, i - tokenStart));
            tokenStart = i;
            insideTag = true;
        } else if (insideTag && ends.contains(text[i])) {
            emit(text.substr(tokenStart, i + 1 - tokenStart));
            tokenStart = i + 1;
            insideTag = false;
        }
    }
    if (tokenStart < text.size())
        emit(text.substr(tokenStart));
}

/// What a token is.
using Tag = KVSRTCaptionsImporter::Tag;
Tag tagFromToken(std::u16string_view token, CharacterSet const& starts,
                 CharacterSet const& ends) noexcept;

/// Of a font tag's inner text the part behind "color=", in any case, up to the line's end; nothing
/// when there is none. It may hold quotes: see `withoutQuotes`.
std::optional<std::u16string_view> colorText(std::u16string_view inner) noexcept;

/// Without ", ', ‘ and “.
std::u16string withoutQuotes(std::u16string_view text);

} // namespace KVSubRip
