#include <korvane/platform/CFString.h>

#include <unicode/brkiter.h>
#include <unicode/normalizer2.h>
#include <unicode/tblcoll.h>
#include <unicode/uchar.h>
#include <unicode/unistr.h>

#include <algorithm>
#include <iterator>
#include <memory>

namespace {

/// A read-only view for ICU, without a copy.
icu::UnicodeString aliasOf(std::u16string_view units)
{
    return {false, units.data(), static_cast<int32_t>(units.size())};
}

CFStringRef createFrom(icu::UnicodeString const& text)
{
    return __CFString::create(
        {text.getBuffer(), static_cast<std::size_t>(std::max(text.length(), 0))});
}

/// The root collator: comparing with it is safe from any thread once it is made.
icu::Collator const* makeCollator(icu::Collator::ECollationStrength strength)
{
    UErrorCode status = U_ZERO_ERROR;
    icu::Collator* const collator = icu::Collator::createInstance(icu::Locale::getRoot(), status);
    if (U_FAILURE(status))
        return nullptr;
    collator->setStrength(strength);
    collator->setAttribute(UCOL_NORMALIZATION_MODE, UCOL_ON, status);
    return collator;
}

CFComparisonResult resultOf(int order) noexcept
{
    return order < 0 ? kCFCompareLessThan : order > 0 ? kCFCompareGreaterThan : kCFCompareEqualTo;
}

/// Characters 0x80 to 0xFF of Mac OS Roman (Unicode, MAPPINGS/VENDORS, ROMAN.TXT).
constexpr char16_t macRoman[128] = {
    0x00C4, 0x00C5, 0x00C7, 0x00C9, 0x00D1, 0x00D6, 0x00DC, 0x00E1, 0x00E0, 0x00E2, 0x00E4, 0x00E3,
    0x00E5, 0x00E7, 0x00E9, 0x00E8, 0x00EA, 0x00EB, 0x00ED, 0x00EC, 0x00EE, 0x00EF, 0x00F1, 0x00F3,
    0x00F2, 0x00F4, 0x00F6, 0x00F5, 0x00FA, 0x00F9, 0x00FB, 0x00FC, 0x2020, 0x00B0, 0x00A2, 0x00A3,
    0x00A7, 0x2022, 0x00B6, 0x00DF, 0x00AE, 0x00A9, 0x2122, 0x00B4, 0x00A8, 0x2260, 0x00C6, 0x00D8,
    0x221E, 0x00B1, 0x2264, 0x2265, 0x00A5, 0x00B5, 0x2202, 0x2211, 0x220F, 0x03C0, 0x222B, 0x00AA,
    0x00BA, 0x03A9, 0x00E6, 0x00F8, 0x00BF, 0x00A1, 0x00AC, 0x221A, 0x0192, 0x2248, 0x2206, 0x00AB,
    0x00BB, 0x2026, 0x00A0, 0x00C0, 0x00C3, 0x00D5, 0x0152, 0x0153, 0x2013, 0x2014, 0x201C, 0x201D,
    0x2018, 0x2019, 0x00F7, 0x25CA, 0x00FF, 0x0178, 0x2044, 0x20AC, 0x2039, 0x203A, 0xFB01, 0xFB02,
    0x2021, 0x00B7, 0x201A, 0x201E, 0x2030, 0x00C2, 0x00CA, 0x00C1, 0x00CB, 0x00C8, 0x00CD, 0x00CE,
    0x00CF, 0x00CC, 0x00D3, 0x00D4, 0xF8FF, 0x00D2, 0x00DA, 0x00DB, 0x00D9, 0x0131, 0x02C6, 0x02DC,
    0x00AF, 0x02D8, 0x02D9, 0x02DA, 0x00B8, 0x02DD, 0x02DB, 0x02C7,
};

} // namespace

CFComparisonResult CFStringCompareUnits(std::u16string_view a, std::u16string_view b,
                                        std::uint32_t flags)
{
    if (a == b)
        return kCFCompareEqualTo;
    static icu::Collator const* const exact = makeCollator(icu::Collator::TERTIARY);
    static icu::Collator const* const caseless = makeCollator(icu::Collator::SECONDARY);
    icu::Collator const* const collator = flags & kCFCompareCaseInsensitive ? caseless : exact;
    // Without ICU's data there is still an order.
    if (!collator)
        return resultOf(a.compare(b));
    UErrorCode status = U_ZERO_ERROR;
    return resultOf(collator->compare(a.data(), static_cast<int32_t>(a.size()), b.data(),
                                      static_cast<int32_t>(b.size()), status));
}

