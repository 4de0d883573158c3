#include <korvane/korvane.h>

#include <gtest/gtest.h>

#include <clocale>
#include <cstdlib>
#include <memory>
#include <set>
#include <thread>

namespace {

template <class T>
std::string takeText(T* text)
{
    std::unique_ptr<T, decltype(&std::free)> const owned(text, &std::free);
    return reinterpret_cast<char const*>(owned.get());
}

} // namespace

TEST(KVString, NullAndEmptyAreBothEmptyAndDiffer)
{
    KVString const null;
    KVString const empty("");
    EXPECT_TRUE(null.empty() && null.isNull());
    EXPECT_TRUE(empty.empty() && !empty.isNull());
    EXPECT_LT(null.compare(empty), 0);
    EXPECT_GT(empty.compare(null), 0);
    EXPECT_EQ(null.compare(KVString()), 0);
    ASSERT_NE(null.cf_str(), nullptr);
    EXPECT_EQ(null.cf_str()->length(), 0u);
    EXPECT_EQ(null.u_str(), nullptr);
    EXPECT_EQ(null.createUTF8Str(), nullptr);
    EXPECT_EQ(null.createUniStr(), nullptr);
    EXPECT_EQ(takeText(null.createCStr()), "");
    EXPECT_EQ(takeText(empty.createUTF8Str()), "");
}

TEST(KVString, WhatEachConstructorMakesOfNothing)
{
    EXPECT_FALSE(KVString(static_cast<char const*>(nullptr)).isNull());
    EXPECT_FALSE(KVString(nullptr).isNull());
    EXPECT_TRUE(KVString(static_cast<unsigned short const*>(nullptr)).isNull());
    EXPECT_TRUE(KVString(static_cast<CFStringRef>(nullptr)).isNull());
    EXPECT_TRUE(KVString("key", static_cast<char const*>(nullptr)).isNull());
    EXPECT_TRUE(KVString(static_cast<char const*>(nullptr), "bundle").isNull());
    KVString set("text");
    set.set(static_cast<CFStringRef>(nullptr));
    EXPECT_TRUE(set.isNull());
}

TEST(KVString, LocalisedTextComesBackAsItsKey)
{
    KVString const key("Open…");
    EXPECT_EQ(KVString(key.cf_str(), "org.korvane.host"), key);
    EXPECT_EQ(KVString("Open…", "org.korvane.host", "Menus"), key);
    EXPECT_EQ(KVString("Open…", static_cast<CFBundleRef>(nullptr), "Menus"), key);
}

TEST(KVString, UTF8InAndOut)
{
    struct Row {
        std::string utf8;
        std::u16string units;
    } const rows[] = {
        {"\x7F", u"\u007F"},
        {"\xC2\x80", u"\u0080"},
        {"\xED\x9F\xBF", u"\uD7FF"},
        {"\xF0\x90\x80\x80", u"\U00010000"},
        {"\xF4\x8F\xBF\xBF", u"\U0010FFFF"},
        {"nine bytes\xC3\xA9", u"nine bytes\u00E9"},
    };
    for (Row const& row : rows) {
        KVString const text(row.utf8);
        EXPECT_EQ(text.view(), row.units);
        EXPECT_EQ(text.size(), row.units.size());
        EXPECT_EQ(text.toUTF8(), row.utf8);
        EXPECT_EQ(takeText(text.createCStr()), row.utf8);
        EXPECT_EQ(KVString(row.units.c_str()).toUTF8(), row.utf8);
    }
}

TEST(KVString, MalformedUTF8GivesTheNullString)
{
    char const* const rows[] = {
        "\x80",             // a continuation alone
        "\xC0\x80",         // overlong zero
        "\xF0\x8F\xBF\xBF", // overlong
        "\xED\xA0\x80",     // a surrogate
        "\xF4\x90\x80\x80", // above U+10FFFF
        "\xF5\x80\x80\x80", // no such lead
        "ab\xC3",           // cut short
        "ab\xF0\x9F\x98",   // cut short
        "\xC3(",            // no continuation
    };
    for (char const* row : rows)
        EXPECT_TRUE(KVString(row).isNull()) << row;
}

