#pragma once

#include <korvane/platform/CFBase.h>

#include <string>
#include <string_view>

/// An immutable string of UTF-16 units, header and units in one block of memory. It
/// remembers whether all units are below 0x80, so that such a text goes to and from UTF-8
/// without conversion. Hosts use KVString; this is the reference that it holds.
struct KV_EXPORT __CFString final : NSObject {
    /// A copy of the units, which the caller owns.
    static __CFString const* create(std::u16string_view units);
    /// The same from bytes that are all below 0x80 (not checked).
    static __CFString const* createASCII(std::string_view bytes);

    /// In UTF-16 units.
    std::size_t length() const noexcept { return length_; }
    bool isASCII() const noexcept { return ascii_; }
    /// The units, with a zero behind the last one; valid as long as the string.
    char16_t const* units() const noexcept { return reinterpret_cast<char16_t const*>(this + 1); }
    /// The same, valid as long as the string.
    std::u16string_view view() const noexcept { return {units(), length_}; }

    /// Unit by unit.
    bool isEqual(NSObject const* other) const override;
    std::size_t hash() const override;
    KVString description() const override;

    static void operator delete(void* block) noexcept { ::operator delete(block); }

private:
    static __CFString* allocate(std::size_t length, bool ascii);
    __CFString(std::size_t length, bool ascii) noexcept : length_(length), ascii_(ascii) {}

    std::size_t length_;
    bool ascii_;
};

using CFStringRef = __CFString const*;
using NSString = __CFString const;

enum CFStringEncoding : std::uint32_t {
    kCFStringEncodingMacRoman = 0,
    kCFStringEncodingASCII = 0x0600,
    kCFStringEncodingUTF8 = 0x08000100,
};

enum CFStringCompareFlags : std::uint32_t {
    kCFCompareCaseInsensitive = 1,
    kCFCompareLocalized = 32,
};

KV_EXPORT CFStringRef CFStringCreateWithCharacters(CFAllocatorRef, UniChar const* units,
                                                   CFIndex count);
/// Null when the bytes are not valid in the encoding (for UTF-8: overlong, surrogate, beyond
/// U+10FFFF or cut short).
KV_EXPORT CFStringRef CFStringCreateWithBytes(CFAllocatorRef, void const* bytes, CFIndex count,
                                              CFStringEncoding encoding);
/// From zero-terminated text; null for null text.
KV_EXPORT CFStringRef CFStringCreateWithCString(CFAllocatorRef, char const* text,
                                                CFStringEncoding encoding);
/// The one empty string; owned by the library.
KV_EXPORT CFStringRef CFStringGetEmpty() noexcept;
/// In UTF-16 units; 0 for null.
KV_EXPORT CFIndex CFStringGetLength(CFStringRef) noexcept;

/// The text as UTF-8, empty for null. A surrogate without its partner becomes U+FFFD, so the result
/// is always valid and never has fewer bytes than the string has units.
KV_EXPORT std::string CFStringGetUTF8(CFStringRef);
/// The most bytes that UTF-8 needs for `units` UTF-16 units.
inline constexpr std::size_t CFStringGetMaximumUTF8Length(std::size_t units) noexcept
{
    return 3 * units;
}
/// Writes the UTF-8 form without a terminator and returns the number of bytes.
/// `out` holds at least `CFStringGetMaximumUTF8Length(units.size())` bytes.
KV_EXPORT std::size_t CFStringEncodeUTF8(std::u16string_view units, char* out) noexcept;
/// Whether every high surrogate is followed by a low one and no low one stands alone.
KV_EXPORT bool CFStringIsWellFormed(std::u16string_view units) noexcept;

/// Order by the root collation of the Unicode Collation Algorithm (UTS #10), whatever the user's
/// locale: by base letter, accent and, unless kCFCompareCaseInsensitive is given, case. `flags` are
/// CFStringCompareFlags; kCFCompareLocalized changes nothing.
KV_EXPORT CFComparisonResult CFStringCompareUnits(std::u16string_view, std::u16string_view,
                                                  std::uint32_t flags);

/// Full case mappings of the root locale; the caller owns the result.
KV_EXPORT CFStringRef CFStringCreateUppercase(CFStringRef);
KV_EXPORT CFStringRef CFStringCreateLowercase(CFStringRef);
KV_EXPORT CFStringRef CFStringCreateCapitalized(CFStringRef);
/// Decomposed (NFD), without nonspacing marks (Mn), composed again (NFC).
KV_EXPORT CFStringRef CFStringCreateWithoutDiacritics(CFStringRef);
/// Number of extended grapheme clusters (UAX #29).
KV_EXPORT std::size_t CFStringGetGraphemeCount(CFStringRef);
/// The first boundary between extended grapheme clusters at or behind `index`; `start`, a boundary
/// at or before it, is where they are counted from.
KV_EXPORT std::size_t CFStringGetGraphemeBoundary(std::u16string_view units, std::size_t start,
                                                  std::size_t index);
/// Whether a unit is the tab or of the category Zs.
KV_EXPORT bool CFCharacterIsWhitespace(char16_t) noexcept;
/// Whether a unit is U+000A to U+000D, U+0085, U+2028 or U+2029.
KV_EXPORT bool CFCharacterIsNewline(char16_t) noexcept;
/// One character of Mac OS Roman, a bijection of 256 bytes onto the BMP.
KV_EXPORT char16_t CFCharacterFromMacRoman(std::uint8_t) noexcept;
/// -1 when the character has no place in Mac OS Roman.
KV_EXPORT int CFCharacterToMacRoman(char16_t) noexcept;
