#include "SerializationSupport.h"

#include <bit>
#include <cfloat>
#include <climits>
#include <cmath>
#include <random>

namespace {

constexpr unsigned kElement = 5;

KVScope scope[] = {{"element", kElement, 0}, {"a", kElement, 1}, {"b", kElement, 2}, {"a", 6, 3},
                   {"b", kElement, 4},       {nullptr, 0, 0}};

void append(KVXMLStreamElement& element, std::string text, bool newline)
{
    element.appendContentWithNewline(text.data(), newline);
}

std::unique_ptr<KVXMLStreamElement> elementWith(std::string const& content)
{
    auto element = std::make_unique<KVXMLStreamElement>(kElement, scope, nullptr);
    append(*element, content, true);
    return element;
}

/// The string that an element with this content gives.
std::string stringOf(std::string const& content)
{
    KVString value("untouched");
    EXPECT_TRUE(elementWith(content)->getAsString(&value));
    return value;
}

} // namespace

TEST(KVXMLStreamElement, ReadsIntegersLikeC)
{
    struct Row {
        char const* text;
        bool ok;
        int int32;
        unsigned uint32;
        long long int64;
        unsigned long long uint64;
        bool boolean;
    } const rows[] = {
        {"0", true, 0, 0, 0, 0, false},
        {"12", true, 12, 12, 12, 12, true},
        {" \n+12abc", true, 12, 12, 12, 12, true},
        {"-1", true, -1, UINT_MAX, -1, ULLONG_MAX, true},
        {"4294967297", true, 1, 1, 4294967297, 4294967297, true}, // cut, not refused
        {"abc", true, 0, 0, 0, 0, false},
        {"true", true, 0, 0, 0, 0, false},
        {"0x10", true, 0, 0, 0, 0, false},
        {"-", true, 0, 0, 0, 0, false},
        {"9223372036854775807", true, -1, UINT_MAX, LLONG_MAX, LLONG_MAX, true},
    };
    for (Row const& row : rows) {
        int int32 = 99;
        unsigned uint32 = 99;
        long long int64 = 99;
        unsigned long long uint64 = 99;
        bool boolean = !row.boolean;
        EXPECT_EQ(elementWith(row.text)->getAsInt32(&int32), row.ok) << row.text;
        EXPECT_EQ(elementWith(row.text)->getAsUInt32(&uint32), row.ok) << row.text;
        EXPECT_EQ(elementWith(row.text)->getAsInt64(&int64), row.ok) << row.text;
        EXPECT_EQ(elementWith(row.text)->getAsUInt64(&uint64), row.ok) << row.text;
        EXPECT_EQ(elementWith(row.text)->getAsBool(&boolean), row.ok) << row.text;
        EXPECT_EQ(int32, row.int32) << row.text;
        EXPECT_EQ(uint32, row.uint32) << row.text;
        EXPECT_EQ(int64, row.int64) << row.text;
        EXPECT_EQ(uint64, row.uint64) << row.text;
        EXPECT_EQ(boolean, row.boolean) << row.text;
    }
}

// A number that is out of range has been stored by then, cut to the size of the output.
TEST(KVXMLStreamElement, RefusesIntegersOutOfRange)
{
    int int32 = 99;
    long long int64 = 99;
    EXPECT_FALSE(elementWith("9223372036854775808")->getAsInt32(&int32));
    EXPECT_EQ(int32, -1);
    EXPECT_FALSE(elementWith("-9223372036854775809")->getAsInt32(&int32));
    EXPECT_EQ(int32, 0);
    EXPECT_FALSE(elementWith("9223372036854775808")->getAsInt64(&int64));
    EXPECT_EQ(int64, LLONG_MAX);
    unsigned long long uint64 = 99;
    unsigned uint32 = 99;
    bool boolean = false;
    EXPECT_FALSE(elementWith("18446744073709551616")->getAsUInt64(&uint64));
    EXPECT_EQ(uint64, ULLONG_MAX);
    EXPECT_FALSE(elementWith("18446744073709551616")->getAsUInt32(&uint32));
    EXPECT_EQ(uint32, UINT_MAX);
    EXPECT_FALSE(elementWith("18446744073709551616")->getAsBool(&boolean));
    EXPECT_TRUE(boolean);
}

