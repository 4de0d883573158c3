#include <korvane/platform/CFString.h>

#include <algorithm>
#include <cstring>
#include <functional>
#include <new>

namespace {

bool isASCIIText(char const* bytes, std::size_t count) noexcept
{
    // Eight bytes at a time: any byte of 0x80 or above shows its top bit.
    std::uint64_t seen = 0;
    for (; count >= sizeof seen; bytes += sizeof seen, count -= sizeof seen) {
        std::uint64_t eight;
        std::memcpy(&eight, bytes, sizeof eight);
        seen |= eight;
    }
    for (; count > 0; ++bytes, --count)
        seen |= static_cast<unsigned char>(*bytes);
    return (seen & 0x8080808080808080u) == 0;
}

bool isASCIIText(std::u16string_view units) noexcept
{
    char16_t seen = 0;
    for (char16_t unit : units)
        seen |= unit;
    return seen < 0x80;
}

constexpr bool isHighSurrogate(char16_t unit) noexcept
{
    return (unit & 0xFC00) == 0xD800;
}

constexpr bool isLowSurrogate(char16_t unit) noexcept
{
    return (unit & 0xFC00) == 0xDC00;
}

/// Reads one character of well-formed UTF-8 (Unicode, table 3-7) at `at` and moves on;
/// false at anything else.
bool nextCharacter(unsigned char const*& at, unsigned char const* end, char32_t& character) noexcept
{
    unsigned char const lead = *at++;
    if (lead < 0x80) {
        character = lead;
        return true;
    }
    int const trailing = lead >= 0xF0 ? 3 : lead >= 0xE0 ? 2 : 1;
    if (lead < 0xC2 || lead > 0xF4 || end - at < trailing)
        return false;
    character = lead & (0x3Fu >> trailing);
    for (int i = 0; i < trailing; ++i, ++at) {
        if ((*at & 0xC0) != 0x80)
            return false;
        character = character << 6 | (*at & 0x3Fu);
    }
    constexpr char32_t lowest[] = {0x80, 0x800, 0x10000};
    return character >= lowest[trailing - 1] && character <= 0x10FFFF &&
           (character < 0xD800 || character > 0xDFFF);
}

/// UTF-16 never has more units than UTF-8 has bytes. The count of units, or -1 when the bytes are
/// not UTF-8.
std::ptrdiff_t decodeUTF8(char const* bytes, std::size_t count, char16_t* out) noexcept
{
    auto const* at = reinterpret_cast<unsigned char const*>(bytes);
    auto const* const end = at + count;
    char16_t* const first = out;
    while (at != end) {
        char32_t character;
        if (!nextCharacter(at, end, character))
            return -1;
        if (character < 0x10000) {
            *out++ = static_cast<char16_t>(character);
        } else {
            *out++ = static_cast<char16_t>(0xD7C0 + (character >> 10));
            *out++ = static_cast<char16_t>(0xDC00 | (character & 0x3FF));
        }
    }
    return out - first;
}

} // namespace

__CFString* __CFString::allocate(std::size_t length, bool ascii)
{
    if (length > 0x7FFFFFFF)
        throw std::bad_alloc();
    void* const block = ::operator new(sizeof(__CFString) + (length + 1) * sizeof(char16_t));
    auto* const string = new (block) __CFString(length, ascii);
    const_cast<char16_t*>(string->units())[length] = 0;
    return string;
}

__CFString const* __CFString::create(std::u16string_view units)
{
    __CFString* const string = allocate(units.size(), isASCIIText(units));
    std::copy(units.begin(), units.end(), const_cast<char16_t*>(string->units()));
    return string;
}

__CFString const* __CFString::createASCII(std::string_view bytes)
{
    __CFString* const string = allocate(bytes.size(), true);
    char16_t* const units = const_cast<char16_t*>(string->units());
    for (std::size_t i = 0; i < bytes.size(); ++i)
        units[i] = static_cast<unsigned char>(bytes[i]);
    return string;
}

bool __CFString::isEqual(NSObject const* other) const
{
    auto const* string = dynamic_cast<__CFString const*>(other);
    return string && string->view() == view();
}