TEST(KVString, HalfASurrogatePairLeavesAsReplacementCharacter)
{
    for (std::u16string units : {u"a\xD83D", u"a\xDE00", u"a\xD83D\xD83D"}) {
        std::string utf8 = KVString(units.c_str());
        EXPECT_EQ(utf8.substr(0, 4), "a\xEF\xBF\xBD");
        EXPECT_FALSE(CFStringIsWellFormed(units));
        EXPECT_GE(utf8.size(), units.size());
    }
    EXPECT_TRUE(CFStringIsWellFormed(u"a\xD83D\xDE00"));
}

TEST(KVString, OSTypeRoundTripsAllFourByteCodes)
{
    KVString text;
    for (unsigned int code : {0x61626364u, 0xA96E616Du, 0x80FF01DBu, 0xFFFFFFFFu}) {
        text.setOSType(code);
        EXPECT_EQ(text.size(), 6u);
        EXPECT_EQ(text.get_OSType(), code);
    }
    std::set<char16_t> characters;
    for (int byte = 0; byte < 256; ++byte) {
        char16_t const unit = CFCharacterFromMacRoman(static_cast<std::uint8_t>(byte));
        EXPECT_EQ(CFCharacterToMacRoman(unit), byte);
        characters.insert(unit);
    }
    EXPECT_EQ(characters.size(), 256u);
}

TEST(KVString, OSTypeOfOtherTexts)
{
    KVString text;
    text.setOSType(0);
    EXPECT_EQ(text.toUTF8(), "''");
    text.setOSType(0x61620000);
    text.setOSType(0x61620000);
    EXPECT_EQ(text.toUTF8(), "'ab'");
    for (char const* none : {"'ab'", "abcd", "'abcd", "'abc'", "'abcde'", "'ab\u4E2Dd'"})
        EXPECT_EQ(KVString(none).get_OSType(), 0u) << none;
    EXPECT_EQ(KVString("'abcd'x").get_OSType(), 0x61626364u);
    EXPECT_EQ(KVString().get_OSType(), 0u);
}

TEST(KVString, ComparesByRootCollation)
{
    struct Row {
        char const* a;
        char const* b;
        int order;
        int caseless;
    } const rows[] = {
        {"abc", "abc", 0, 0},        {"abc", "abd", -1, -1},
        {"abc", "ABC", -1, 0},       // lower case first, as the root collation has it
        {"Zebra", "apple", 1, 1},    // not by code
        {"r\u00E9el", "reel", 1, 1}, // accents count
        {"e\u0301", "\u00E9", 0, 0}, // canonically equal
        {"", "a", -1, -1},
    };
    auto sign = [](int order) { return (order > 0) - (order < 0); };
    for (Row const& row : rows) {
        EXPECT_EQ(sign(KVString(row.a).compare(KVString(row.b))), row.order) << row.a;
        EXPECT_EQ(sign(KVString(row.b).compare(KVString(row.a))), -row.order) << row.a;
        EXPECT_EQ(sign(KVString(row.a).caseInsensitiveCompare(KVString(row.b))), row.caseless)
            << row.a;
    }
    KVString const text("one two");
    EXPECT_EQ(text.compare(4, 3, "two"), 0);
    EXPECT_EQ(text.caseInsensitiveCompare(4, 99, "TWO"), 0);
    EXPECT_GT(text.compare(0, 7, "one"), 0);
    EXPECT_EQ(text.compare(99, 1, ""), 0);
}

TEST(KVString, OperatorsTellApartWhatReadsTheSame)
{
    KVString const composed("\u00E9");
    KVString const decomposed("e\u0301");
    EXPECT_EQ(composed.compare(decomposed), 0);
    EXPECT_NE(composed, decomposed);
    EXPECT_LT(decomposed, composed);
    EXPECT_NE(KVString(), KVString(""));
    EXPECT_LT(KVString(), KVString(""));
    EXPECT_EQ(KVString("a").compare("a\u0001"), 0); // a control character has no weight
    EXPECT_NE(KVString("a"), KVString("a\u0001"));
    EXPECT_EQ(KVString::intern("track"), KVString::intern(KVString("track")));
    EXPECT_NE(KVString::intern("e\u0301"), KVString::intern("\u00E9"));
    EXPECT_NE(KVString::intern(KVString()), KVString::intern(""));
}

