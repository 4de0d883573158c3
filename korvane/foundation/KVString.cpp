#include <korvane/foundation/KVString.h>

#include <korvane/foundation/KVLocale_p.h>
#include <korvane/foundation/KVPrint.h>

#include <algorithm>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <limits>
#include <mutex>
#include <new>
#include <ostream>
#include <set>

namespace {

/// Positions and lengths that are clamped to a text.
struct Run {
    std::size_t position;
    std::size_t length;
};

Run clampRun(std::size_t size, unsigned long position, unsigned long length) noexcept
{
    std::size_t const from = std::min<std::size_t>(position, size);
    return {from, std::min<std::size_t>(length, size - from)};
}

template <class Unit>
std::size_t lengthOf(Unit const* text) noexcept
{
    std::size_t length = 0;
    while (text[length] != 0)
        ++length;
    return length;
}

template <class T>
T* mallocArray(std::size_t count)
{
    void* const block = std::malloc(count * sizeof(T));
    if (!block)
        throw std::bad_alloc();
    return static_cast<T*>(block);
}

KVCFRef<CFStringRef> adoptText(CFStringRef string) noexcept
{
    return KVCFRef<CFStringRef>::adopt(string);
}

KVCFRef<CFStringRef> textOf(std::string_view utf8)
{
    return adoptText(CFStringCreateWithBytes(
        nullptr, utf8.data(), static_cast<CFIndex>(utf8.size()), kCFStringEncodingUTF8));
}

/// The text of C strings: null and empty are the shared empty string.
KVCFRef<CFStringRef> textOf(char const* utf8)
{
    return utf8 && *utf8 ? textOf(std::string_view(utf8)) : KVCFRef(CFStringGetEmpty());
}

CFStringRef copyLocalized(CFStringRef key, CFBundleRef bundle, CFStringRef table) noexcept
{
    return CFBundleCopyLocalizedString(bundle, key, key, table);
}

/// The largest prefix of `text` that does not cut a UTF-8 sequence in two.
std::size_t wholeCharacters(char const* text, std::size_t length) noexcept
{
    auto byte = [text](std::size_t i) { return static_cast<unsigned char>(text[i]); };
    std::size_t lead = length;
    while (lead > 0 && length - lead < 3 && (byte(lead - 1) & 0xC0) == 0x80)
        --lead;
    if (lead == 0 || byte(lead - 1) < 0xC0)
        return length;
    --lead;
    std::size_t const needed = byte(lead) >= 0xF0 ? 4 : byte(lead) >= 0xE0 ? 3 : 2;
    return length - lead < needed ? lead : length;
}

bool isHexDigit(char16_t c) noexcept
{
    return (c >= u'0' && c <= u'9') || (c >= u'a' && c <= u'f') || (c >= u'A' && c <= u'F');
}

bool startsWithUUID(std::u16string_view text) noexcept
{
    constexpr std::size_t length = 36;
    if (text.size() < length)
        return false;
    for (std::size_t i = 0; i < length; ++i) {
        bool const isDash = i == 8 || i == 13 || i == 18 || i == 23;
        if (isDash ? text[i] != u'-' : !isHexDigit(text[i]))
            return false;
    }
    return true;
}

/// Runs a printf through a growing buffer, in the C locale.
template <class... Arguments>
void appendFormatted(std::string& out, std::string const& format, Arguments... arguments)
{
    kv::CNumericLocale const locale;
#pragma GCC diagnostic push
#pragma GCC diagnostic ignored "-Wformat-nonliteral"
#pragma GCC diagnostic ignored "-Wformat-security"
    int const length = std::snprintf(nullptr, 0, format.c_str(), arguments...);
    if (length <= 0)
        return;
    std::size_t const start = out.size();
    out.resize(start + static_cast<std::size_t>(length) + 1);
    std::snprintf(out.data() + start, static_cast<std::size_t>(length) + 1, format.c_str(),
                  arguments...);
#pragma GCC diagnostic pop
    out.pop_back();
}

/// One conversion of a format, "%-8.3ld": flags, width and precision in `head` ("%-8.3"), length
/// modifier and letter apart.
class Conversion {
public:
    /// `at` stands behind the "%"; it is moved behind the conversion.
    Conversion(char const*& at, std::va_list& arguments) : head_("%")
    {
        take(at, "-+ #0'");
        takeNumber(at, arguments);
        if (*at == '.') {
            head_ += *at++;
            takeNumber(at, arguments);
        }
        while (*at && std::strchr("hlLqjzt", *at))
            modifier_ += *at++;
        letter_ = *at ? *at++ : '\0';
    }

