#pragma once

#include <korvane/platform/NSAttributedString.h>

/// Black in the colour space of a text colour; null is sRGB.
KVNSRef<NSColor const*> KVBlackForTextColor(NSColor const* textColor);

/// The string as an immutable one with `stringWithBlackBackground`'s attributes. A string that has
/// them already is shared.
KVNSRef<NSAttributedString const*> KVCopyOnBlack(NSAttributedString const* string);

/// Styles of an attributed string by property: what the queries of a caption answer.
namespace KVStyle {

NSColor const* textColor(NSAttributedString const* string, std::size_t index, NSRange* range);
NSColor const* backgroundColor(NSAttributedString const* string, std::size_t index, NSRange* range);
long long decoration(NSAttributedString const* string, std::size_t index, NSRange* range);
bool isItalic(NSAttributedString const* string, std::size_t index, NSRange* range);
bool isBold(NSAttributedString const* string, std::size_t index, NSRange* range);

} // namespace KVStyle
