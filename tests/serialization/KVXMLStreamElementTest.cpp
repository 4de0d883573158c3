#include "SerializationSupport.h"

#include <bit>
#include <cfloat>
#include <climits>
#include <cmath>
#include <random>

using std::pair;

namespace {

using ULong = unsigned long long;

constexpr unsigned kElement = 5;

KVScope scope[] = {{"element", kElement, 0}, {"a", kElement, 1}, {"b", kElement, 2}, {"a", 6, 3},
                   {"b", kElement, 4},       {nullptr, 0, 0}};

using Element = KVXMLStreamElement;

void append(Element& element, std::string text, bool newline)
{
    element.appendContentWithNewline(text.data(), newline);
}

std::unique_ptr<Element> with(std::string const& content)
{
    auto element = std::make_unique<Element>(kElement, scope, nullptr);
    append(*element, content, true);
    return element;
}

std::string stringOf(Element& element)
{
    KVString value("untouched");
    EXPECT_TRUE(element.getAsString(&value));
    return value;
}

} // namespace

TEST(KVXMLStreamElement, ReadsIntegersLikeC)
{
    struct Row {
        char const* text;
        int int32;
        unsigned uint32;
        long long int64;
        ULong uint64;
        bool boolean;
        bool ok = true, unsignedOk = true;
    } const rows[] = {
        {"0", 0, 0, 0, 0, false},
        {" \n+12abc", 12, 12, 12, 12, true},
        {"-1", -1, UINT_MAX, -1, ULLONG_MAX, true},
        {"4294967297", 1, 1, 4294967297, 4294967297, true}, // cut, not refused
        {"0x10", 0, 0, 0, 0, false},
        // What is out of range has been stored by then, cut to the size of the output.
        {"9223372036854775808", -1, 0, LLONG_MAX, 1ULL << 63, true, false},
        {"-9223372036854775809", 0, UINT_MAX, LLONG_MIN, LLONG_MAX, true, false},
        {"18446744073709551616", -1, UINT_MAX, LLONG_MAX, ULLONG_MAX, true, false, false},
    };
    for (Row const& row : rows) {
        SCOPED_TRACE(row.text);
        EXPECT_EQ(got<int>(with(row.text), &Element::getAsInt32), pair(row.ok, row.int32));
        EXPECT_EQ(got<long long>(with(row.text), &Element::getAsInt64), pair(row.ok, row.int64));
        EXPECT_EQ(got<unsigned>(with(row.text), &Element::getAsUInt32),
                  pair(row.unsignedOk, row.uint32));
        EXPECT_EQ(got<ULong>(with(row.text), &Element::getAsUInt64),
                  pair(row.unsignedOk, row.uint64));
        EXPECT_EQ(got<bool>(with(row.text), &Element::getAsBool),
                  pair(row.unsignedOk, row.boolean));
    }
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
        {"0x1p4", true, 16},
        {"  .5", true, 0.5},
        {"+5.", true, 5},
        {"-2.5e1,7", true, -25},
        {"1e+", true, 1},
        {"abc", true, 0},
    };
    for (Row const& row : rows)
        EXPECT_EQ(got<double>(with(row.text), &Element::getAsDouble), pair(row.ok, row.value))
            << row.text;
    EXPECT_TRUE(std::isnan(got<double>(with("-nan"), &Element::getAsDouble).second));
    auto const narrow = [](char const* text) {
        return got<float>(with(text), &Element::getAsFloat);
    };
    EXPECT_EQ(narrow("1.4e-45"), pair(true, 1.4e-45f));
    EXPECT_EQ(narrow("1e39"), pair(false, INFINITY));
    // Half-way between two floats as a double, and not as written.
    EXPECT_EQ(narrow("16777217.000000001"), pair(true, 16777218.0f));
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
        ASSERT_EQ(got<double>(with(text), &Element::getAsDouble).second, std::strtod(text, nullptr))
            << text;
        ASSERT_EQ(got<float>(with(text), &Element::getAsFloat).second, std::strtof(text, nullptr))
            << text;
    }
}

TEST(KVXMLStreamElement, GivesFalseWithoutText)
{
    for (bool const empty : {false, true}) {
        Element element(kElement, scope, nullptr);
        if (empty)
            append(element, "", false);
        EXPECT_EQ(got<int>(element, &Element::getAsInt32), pair(false, 77));
        EXPECT_EQ(got<double>(element, &Element::getAsDouble), pair(false, 77.0));
        EXPECT_FALSE(got<bool>(element, &Element::getAsBool).first);
        EXPECT_EQ(element.getAsUUID(), nullptr);
        EXPECT_EQ(stringOf(element), "") << "a string is always there";
        CMTime time;
        EXPECT_EQ(element.getAsVexTime(&time), empty) << "four missing numbers are zeros";
    }
}