    void print(std::string& out, std::va_list& arguments) const;

private:
    void take(char const*& at, char const* characters)
    {
        while (*at && std::strchr(characters, *at))
            head_ += *at++;
    }
    void takeNumber(char const*& at, std::va_list& arguments)
    {
        if (*at != '*')
            return take(at, "0123456789");
        ++at;
        head_ += std::to_string(va_arg(arguments, int));
    }
    bool isLong() const { return !modifier_.empty() && modifier_.front() != 'h'; }

    std::string head_;
    std::string modifier_;
    char letter_;
};

void Conversion::print(std::string& out, std::va_list& arguments) const
{
    switch (letter_) {
    case 'd':
    case 'i':
    case 'u':
    case 'o':
    case 'x':
    case 'X':
        // On this platform all modifiers above `int` mean 64 bits.
        if (isLong())
            appendFormatted(out, head_ + "ll" + letter_, va_arg(arguments, long long));
        else
            appendFormatted(out, head_ + modifier_ + letter_, va_arg(arguments, int));
        break;
    case 'e':
    case 'E':
    case 'f':
    case 'F':
    case 'g':
    case 'G':
    case 'a':
    case 'A':
        if (modifier_ == "L")
            appendFormatted(out, head_ + "L" + letter_, va_arg(arguments, long double));
        else
            appendFormatted(out, head_ + letter_, va_arg(arguments, double));
        break;
    case 'c':
        appendFormatted(out, head_ + "c", va_arg(arguments, int));
        break;
    case 'C':
        out += KVString::fromUTF16(std::u16string(1, static_cast<char16_t>(va_arg(arguments, int))))
                   .toUTF8();
        break;
    case 's': {
        auto const* text = va_arg(arguments, char const*);
        appendFormatted(out, head_ + "s", text ? text : "(null)");
        break;
    }
    case 'S':
        out += KVString(va_arg(arguments, unsigned short const*)).toUTF8();
        break;
    case 'p':
        appendFormatted(out, head_ + "p", va_arg(arguments, void const*));
        break;
    case '@': {
        auto const* object = va_arg(arguments, NSObject const*);
        out += object ? object->description().toUTF8() : "(null)";
        break;
    }
    case 'n':
        // Storing through an argument is refused; the argument is still stepped over.
        static_cast<void>(va_arg(arguments, void*));
        break;
    case '%':
        out += '%';
        break;
    default:
        if (letter_)
            out += letter_;
    }
}

} // namespace

namespace kv {

std::string formatWithObjects(std::string const& format, std::va_list arguments)
{
    std::va_list copy;
    va_copy(copy, arguments);
    std::string out;
    for (char const* at = format.c_str(); *at;) {
        if (*at != '%') {
            out += *at++;
            continue;
        }
        Conversion(++at, copy).print(out, copy);
    }
    va_end(copy);
    return out;
}

} // namespace kv

// --- Make ---

KVString::KVString(char const* utf8) : text_(textOf(utf8)) {}

KVString::KVString(std::string const& utf8) : text_(textOf(std::string_view(utf8))) {}

KVString::KVString(unsigned short const* utf16)
{
    set(utf16);
}

KVString::KVString(char16_t const* utf16)
{
    set(utf16);
}

KVString::KVString(__CFString const* string, bool) noexcept : text_(string) {}

KVString::KVString(__CFString const* key, char const* bundleId)
{
    if (bundleId)
        *this = KVString(key, KVString(bundleId).cf_str());
}

