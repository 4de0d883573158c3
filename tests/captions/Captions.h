#pragma once

// What the tests of captions share.

#include <korvane/korvane.h>

/// From one second to another.
inline CMTimeRange rangeOf(long long start, long long end)
{
    return {CMTimeMake(start, 1), CMTimeMake(end - start, 1)};
}

/// The text with a letter-coded line of styles under it: for each unit the sum of 1 bold, 2 italic,
/// 4 underlined.
inline std::string stylesOf(NSAttributedString const* string)
{
    std::string styles;
    for (std::size_t i = 0; i < string->length(); ++i) {
        auto const* font = dynamic_cast<NSFont const*>(string->attribute(NSFontAttributeName, i));
        bool const isUnderlined = string->attribute(NSUnderlineStyleAttributeName, i) != nullptr;
        styles += static_cast<char>('0' + (font && font->isBold()) +
                                    2 * (font && font->isItalic()) + 4 * isUnderlined);
    }
    return styles;
}

/// Each unit's text colour as "rrggbb", run by run, with commas; "-" for none.
inline std::string coloursOf(NSAttributedString const* string)
{
    std::string result;
    NSRange range;
    for (std::size_t i = 0; i < string->length(); i = NSMaxRange(range)) {
        auto const* color = dynamic_cast<NSColor const*>(
            string->attribute(NSForegroundColorAttributeName, i, &range));
        char text[8] = "-";
        if (color) {
            auto const byte = [](double component) { return int(component * 255 + 0.5); };
            std::snprintf(text, sizeof text, "%02x%02x%02x", byte(color->redComponent()) & 0xFF,
                          byte(color->greenComponent()) & 0xFF,
                          byte(color->blueComponent()) & 0xFF);
        }
        result += (result.empty() ? "" : ",") + std::string(text);
    }
    return result;
}