TEST(KVString, FindsUnitByUnit)
{
    KVString const text("a\U0001F600banana");
    EXPECT_EQ(text.find("banana"), 3u);
    EXPECT_EQ(text.find("ana"), 4u);
    EXPECT_EQ(text.find("x"), 0xFFFFFFFFu);
    EXPECT_EQ(text.find(""), 0xFFFFFFFFu);
    EXPECT_EQ(KVString().find("a"), 0xFFFFFFFFu);
}

TEST(KVString, CutsAndChangesWithinTheText)
{
    KVString const text("abcdef");
    EXPECT_EQ(text.substrTo(2), "abc");
    EXPECT_EQ(text.substrTo(~0ul), text);
    EXPECT_EQ(text.substrFrom(4), "ef");
    EXPECT_FALSE(text.substrFrom(6).isNull());
    EXPECT_TRUE(text.substrFrom(7).isNull());
    EXPECT_EQ(text.substr(4, 0xFFFFFFFF), "ef");
    EXPECT_EQ(text.substr(99, 1), "");

    struct Row {
        unsigned long position;
        unsigned int length;
        char const* erased;
        char const* replaced;
        char const* inserted;
    } const rows[] = {
        {0, 1, "bcdef", "-bcdef", "-abcdef"},   {2, 3, "abf", "ab-f", "ab-cdef"},
        {5, 99, "abcde", "abcde-", "abcde-f"},  {99, 1, "abcdef", "abcdef-", "abcdef-"},
        {3, 0, "abcdef", "abc-def", "abc-def"},
    };
    for (Row const& row : rows) {
        KVString erased = text, replaced = text, inserted = text;
        erased.erase(row.position, row.length);
        replaced.replace(row.position, row.length, "-");
        inserted.insert(row.position, "-");
        EXPECT_EQ(erased, row.erased);
        EXPECT_EQ(replaced, row.replaced);
        EXPECT_EQ(inserted, row.inserted);
    }
    EXPECT_EQ(text, "abcdef");
}

TEST(KVString, ChangingWithNulls)
{
    KVString text;
    text.append(KVString());
    EXPECT_TRUE(text.isNull());
    text.replace(0, 0, "a");
    EXPECT_TRUE(text.isNull());
    text.insert(5, "ab");
    EXPECT_EQ(text, "ab");
    text.append(KVString());
    text.insert(0, KVString());
    text.replace(0, 1, KVString());
    EXPECT_EQ(text, "ab");
    text.append("cd");
    EXPECT_EQ(text, "abcd");
}

TEST(KVString, Repeats)
{
    EXPECT_EQ(KVString::repeat("ab", 3), "ababab");
    EXPECT_TRUE(KVString::repeat("ab", 0).isNull());
    EXPECT_TRUE(KVString::repeat("ab", -1).isNull());
    EXPECT_THROW(KVString::repeat("ab", 0x7FFFFFFF), std::bad_alloc);
}

TEST(KVString, EntriesThatAreNotOfferedAbort)
{
    char const* const report = "";
    KVString text("a");
    EXPECT_DEATH(text.compare(0, 1, text, 0), report);
    EXPECT_DEATH(text.caseInsensitiveCompare(0, 1, text, 0), report);
    EXPECT_DEATH(text.append(text, 0ul, 1u), report);
    EXPECT_DEATH(text.append(static_cast<unsigned short const*>(nullptr)), report);
    EXPECT_DEATH(text.push_back('a'), report);
    // The words go to standard output, which a death test does not see.
    EXPECT_EXIT(
        {
            dup2(STDERR_FILENO, STDOUT_FILENO);
            text.push_back('a');
        },
        testing::KilledBySignal(SIGABRT),
        "File .*, line [0-9]+ should not have been reached:\n\t$");
}

TEST(KVString, MapsCaseAndDiacritics)
{
    EXPECT_EQ(KVString("stra\u00DFe").toUpper(), "STRASSE");
    EXPECT_EQ(KVString("\u00C9COLE I").toLower().toUTF8(), "\u00E9cole i");
    EXPECT_EQ(KVString("the LAST reel").toCapitalize().toUTF8(), "The Last Reel");
    EXPECT_EQ(KVString("\u00C5ngstr\u00F6m e\u0301").stringWithoutDiacritics().toUTF8(),
              "Angstrom e");
    EXPECT_EQ(KVString(" a\t\u00A0b\u2028\r\nc ").stringWithoutSpacesAndNewlines().toUTF8(), "abc");
    EXPECT_TRUE(KVString().toUpper().isNull());
}