TEST(KVXMLStreamElement, ReadsFloatingPointLikeTheCLocale)
{
    struct Row {
        char const* text;
        bool ok;
        double value;
    } const rows[] = {
        {"0.10000000000000001", true, 0.1},
        {"1.7976931348623157e+308", true, DBL_MAX},
        {"4.9406564584124654e-324", true, 4.9406564584124654e-324}, // subnormal, not out of range
        {"1e-400", false, 0},
        {"1e400", false, INFINITY},
        {"-1e400", false, -INFINITY},
        {"0e400", true, 0},
        {"inf", true, INFINITY},
        {"-Infinity", true, -INFINITY},
        {"0x1p4", true, 16},
        {".5", true, 0.5},
        {"+5.", true, 5},
        {"-2.5e1,7", true, -25},
        {"1,5", true, 1},
        {"1e+", true, 1},
        {"  7  ", true, 7},
        {"abc", true, 0},
    };
    for (Row const& row : rows) {
        double value = 99;
        EXPECT_EQ(elementWith(row.text)->getAsDouble(&value), row.ok) << row.text;
        EXPECT_EQ(value, row.value) << row.text;
    }
    double nan = 0;
    EXPECT_TRUE(elementWith("-nan")->getAsDouble(&nan));
    EXPECT_TRUE(std::isnan(nan));
    float narrow = 0;
    EXPECT_TRUE(elementWith("1.4e-45")->getAsFloat(&narrow));
    EXPECT_EQ(narrow, 1.4e-45f);
    EXPECT_TRUE(elementWith("16777217")->getAsFloat(&narrow));
    EXPECT_EQ(narrow, 16777216.0f);
    EXPECT_FALSE(elementWith("1e39")->getAsFloat(&narrow));
    EXPECT_TRUE(std::isinf(narrow));
}

TEST(KVXMLStreamElement, ReadsEveryNumberToTheNearest)
{
    std::mt19937_64 random(11);
    for (int i = 0; i < 20000; ++i) {
        double const value = std::bit_cast<double>(random() % 2 ? random()
                                                                : (random() & 0x800FFFFFFFFFFFFF) |
                                                                      (990 + random() % 60) << 52);
        if (!std::isfinite(value) || (value != 0 && std::abs(value) < 1e-30))
            continue;
        char text[400];
        int const digits = static_cast<int>(random() % 22);
        if (i % 3 == 0)
            std::snprintf(text, sizeof text, "%.*g", digits, value);
        else if (i % 3 == 1)
            std::snprintf(text, sizeof text, "%.*e", digits, value);
        else
            std::snprintf(text, sizeof text, "%.*f", digits, value);
        auto const element = elementWith(text);
        double wide = 0;
        float narrow = 0;
        element->getAsDouble(&wide);
        ASSERT_EQ(wide, std::strtod(text, nullptr)) << text;
        elementWith(text)->getAsFloat(&narrow);
        ASSERT_EQ(narrow, std::strtof(text, nullptr)) << text;
    }
    // Half-way between two floats as a double, and not as written.
    float narrow = 0;
    elementWith("16777217.000000001")->getAsFloat(&narrow);
    EXPECT_EQ(narrow, 16777218.0f);
}

TEST(KVXMLStreamElement, GivesFalseWithoutText)
{
    for (bool const empty : {false, true}) {
        KVXMLStreamElement element(kElement, scope, nullptr);
        if (empty)
            append(element, "", false);
        int integer = 99;
        double real = 99;
        bool boolean = true;
        KVString string("untouched");
        EXPECT_FALSE(element.getAsInt32(&integer));
        EXPECT_FALSE(element.getAsDouble(&real));
        EXPECT_FALSE(element.getAsBool(&boolean));
        EXPECT_EQ(element.getAsUUID(), nullptr);
        EXPECT_EQ(integer, 99);
        EXPECT_EQ(real, 99);
        EXPECT_TRUE(boolean);
        EXPECT_TRUE(element.getAsString(&string)) << "a string is always there";
        EXPECT_TRUE(string.empty());
        CMTime time = CMTimeMake(9, 9);
        EXPECT_EQ(element.getAsVexTime(&time), empty) << "four missing numbers are zeros";
    }
}