KVString::KVString(__CFString const* key, __CFString const* bundleId)
    : KVString(key, CFBundleGetBundleWithIdentifier(bundleId), static_cast<CFStringRef>(nullptr))
{}

KVString::KVString(__CFString const* key, __CFBundle* bundle, __CFString const* table)
    : text_(adoptText(copyLocalized(key, bundle, table)))
{}

KVString::KVString(char const* key, char const* bundleId)
    : KVString(key, bundleId, static_cast<char const*>(nullptr))
{}

KVString::KVString(char const* key, char const* bundleId, char const* table)
{
    if (bundleId)
        *this = KVString(key, CFBundleGetBundleWithIdentifier(KVString(bundleId).cf_str()), table);
}

KVString::KVString(char const* key, __CFBundle* bundle, char const* table)
{
    if (key)
        text_ =
            adoptText(copyLocalized(textOf(key), bundle, table ? textOf(table).get() : nullptr));
}

KVString KVString::adopt(CFStringRef string) noexcept
{
    KVString result;
    result.text_ = adoptText(string);
    return result;
}

KVString KVString::fromUTF8(std::string_view utf8)
{
    return adopt(textOf(utf8).leak());
}

KVString KVString::fromUTF16(std::u16string_view units)
{
    return adopt(__CFString::create(units));
}

void KVString::set(char const* utf8)
{
    text_ = textOf(utf8);
}

void KVString::set(char const* utf8, unsigned int length)
{
    text_ = textOf(std::string_view(utf8 ? utf8 : "", utf8 ? length : 0));
}

void KVString::set(unsigned short const* utf16)
{
    set(reinterpret_cast<char16_t const*>(utf16));
}

void KVString::set(unsigned short const* utf16, unsigned int length)
{
    set(reinterpret_cast<char16_t const*>(utf16), length);
}

void KVString::set(char16_t const* utf16)
{
    text_ = utf16 ? adoptText(__CFString::create({utf16, lengthOf(utf16)})) : nullptr;
}

void KVString::set(char16_t const* utf16, unsigned int length)
{
    text_ = utf16 ? adoptText(__CFString::create({utf16, length})) : nullptr;
}

// --- Read ---

char* KVString::createCStr() const
{
    std::size_t const length = size();
    if (!text_ || text_->isASCII()) {
        char* const out = mallocArray<char>(length + 1);
        char16_t const* const units = u_str();
        for (std::size_t i = 0; i < length; ++i)
            out[i] = static_cast<char>(units[i]);
        out[length] = '\0';
        return out;
    }
    char* const out = mallocArray<char>(CFStringGetMaximumUTF8Length(length) + 1);
    out[CFStringEncodeUTF8(view(), out)] = '\0';
    return out;
}

char* KVString::createUTF8Str() const
{
    return text_ ? createCStr() : nullptr;
}

unsigned short* KVString::createUniStr() const
{
    if (!text_)
        return nullptr;
    auto* const out = mallocArray<unsigned short>(std::size_t(size()) + 1);
    std::memcpy(out, text_->units(), (std::size_t(size()) + 1) * sizeof *out);
    return out;
}

// --- Four-character codes ---

void KVString::setOSType(unsigned int code)
{
    std::u16string text = u"'";
    for (; code != 0; code <<= 8)
        text += CFCharacterFromMacRoman(static_cast<std::uint8_t>(code >> 24));
    text += u'\'';
    *this = fromUTF16(text);
}

unsigned int KVString::get_OSType() const noexcept
{
    std::u16string_view const text = view().substr(0, 6);
    if (text.size() < 6 || text.front() != u'\'' || text.back() != u'\'')
        return 0;
    unsigned int code = 0;
    for (char16_t unit : text.substr(1, 4)) {
        int const byte = CFCharacterToMacRoman(unit);
        if (byte < 0)
            return 0;
        code = code << 8 | static_cast<unsigned int>(byte);
    }
    return code;
}

// --- Compare and search ---