std::size_t __CFString::hash() const
{
    return std::hash<std::u16string_view>()(view());
}

CFStringRef CFStringCreateWithCharacters(CFAllocatorRef, UniChar const* units, CFIndex count)
{
    return __CFString::create({units, static_cast<std::size_t>(std::max<CFIndex>(count, 0))});
}

CFStringRef CFStringCreateWithBytes(CFAllocatorRef, void const* bytes, CFIndex count,
                                    CFStringEncoding encoding)
{
    auto const* text = static_cast<char const*>(bytes);
    auto const length = static_cast<std::size_t>(std::max<CFIndex>(count, 0));
    if (isASCIIText(text, length))
        return __CFString::createASCII({text, length});
    if (encoding == kCFStringEncodingASCII)
        return nullptr;
    std::u16string units(length, u'\0');
    if (encoding == kCFStringEncodingMacRoman) {
        for (std::size_t i = 0; i < length; ++i)
            units[i] = CFCharacterFromMacRoman(static_cast<std::uint8_t>(text[i]));
        return __CFString::create(units);
    }
    std::ptrdiff_t const decoded = decodeUTF8(text, length, units.data());
    return decoded < 0 ? nullptr
                       : __CFString::create({units.data(), static_cast<std::size_t>(decoded)});
}

CFStringRef CFStringCreateWithCString(CFAllocatorRef allocator, char const* text,
                                      CFStringEncoding encoding)
{
    return text ? CFStringCreateWithBytes(allocator, text, static_cast<CFIndex>(std::strlen(text)),
                                          encoding)
                : nullptr;
}

CFStringRef CFStringGetEmpty() noexcept
{
    // Never destroyed: strings are used by objects that outlive main.
    static CFStringRef const empty = __CFString::createASCII({});
    return empty;
}

CFIndex CFStringGetLength(CFStringRef string) noexcept
{
    return string ? static_cast<CFIndex>(string->length()) : 0;
}

std::size_t CFStringEncodeUTF8(std::u16string_view units, char* out) noexcept
{
    char* const first = out;
    auto put = [&out](char32_t byte) { *out++ = static_cast<char>(byte); };
    for (std::size_t i = 0; i < units.size(); ++i) {
        char32_t character = units[i];
        if (character < 0x80) {
            put(character);
            continue;
        }
        if (character < 0x800) {
            put(0xC0 | character >> 6);
            put(0x80 | (character & 0x3F));
            continue;
        }
        if (isHighSurrogate(units[i]) && i + 1 < units.size() && isLowSurrogate(units[i + 1])) {
            character = 0x10000 + ((character & 0x3FF) << 10) + (units[++i] & 0x3FFu);
            put(0xF0 | character >> 18);
            put(0x80 | (character >> 12 & 0x3F));
        } else {
            if (character >= 0xD800 && character <= 0xDFFF)
                character = 0xFFFD;
            put(0xE0 | character >> 12);
        }
        put(0x80 | (character >> 6 & 0x3F));
        put(0x80 | (character & 0x3F));
    }
    return static_cast<std::size_t>(out - first);
}

std::string CFStringGetUTF8(CFStringRef string)
{
    std::string result;
    if (!string)
        return result;
    if (string->isASCII()) {
        result.resize(string->length());
        char16_t const* const units = string->units();
        char* const out = result.data();
        for (std::size_t i = 0, n = string->length(); i < n; ++i)
            out[i] = static_cast<char>(units[i]);
        return result;
    }
    result.resize(CFStringGetMaximumUTF8Length(string->length()));
    result.resize(CFStringEncodeUTF8(string->view(), result.data()));
    return result;
}

bool CFStringIsWellFormed(std::u16string_view units) noexcept
{
    for (std::size_t i = 0; i < units.size(); ++i) {
        if (isLowSurrogate(units[i]))
            return false;
        if (!isHighSurrogate(units[i]))
            continue;
        if (++i == units.size() || !isLowSurrogate(units[i]))
            return false;
    }
    return true;
}