TEST(KVXMLStreamElement, ReadsListsByItsCursor)
{
    auto const element = elementWith(" 1 2.5\n0123456789abcdef0123456789abcdef 3 4 5 6 7end");
    int integer;
    double real;
    CMTime time;
    ASSERT_TRUE(element->getAsInt32(&integer));
    ASSERT_TRUE(element->getAsDouble(&real));
    std::unique_ptr<KVUUID> const uuid(element->getAsUUID());
    ASSERT_TRUE(uuid);
    ASSERT_TRUE(element->getAsVexTime(&time));
    EXPECT_EQ(integer, 1);
    EXPECT_EQ(real, 2.5);
    EXPECT_EQ(uuid->words[3], 0x89abcdefu);
    EXPECT_EQ(time.value, 3);
    EXPECT_EQ(time.epoch, 6);
    ASSERT_TRUE(element->getAsInt32(&integer));
    EXPECT_EQ(integer, 7);
    EXPECT_EQ(element->getAsUUID(), nullptr) << "and the cursor stays";
    // Text that is no number gives 0 for ever.
    for (int i = 0; i < 3; ++i) {
        EXPECT_TRUE(element->getAsInt32(&integer));
        EXPECT_EQ(integer, 0);
    }
    KVString whole;
    element->getAsString(&whole);
    EXPECT_EQ(whole.toUTF8().front(), ' ') << "a string does not mind the cursor";
    // More text takes the cursor back to the start.
    append(*element, "8", true);
    EXPECT_TRUE(element->getAsInt32(&integer));
    EXPECT_EQ(integer, 1);
}

TEST(KVXMLStreamElement, JoinsPiecesOfText)
{
    KVXMLStreamElement element(kElement, scope, nullptr);
    char a[] = "a", b[] = "b", c[] = "c";
    element.appendContentWithNewline(a, true);
    element.appendContentWithNewline(b, true);
    element.appendContentWithNewline(nullptr, true);
    element.appendContentWithNewline(c, false);
    a[0] = 'x'; // copied
    KVString text;
    element.getAsString(&text);
    EXPECT_EQ(text.toUTF8(), "a\nbc");
    element.appendContentWithNewline(c, false);
    element.getAsString(&text);
    EXPECT_EQ(text.toUTF8(), "a\nbc") << "the string is made once";
    EXPECT_TRUE(element.isXMLStreamElement());
}

// Meant: the parser has decoded the text already, and it is decoded once more, "&amp;" first.
TEST(KVXMLStreamElement, DecodesItsStringAgain)
{
    struct Row {
        char const* content;
        char const* string;
    } const rows[] = {
        {"&amp;lt;", "<"},
        {"&amp;amp;lt;", "&amp;lt;"},
        {"&lt;&gt;&quot;&apos;", "<>\"&apos;"},
        {"& &am &amp &amp;", "& &am &amp &"},
        {"&", "&"},
        {"&l&amp;t;", "&l&t;"},
        {"é&amp;€", "é&€"},
        {"not UTF-8 \xE9", ""},
    };
    for (Row const& row : rows)
        EXPECT_EQ(stringOf(row.content), row.string) << row.content;
}