namespace {

int compareTexts(KVString const& a, KVString const& b, std::uint32_t flags)
{
    if (a.isNull() || b.isNull())
        return int(b.isNull()) - int(a.isNull());
    return CFStringCompareUnits(a.view(), b.view(), flags);
}

int compareRun(KVString const& a, unsigned long position, unsigned int length, KVString const& b,
               std::uint32_t flags)
{
    if (a.isNull() || b.isNull())
        return int(b.isNull()) - int(a.isNull());
    Run const run = clampRun(a.size(), position, length);
    return CFStringCompareUnits(a.view().substr(run.position, run.length), b.view(), flags);
}

constexpr std::uint32_t localized = kCFCompareLocalized;
constexpr std::uint32_t caseless = kCFCompareLocalized | kCFCompareCaseInsensitive;

} // namespace

int KVString::compare(KVString const& other) const
{
    return compareTexts(*this, other, localized);
}

int KVString::compare(unsigned long position, unsigned int length, KVString const& other) const
{
    return compareRun(*this, position, length, other, localized);
}

int KVString::caseInsensitiveCompare(KVString const& other) const
{
    return compareTexts(*this, other, caseless);
}

int KVString::caseInsensitiveCompare(unsigned long position, unsigned int length,
                                     KVString const& other) const
{
    return compareRun(*this, position, length, other, caseless);
}

int KVString::compare(unsigned long, unsigned int, KVString const&, unsigned long) const
{
    _KVShouldNotBeReached(__FILE__, __LINE__, "");
}

int KVString::caseInsensitiveCompare(unsigned long, unsigned int, KVString const&,
                                     unsigned long) const
{
    _KVShouldNotBeReached(__FILE__, __LINE__, "");
}

unsigned int KVString::find(KVString const& needle) const noexcept
{
    if (needle.empty())
        return npos;
    // "Not found" is all ones in both widths.
    return static_cast<unsigned int>(view().find(needle.view()));
}

// --- Change ---

void KVString::splice(std::size_t position, std::size_t count, std::u16string_view replacement)
{
    std::u16string text;
    text.reserve(size() - count + replacement.size());
    text.append(view(), 0, position);
    text.append(replacement);
    text.append(view(), position + count);
    *this = fromUTF16(text);
}

void KVString::append(KVString const& other)
{
    if (other.isNull())
        return;
    if (isNull())
        text_ = other.text_;
    else
        splice(size(), 0, other.view());
}

void KVString::append(char const* utf8)
{
    if (utf8)
        append(KVString(utf8));
}

void KVString::append(KVString const&, unsigned long, unsigned int)
{
    _KVShouldNotBeReached(__FILE__, __LINE__, "");
}

void KVString::append(unsigned short const*)
{
    _KVShouldNotBeReached(__FILE__, __LINE__, "");
}

void KVString::push_back(char)
{
    _KVShouldNotBeReached(__FILE__, __LINE__, "");
}

void KVString::insert(unsigned long position, KVString const& other)
{
    if (isNull() || other.isNull())
        return append(other);
    splice(clampRun(size(), position, 0).position, 0, other.view());
}

void KVString::erase(unsigned long position, unsigned int length)
{
    if (isNull() || length == 0)
        return;
    Run const run = clampRun(size(), position, length);
    splice(run.position, run.length, {});
}

void KVString::replace(unsigned long position, unsigned int length, KVString const& other)
{
    if (isNull() || other.isNull())
        return;
    Run const run = clampRun(size(), position, length);
    splice(run.position, run.length, other.view());
}

// --- Make from this ---

KVString KVString::substr(unsigned long position, unsigned int length) const
{
    if (isNull())
        return {};
    Run const run = clampRun(size(), position, length);
    return fromUTF16(view().substr(run.position, run.length));
}

KVString KVString::substrTo(unsigned long position) const
{
    return substr(0, position < size() ? static_cast<unsigned int>(position) + 1 : size());
}

KVString KVString::substrFrom(unsigned long position) const
{
    return position > size() ? KVString() : substr(position, size());
}

KVString KVString::repeat(KVString const& text, int count)
{
    if (count < 1 || text.isNull())
        return {};
    std::uint64_t const length = std::uint64_t(text.size()) * static_cast<unsigned int>(count);
    if (length > static_cast<std::uint64_t>(std::numeric_limits<std::int32_t>::max()))
        throw std::bad_alloc();
    std::u16string repeated;
    repeated.reserve(length);
    for (int i = 0; i < count; ++i)
        repeated.append(text.view());
    return fromUTF16(repeated);
}