TEST(KVString, CountsAndClassifies)
{
    EXPECT_EQ(KVString("ae\u0301\U0001F1EB\U0001F1F7").composedCharacterCount(), 3u);
    EXPECT_EQ(KVString("a\r\nb").glyphCount(), 3u);
    struct Row {
        char const* text;
        bool whitespace, newline, both;
    } const rows[] = {
        {"", true, true, true},
        {" \t\u3000", true, false, true},
        {"\n\r\u0085\u2029", false, true, true},
        {" \n", false, false, true},
        {" a", false, false, false},
        {"\u200B", false, false, false},
    };
    for (Row const& row : rows) {
        EXPECT_EQ(KVString(row.text).isWhitespace(), row.whitespace) << row.text;
        EXPECT_EQ(KVString(row.text).isNewline(), row.newline) << row.text;
        EXPECT_EQ(KVString(row.text).isWhitespaceAndNewline(), row.both) << row.text;
    }
    EXPECT_TRUE(KVString("id {01234567-89ab-CDEF-0123-456789abcdef}").isUUID());
    EXPECT_FALSE(KVString("01234567-89ab-CDEF-0123-456789abcde").isUUID());
    EXPECT_FALSE(KVString("0123456789abCDEF0123456789abcdef0000").isUUID());
}

TEST(KVString, FormatsInTheCLocaleAndCutsAtAWholeCharacter)
{
    EXPECT_EQ(KVString::format(short(-3)), "-3");
    EXPECT_EQ(KVString::format(-2147483647 - 1), "-2147483648");
    EXPECT_EQ(KVString::format(1L << 40), "1099511627776");
    EXPECT_EQ(KVString::format(0.5f), "0.5");
    EXPECT_EQ(KVString::format(1e-7), "1e-07");
    if (std::setlocale(LC_NUMERIC, "de_DE.UTF-8")) {
        EXPECT_EQ(KVString::format(0.5), "0.5");
        std::setlocale(LC_NUMERIC, "C");
    }
    std::string const longText(5000, 'x');
    EXPECT_EQ(KVString::ssprintf("%s", longText.c_str()).size(), 2047u);
    // The 2047th byte would be the first of two.
    std::string const accents = std::string(2046, 'x') + "\u00E9\u00E9";
    EXPECT_EQ(KVString::ssprintf("%s", accents.c_str()).size(), 2046u);
}

TEST(KVString, PlatformFormatsTakeObjectsAndRefuseToStore)
{
    KVString text;
    auto const number = KVMakeRef<NSNumber>(0.5);
    int stored = 7;
    text.sprintf(KVString("%@ %@ %5.1f|%-4d|%lld %s%n %%").cf_str(), number.get(),
                 static_cast<NSObject const*>(nullptr), 2.25, 3, 1LL << 40, "s", &stored);
    EXPECT_EQ(text.toUTF8(), "0.5 (null)   2.2|3   |1099511627776 s %");
    EXPECT_EQ(stored, 7);
}

TEST(KVNumber, DescribesAndComparesByValue)
{
    struct Row {
        KVNSRef<NSNumber*> number;
        char const* text;
        std::int64_t integer;
    } const rows[] = {
        {KVMakeRef<NSNumber>(1.0), "1", 1},
        {KVMakeRef<NSNumber>(-0.1), "-0.1", 0},
        {KVMakeRef<NSNumber>(1e300), "1e+300", INT64_MAX},
        {KVMakeRef<NSNumber>(-0x1p63), "-9223372036854775808", INT64_MIN},
        {KVMakeRef<NSNumber>(0.0 / -1 * 0 + __builtin_nan("")), "nan", 0},
        {KVMakeRef<NSNumber>(static_cast<long long>(INT64_MIN)), "-9223372036854775808", INT64_MIN},
    };
    for (Row const& row : rows) {
        EXPECT_EQ(row.number->description(), row.text);
        EXPECT_EQ(row.number->int64Value(), row.integer);
    }
    EXPECT_TRUE(CFEqual(KVMakeRef<NSNumber>(1), KVMakeRef<NSNumber>(1.0)));
    EXPECT_FALSE(CFEqual(KVMakeRef<NSNumber>((1LL << 53) + 1), KVMakeRef<NSNumber>(0x1p53)));
}