CFStringRef CFStringCreateUppercase(CFStringRef string)
{
    return createFrom(icu::UnicodeString(aliasOf(string->view())).toUpper(icu::Locale::getRoot()));
}

CFStringRef CFStringCreateLowercase(CFStringRef string)
{
    return createFrom(icu::UnicodeString(aliasOf(string->view())).toLower(icu::Locale::getRoot()));
}

CFStringRef CFStringCreateCapitalized(CFStringRef string)
{
    return createFrom(
        icu::UnicodeString(aliasOf(string->view())).toTitle(nullptr, icu::Locale::getRoot()));
}

CFStringRef CFStringCreateWithoutDiacritics(CFStringRef string)
{
    UErrorCode status = U_ZERO_ERROR;
    icu::Normalizer2 const* const nfd = icu::Normalizer2::getNFDInstance(status);
    icu::Normalizer2 const* const nfc = icu::Normalizer2::getNFCInstance(status);
    if (U_FAILURE(status))
        return CFRetain(string);
    icu::UnicodeString const decomposed = nfd->normalize(aliasOf(string->view()), status);
    icu::UnicodeString bare;
    for (int32_t i = 0; i < decomposed.length(); i = decomposed.moveIndex32(i, 1)) {
        UChar32 const character = decomposed.char32At(i);
        if (u_charType(character) != U_NON_SPACING_MARK)
            bare.append(character);
    }
    icu::UnicodeString const composed = nfc->normalize(bare, status);
    return U_FAILURE(status) ? CFRetain(string) : createFrom(composed);
}

std::size_t CFStringGetGraphemeCount(CFStringRef string)
{
    if (string->isASCII() && string->view().find(u'\r') == std::u16string_view::npos)
        return string->length();
    UErrorCode status = U_ZERO_ERROR;
    std::unique_ptr<icu::BreakIterator> const breaks(
        icu::BreakIterator::createCharacterInstance(icu::Locale::getRoot(), status));
    if (U_FAILURE(status))
        return string->length();
    icu::UnicodeString const text = aliasOf(string->view());
    breaks->setText(text);
    std::size_t count = 0;
    while (breaks->next() != icu::BreakIterator::DONE)
        ++count;
    return count;
}

namespace {

/// Whether two neighbours are sure to belong to different clusters, by their classes alone.
bool surelyParts(std::u16string_view units, std::size_t index)
{
    char16_t const before = units[index - 1];
    char16_t const after = units[index];
    if (before < 0x300 && after < 0x300)
        return before != u'\r' || after != u'\n';
    if (U16_IS_SURROGATE(before) || U16_IS_SURROGATE(after))
        return false;
    auto const isOther = [](char16_t unit) {
        return u_getIntPropertyValue(unit, UCHAR_GRAPHEME_CLUSTER_BREAK) == U_GCB_OTHER;
    };
    return isOther(before) && isOther(after);
}

} // namespace

std::size_t CFStringGetGraphemeBoundary(std::u16string_view units, std::size_t start,
                                        std::size_t index)
{
    if (index <= start || index >= units.size() || surelyParts(units, index))
        return std::min(index, units.size());
    UErrorCode status = U_ZERO_ERROR;
    // Costly to make, and not to be used by two threads at once.
    thread_local std::unique_ptr<icu::BreakIterator> const breaks(
        icu::BreakIterator::createCharacterInstance(icu::Locale::getRoot(), status));
    if (!breaks)
        return index;
    icu::UnicodeString const text = aliasOf(units.substr(start));
    breaks->setText(text);
    std::size_t boundary = start;
    while (boundary < index)
        boundary = start + static_cast<std::size_t>(breaks->next());
    return boundary;
}

bool CFCharacterIsWhitespace(char16_t unit) noexcept
{
    if (unit < 0x80)
        return unit == u' ' || unit == u'\t';
    return u_charType(unit) == U_SPACE_SEPARATOR;
}

bool CFCharacterIsNewline(char16_t unit) noexcept
{
    return (unit >= 0x0A && unit <= 0x0D) || unit == 0x85 || unit == 0x2028 || unit == 0x2029;
}

char16_t CFCharacterFromMacRoman(std::uint8_t byte) noexcept
{
    return byte < 0x80 ? byte : macRoman[byte - 0x80];
}

int CFCharacterToMacRoman(char16_t unit) noexcept
{
    if (unit < 0x80)
        return unit;
    auto const* found = std::find(std::begin(macRoman), std::end(macRoman), unit);
    return found == std::end(macRoman) ? -1 : static_cast<int>(0x80 + (found - macRoman));
}
