#pragma once

#include <korvane/foundation/KVCFRef.h>
#include <korvane/platform/CFBundle.h>
#include <korvane/platform/CFString.h>

#include <compare>
#include <cstdarg>
#include <cstddef>
#include <iosfwd>
#include <string>
#include <string_view>

/// Unicode text by value: one reference to an immutable string of UTF-16 units, or to none.
///
///     KVString title("Réel");           // from UTF-8
///     title.append(" 01");
///     title.size();                     // 7, in UTF-16 units
///     std::string utf8 = title;
///
/// A null string (no reference) and one of length 0 are both `empty()`; they differ in `compare`
/// and in the functions that say so. Lengths and positions count UTF-16 units. Copies share the
/// text and allocate nothing; every change makes a new text. Positions out of range are clamped: a
/// position to the length, a length to what is left behind it.
///
/// UTF-8 that is not well formed gives the null string. On the way out, half a surrogate pair
/// becomes U+FFFD.
///
/// Not synchronised: a value belongs to one thread, the text that it shares need not.
class KV_EXPORT KVString {
public:
    /// What `find` answers when there is no match.
    static constexpr unsigned int npos = 0xFFFFFFFFu;

    // --- Make ---

    constexpr KVString() noexcept = default;
    KVString(std::nullptr_t) : KVString("") {}
    /// From zero-terminated UTF-8; null or empty text gives the empty string, not the null one.
    KVString(char const* utf8);
    /// From all bytes of UTF-8; an empty text gives the empty string.
    KVString(std::string const& utf8);
    /// From zero-terminated UTF-16; null gives the null string.
    KVString(unsigned short const* utf16);
    KVString(char16_t const* utf16);
    /// Retains; null gives the null string.
    KVString(__CFString const* string) noexcept : text_(string) {}
    /// Retains or copies; an immutable string's copy is the string itself.
    KVString(__CFString const* string, bool retain) noexcept;

    /// Localised texts: `key` looked up in a bundle's table. An unknown key, table or bundle gives
    /// the key itself; a null key gives the null string, as does a null `bundleId` of type `char
    /// const*`.
    KVString(__CFString const* key, char const* bundleId);
    KVString(__CFString const* key, __CFString const* bundleId);
    KVString(__CFString const* key, __CFBundle* bundle, __CFString const* table);
    KVString(char const* key, char const* bundleId);
    KVString(char const* key, char const* bundleId, char const* table);
    KVString(char const* key, __CFBundle* bundle, char const* table);

    /// Takes over a reference that the caller owns.
    static KVString adopt(CFStringRef string) noexcept;
    /// From UTF-8 that need not be terminated.
    static KVString fromUTF8(std::string_view utf8);
    /// From UTF-16 that need not be terminated; half a surrogate pair is kept.
    static KVString fromUTF16(std::u16string_view units);

    void set(KVString const& other) noexcept { text_ = other.text_; }
    /// Like the constructor: null or empty text gives the empty string.
    void set(char const* utf8);
    /// Exactly `length` bytes; a null pointer gives the empty string.
    void set(char const* utf8, unsigned int length);
    void set(unsigned short const* utf16);
    void set(unsigned short const* utf16, unsigned int length);
    void set(char16_t const* utf16);
    void set(char16_t const* utf16, unsigned int length);
    void set(__CFString const* string) noexcept { text_ = string; }
    /// Makes it null.
    void clear() noexcept { text_ = nullptr; }

    // --- Read ---

    bool empty() const noexcept { return size() == 0; }
    /// Whether there is no string at all, not even an empty one.
    bool isNull() const noexcept { return text_.get() == nullptr; }
    /// In UTF-16 units.
    unsigned int size() const noexcept
    {
        return text_ ? static_cast<unsigned int>(text_->length()) : 0;
    }
    /// Unowned, never null: a null string answers the shared empty one.
    CFStringRef cf_str() const noexcept { return text_ ? text_.get() : CFStringGetEmpty(); }
    NSString* ns_str() const noexcept { return cf_str(); }
    /// The units with a terminating zero, valid while this text is held; null for the null string.
    char16_t const* u_str() const noexcept { return text_ ? text_->units() : nullptr; }
    /// The units, valid while this text is held; none for the null string.
    std::u16string_view view() const noexcept
    {
        return text_ ? text_->view() : std::u16string_view();
    }
    /// `malloc`ed UTF-8, which the caller frees; a null string gives an empty text.
    char* createCStr() const;
    /// The same, but null for the null string.
    char* createUTF8Str() const;
    /// `malloc`ed UTF-16 with a terminator, which the caller frees; null for the null string.
    unsigned short* createUniStr() const;
    /// UTF-8; a null string gives an empty text.
    std::string toUTF8() const { return CFStringGetUTF8(text_); }
    operator std::string() const { return toUTF8(); }

    // --- Four-character codes ---

    /// Sets the text "'abcd'": the code's bytes in Mac OS Roman from the top, up to where only zero
    /// bits are left. 0 gives "''".
    void setOSType(unsigned int code);
    /// The code in a text of that form with four characters; all else gives 0. What follows the
    /// sixth character is not looked at.
    unsigned int get_OSType() const noexcept;