KVString KVString::toUpper() const
{
    return text_ ? adopt(CFStringCreateUppercase(text_)) : KVString();
}

KVString KVString::toLower() const
{
    return text_ ? adopt(CFStringCreateLowercase(text_)) : KVString();
}

KVString KVString::toCapitalize() const
{
    return text_ ? adopt(CFStringCreateCapitalized(text_)) : KVString();
}

KVString KVString::stringWithoutDiacritics() const
{
    return text_ ? adopt(CFStringCreateWithoutDiacritics(text_)) : KVString();
}

KVString KVString::stringWithoutSpacesAndNewlines() const
{
    if (isNull())
        return {};
    std::u16string kept(view());
    std::erase_if(kept, [](char16_t unit) {
        return CFCharacterIsWhitespace(unit) || CFCharacterIsNewline(unit);
    });
    return fromUTF16(kept);
}

// --- Format ---

void KVString::sprintf(__CFString const* format, ...)
{
    std::va_list arguments;
    va_start(arguments, format);
    text_ = textOf(std::string_view(kv::formatWithObjects(CFStringGetUTF8(format), arguments)));
    va_end(arguments);
}

void KVString::sprintf(char const* format, ...)
{
    std::va_list arguments;
    va_start(arguments, format);
    vsprintf(format, arguments);
    va_end(arguments);
}

void KVString::vsprintf(char const* format, std::va_list arguments)
{
    char buffer[2048];
    kv::CNumericLocale const locale;
    int const length = std::vsnprintf(buffer, sizeof buffer, format, arguments);
    if (length < static_cast<int>(sizeof buffer))
        return set(buffer, length < 0 ? 0 : static_cast<unsigned int>(length));
    set(buffer, static_cast<unsigned int>(wholeCharacters(buffer, sizeof buffer - 1)));
}

KVString KVString::ssprintf(char const* format, ...)
{
    KVString result;
    std::va_list arguments;
    va_start(arguments, format);
    result.vsprintf(format, arguments);
    va_end(arguments);
    return result;
}

KVString KVString::format(short value)
{
    return ssprintf("%d", value);
}

KVString KVString::format(int value)
{
    return ssprintf("%d", value);
}

KVString KVString::format(long value)
{
    return ssprintf("%ld", value);
}

KVString KVString::format(float value)
{
    return ssprintf("%g", static_cast<double>(value));
}

KVString KVString::format(double value)
{
    return ssprintf("%lg", value);
}

// --- Classify ---

unsigned int KVString::composedCharacterCount() const
{
    return text_ ? static_cast<unsigned int>(CFStringGetGraphemeCount(text_)) : 0;
}

unsigned int KVString::glyphCount() const
{
    return composedCharacterCount();
}

bool KVString::isWhitespace() const noexcept
{
    return std::ranges::all_of(view(), CFCharacterIsWhitespace);
}

bool KVString::isWhitespaceAndNewline() const noexcept
{
    return std::ranges::all_of(view(), [](char16_t unit) {
        return CFCharacterIsWhitespace(unit) || CFCharacterIsNewline(unit);
    });
}

bool KVString::isNewline() const noexcept
{
    return std::ranges::all_of(view(), CFCharacterIsNewline);
}

bool KVString::isUUID() const noexcept
{
    std::u16string_view const text = view();
    for (std::size_t i = 0; i < text.size(); ++i)
        if (startsWithUUID(text.substr(i)))
            return true;
    return false;
}

KVString const* KVString::intern(KVString const& text)
{
    struct Table {
        std::mutex mutex;
        std::set<KVString> texts;
    };
    static auto& table = *new Table;
    std::scoped_lock const lock(table.mutex);
    return &*table.texts.insert(text).first;
}

std::ostream& operator<<(std::ostream& stream, KVString const& text)
{
    return stream << text.toUTF8();
}