TEST(KVXMLStreamElement, ReadsListsByItsCursor)
{
    auto const list = with(" 1 2.5\n0123456789abcdef0123456789abcdef 3 4 5 6 7end");
    Element& element = *list;
    auto const next = [&] { return got<int>(element, &Element::getAsInt32); };
    EXPECT_EQ(next(), pair(true, 1));
    EXPECT_EQ(got<double>(element, &Element::getAsDouble), pair(true, 2.5));
    std::unique_ptr<KVUUID> const uuid(element.getAsUUID());
    ASSERT_TRUE(uuid);
    EXPECT_EQ(uuid->words[3], 0x89abcdefu);
    CMTime time;
    ASSERT_TRUE(element.getAsVexTime(&time));
    EXPECT_EQ(time.value, 3);
    EXPECT_EQ(time.epoch, 6);
    EXPECT_EQ(next(), pair(true, 7));
    EXPECT_EQ(element.getAsUUID(), nullptr) << "and the cursor stays";
    // Text that is no number gives 0 for ever.
    for (int i = 0; i < 3; ++i)
        EXPECT_EQ(next(), pair(true, 0));
    EXPECT_EQ(stringOf(element).front(), ' ') << "a string does not mind the cursor";
    // More text takes the cursor back to the start.
    append(element, "8", true);
    EXPECT_EQ(next(), pair(true, 1));
}

TEST(KVXMLStreamElement, JoinsPiecesOfText)
{
    Element element(kElement, scope, nullptr);
    append(element, "a", true);
    append(element, "b", true);
    element.appendContentWithNewline(nullptr, true);
    append(element, "c", false);
    EXPECT_EQ(stringOf(element), "a\nbc");
    append(element, "c", false);
    EXPECT_EQ(stringOf(element), "a\nbc") << "the string is made once";
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
        {"&l&amp;t;é€", "&l&t;é€"},
        {"not UTF-8 \xE9", ""},
    };
    for (Row const& row : rows) {
        auto const element = with(row.content);
        EXPECT_EQ(stringOf(*element), row.string) << row.content;
    }
}

TEST(KVXMLStreamElement, ReadsAttributes)
{
    Element element(kElement, scope, nullptr);
    char const* const values[] = {"",          "99999999999999999999",
                                  "a &amp; b", "0123456789abcdef0123456789abcdef",
                                  "0.5",       "1 2 3 4"};
    for (unsigned i = 0; i < std::size(values); ++i)
        element.addAttribute(10 + i, values[i]);
    EXPECT_EQ(got<unsigned>(element, &Element::getAttributeAsUInt32, 10), pair(true, 0u))
        << "an empty one is 0";
    EXPECT_EQ(got<long long>(element, &Element::getAttributeAsInt64, 11), pair(false, LLONG_MAX));
    EXPECT_FALSE(got<ULong>(element, &Element::getAttributeAsUInt64, 11).first);
    KVString text;
    EXPECT_TRUE(element.getAttributeAsString(12, &text));
    EXPECT_EQ(text.toUTF8(), "a &amp; b") << "nothing is decoded here";
    std::unique_ptr<KVUUID> const uuid(element.getAttributeAsUUID(13));
    EXPECT_EQ(*uuid, (KVUUID{{0x01234567, 0x89abcdef, 0x01234567, 0x89abcdef}}));
    EXPECT_EQ(got<double>(element, &Element::getAttributeAsDouble, 14), pair(true, 0.5));
    EXPECT_EQ(got<float>(element, &Element::getAttributeAsFloat, 14), pair(true, 0.5f));
    CMTime time;
    EXPECT_TRUE(element.getAttributeAsVexTime(15, &time));
    EXPECT_EQ(time.timescale, 2);
    // Absent.
    EXPECT_EQ(got<int>(element, &Element::getAttributeAsInt32, 1), pair(false, 77));
    EXPECT_FALSE(got<bool>(element, &Element::getAttributeAsBool, 1).first);
    EXPECT_FALSE(element.getAttributeAsString(1, &text));
    EXPECT_EQ(element.getAttributeAsUUID(1), nullptr);
}

TEST(KVXMLStreamElement, KeepsMoreThanSevenAttributes)
{
    Element element(kElement, scope, nullptr);
    for (unsigned token = 1; token <= 20; ++token)
        element.addAttribute(token, std::to_string(token * token).c_str());
    for (unsigned token = 1; token <= 20; ++token)
        EXPECT_EQ(element.getAttributeAsCString(token), std::to_string(token * token));
    // A token that comes again: the first value counts among the first seven, the last one behind.
    element.addAttribute(3u, "again");
    element.addAttribute(9u, "again");
    EXPECT_STREQ(element.getAttributeAsCString(3), "9");
    EXPECT_STREQ(element.getAttributeAsCString(9), "again");
}

TEST(KVXMLStreamElement, AddsAttributesByTheNamesOfItsTable)
{
    Element element(kElement, scope, nullptr);
    for (char const* const name : {"a", "b", "element", "c"})
        element.addAttribute(name, name);
    EXPECT_STREQ(element.getAttributeAsCString(1), "a");
    EXPECT_STREQ(element.getAttributeAsCString(2), "b");
    EXPECT_STREQ(element.getAttributeAsCString(4), "b") << "every row of the name";
    EXPECT_EQ(element.getAttributeAsCString(3), nullptr) << "that is another element's";
    EXPECT_EQ(element.getAttributeAsCString(0), nullptr);
    Element(kElement, nullptr, nullptr).addAttribute("a", "1");
}