    // --- Compare and search ---

    /// Below 0, 0 or above 0, by the root collation (UTS #10), whatever the user's locale. Null
    /// sorts before any string, the empty one included.
    int compare(KVString const& other) const;
    /// Compares that many units at `position` of this string with the whole of `other`.
    int compare(unsigned long position, unsigned int length, KVString const& other) const;
    int caseInsensitiveCompare(KVString const& other) const;
    int caseInsensitiveCompare(unsigned long position, unsigned int length,
                               KVString const& other) const;
    /// Not offered: prints where it stands and aborts the process.
    [[noreturn]] int compare(unsigned long position, unsigned int length, KVString const& other,
                             unsigned long otherPosition) const;
    [[noreturn]] int caseInsensitiveCompare(unsigned long position, unsigned int length,
                                            KVString const& other,
                                            unsigned long otherPosition) const;
    /// The position of the first match, unit by unit; `npos` when there is none, when `needle` is
    /// empty or this is null.
    unsigned int find(KVString const& needle) const noexcept;

    /// Operators tell texts apart unit by unit, null before empty: exact and fast, for keys and
    /// tables. `compare` gives the order that a reader expects.
    friend bool operator==(KVString const& a, KVString const& b) noexcept
    {
        return a.isNull() == b.isNull() && a.view() == b.view();
    }
    friend std::strong_ordering operator<=>(KVString const& a, KVString const& b) noexcept
    {
        if (a.isNull() != b.isNull())
            return b.isNull() <=> a.isNull();
        return a.view() <=> b.view();
    }

    // --- Change ---

    /// Nothing for a null argument; a null string becomes the argument.
    void append(KVString const& other);
    /// UTF-8.
    void append(char const* utf8);
    /// Not offered: each prints where it stands and aborts the process.
    [[noreturn]] void append(KVString const& other, unsigned long position, unsigned int length);
    [[noreturn]] void append(unsigned short const* utf16);
    [[noreturn]] void push_back(char character);
    /// Into a null string: the same as `append`.
    void insert(unsigned long position, KVString const& other);
    void erase(unsigned long position, unsigned int length);
    /// Nothing if either string is null.
    void replace(unsigned long position, unsigned int length, KVString const& other);

    // --- Make from this ---

    KVString substr(unsigned long position, unsigned int length) const;
    /// From the start through `position`, inclusive: "abcdef" to 2 is "abc".
    KVString substrTo(unsigned long position) const;
    /// From `position` to the end: at the length the empty string, beyond it the null one.
    KVString substrFrom(unsigned long position) const;
    /// `count` times the text; a count below 1 gives null.
    static KVString repeat(KVString const& text, int count);
    /// Full case mappings of the root locale. A null string stays null.
    KVString toUpper() const;
    KVString toLower() const;
    KVString toCapitalize() const;
    /// Decomposed (NFD), without nonspacing marks, composed again (NFC): "Réel" gives "Reel".
    KVString stringWithoutDiacritics() const;
    /// Without any unit that is of the classes of `isWhitespace` or `isNewline`, wherever it
    /// stands.
    KVString stringWithoutSpacesAndNewlines() const;

    // --- Format ---

    /// printf conversions, and "%@" for an `NSObject const*` (its description; "(null)" for null).
    /// "%n" is refused: it prints nothing and stores nothing.
    void sprintf(__CFString const* format, ...);
    /// printf into at most 2047 bytes of UTF-8; what is longer is cut, at the end of a whole
    /// character.
    void sprintf(char const* format, ...) KV_PRINTF(2, 3);
    void vsprintf(char const* format, std::va_list arguments);
    static KVString ssprintf(char const* format, ...) KV_PRINTF(1, 2);
    static KVString format(short value);
    static KVString format(int value);
    static KVString format(long value);
    /// "%g", in the C locale whatever the process's locale.
    static KVString format(float value);
    static KVString format(double value);

    // --- Classify ---

    /// Extended grapheme clusters (UAX #29).
    unsigned int composedCharacterCount() const;
    /// The same count: shaping, which could join them, is not part of a string.
    unsigned int glyphCount() const;
    /// Whether every unit is of the class; true for an empty or null string. Whitespace is the tab
    /// and the category Zs, a newline is U+000A to U+000D, U+0085, U+2028 or U+2029.
    bool isWhitespace() const noexcept;
    bool isWhitespaceAndNewline() const noexcept;
    bool isNewline() const noexcept;
    /// Whether a UUID (8-4-4-4-12 hexadecimal digits) stands anywhere in the text.
    bool isUUID() const noexcept;

    /// The one stored copy of this text, for the life of the process. Texts are told apart unit by
    /// unit. May be called from any thread.
    static KVString const* intern(KVString const& text);

private:
    /// A copy with `count` units at `position`, both in range, replaced.
    void splice(std::size_t position, std::size_t count, std::u16string_view replacement);

    KVCFRef<CFStringRef> text_;
};

/// As UTF-8.
KV_EXPORT std::ostream& operator<<(std::ostream&, KVString const&);