TEST(KVXMLStreamElement, ReadsAttributes)
{
    KVXMLStreamElement element(kElement, scope, nullptr);
    element.addAttribute(10u, "-7x");
    element.addAttribute(11u, "");
    element.addAttribute(12u, "99999999999999999999");
    element.addAttribute(13u, "a &amp; b");
    element.addAttribute(14u, "0123456789abcdef0123456789abcdef");
    element.addAttribute(15u, "1 2 3 4");
    element.addAttribute(16u, "0.5");
    int integer = 99;
    EXPECT_TRUE(element.getAttributeAsInt32(10, &integer));
    EXPECT_EQ(integer, -7);
    unsigned natural = 99;
    EXPECT_TRUE(element.getAttributeAsUInt32(11, &natural)) << "an empty one is 0";
    EXPECT_EQ(natural, 0u);
    long long wide = 99;
    EXPECT_FALSE(element.getAttributeAsInt64(12, &wide));
    EXPECT_EQ(wide, LLONG_MAX);
    unsigned long long wideNatural;
    EXPECT_FALSE(element.getAttributeAsUInt64(12, &wideNatural));
    KVString text;
    EXPECT_TRUE(element.getAttributeAsString(13, &text));
    EXPECT_EQ(text.toUTF8(), "a &amp; b") << "nothing is decoded here";
    bool boolean = false;
    EXPECT_TRUE(element.getAttributeAsBool(10, &boolean));
    EXPECT_TRUE(boolean);
    std::unique_ptr<KVUUID> const uuid(element.getAttributeAsUUID(14));
    ASSERT_TRUE(uuid);
    EXPECT_EQ(uuid->words[0], 0x01234567u);
    CMTime time;
    EXPECT_TRUE(element.getAttributeAsVexTime(15, &time));
    EXPECT_EQ(time.timescale, 2);
    double real;
    float narrow;
    EXPECT_TRUE(element.getAttributeAsDouble(16, &real));
    EXPECT_TRUE(element.getAttributeAsFloat(16, &narrow));
    EXPECT_EQ(real, 0.5);
    EXPECT_EQ(narrow, 0.5f);

    // Absent.
    EXPECT_FALSE(element.getAttributeAsInt32(1, &integer));
    EXPECT_FALSE(element.getAttributeAsString(1, &text));
    EXPECT_FALSE(element.getAttributeAsBool(1, &boolean));
    EXPECT_FALSE(element.getAttributeAsVexTime(1, &time));
    EXPECT_EQ(element.getAttributeAsUUID(1), nullptr);
    EXPECT_EQ(element.getAttributeAsCString(1), nullptr);
    EXPECT_EQ(integer, -7);
}

TEST(KVXMLStreamElement, KeepsMoreThanSevenAttributes)
{
    KVXMLStreamElement element(kElement, scope, nullptr);
    for (unsigned token = 1; token <= 20; ++token)
        element.addAttribute(token, std::to_string(token * token).c_str());
    for (unsigned token = 1; token <= 20; ++token) {
        unsigned value = 0;
        EXPECT_TRUE(element.getAttributeAsUInt32(token, &value));
        EXPECT_EQ(value, token * token);
    }
    // A token that comes again: the first value counts among the first seven, the last one behind.
    element.addAttribute(3u, "again");
    element.addAttribute(9u, "again");
    EXPECT_STREQ(element.getAttributeAsCString(3), "9");
    EXPECT_STREQ(element.getAttributeAsCString(9), "again");
}

TEST(KVXMLStreamElement, AddsAttributesByTheNamesOfItsTable)
{
    KVXMLStreamElement element(kElement, scope, nullptr);
    element.addAttribute("a", "1");
    element.addAttribute("b", "2");
    element.addAttribute("element", "3");
    element.addAttribute("c", "4");
    EXPECT_STREQ(element.getAttributeAsCString(1), "1");
    EXPECT_STREQ(element.getAttributeAsCString(2), "2");
    EXPECT_STREQ(element.getAttributeAsCString(4), "2") << "every row of the name";
    EXPECT_EQ(element.getAttributeAsCString(3), nullptr) << "that is another element's";
    EXPECT_EQ(element.getAttributeAsCString(0), nullptr);
    KVXMLStreamElement(kElement, nullptr, nullptr).addAttribute("a", "1");
}
