#include <korvane/korvane.h>

#include <gtest/gtest.h>

namespace {

KVNSRef<NSMutableAttributedString*> styled(char const* text)
{
    return KVMakeRef<NSMutableAttributedString>(KVString(text));
}

KVNSRef<NSColor const*> const red = NSColor::named("red");
KVNSRef<NSColor const*> const blue = NSColor::named("blue");

/// Each unit's text colour as a letter: "r", "b", or "." for none.
std::string coloursOf(NSAttributedString const* string)
{
    std::string result;
    for (std::size_t i = 0; i < string->length(); ++i) {
        NSObject const* color = string->attribute(NSForegroundColorAttributeName, i);
        result += !color ? '.' : color->isEqual(red) ? 'r' : 'b';
    }
    return result;
}

TEST(NSAttributedString, AttributesAreCutAndJoinedAtTheEdgesOfTheirRanges)
{
    struct Row {
        NSRange first;
        NSRange second;
        std::string colours;
        std::size_t runs;
    } const rows[] = {
        {{0, 6}, {0, 0}, "rrrrrr", 1},        {{0, 6}, {2, 2}, "rrbbrr", 3},
        {{0, 3}, {3, 3}, "rrrbbb", 2},        {{1, 2}, {2, 3}, ".rbbb.", 4},
        {{9, 1}, {7, SIZE_MAX}, "......", 1}, {{5, SIZE_MAX}, {0, 1}, "b....r", 3},
    };
    for (Row const& row : rows) {
        auto const string = styled("abcdef");
        string->addAttribute(NSForegroundColorAttributeName, red, row.first);
        string->addAttribute(NSForegroundColorAttributeName, blue, row.second);
        EXPECT_EQ(coloursOf(string), row.colours);
        EXPECT_EQ(string->runs().size(), row.runs) << row.colours;
    }
}

TEST(NSAttributedString, TheEffectiveRangeIsTheLongestWithAnEqualValue)
{
    auto const string = styled("abcdefgh");
    string->addAttribute(NSForegroundColorAttributeName, red, {1, 6});
    // Another attribute cuts the run in two, and an equal colour is not the same object.
    string->addAttribute(NSFontAttributeName, NSFont::systemFont(true), {3, 2});
    string->addAttribute(NSForegroundColorAttributeName, KVMakeRef<NSColor>(1, 0, 0, 1), {5, 1});
    struct Row {
        std::size_t index;
        bool found;
        NSRange range;
    } const rows[] = {
        {0, false, {0, 1}}, {1, true, {1, 6}},  {4, true, {1, 6}},         {6, true, {1, 6}},
        {7, false, {7, 1}}, {8, false, {8, 0}}, {SIZE_MAX, false, {8, 0}},
    };
    for (Row const& row : rows) {
        NSRange range;
        NSObject const* color =
            string->attribute(NSForegroundColorAttributeName, row.index, &range);
        EXPECT_EQ(color != nullptr, row.found) << row.index;
        EXPECT_EQ(range, row.range) << row.index;
    }
}

TEST(NSAttributedString, EqualityLooksAtTheTextAndAtTheValuesOfEachUnit)
{
    auto const a = styled("abc");
    a->addAttribute(NSForegroundColorAttributeName, red, {0, 3});
    auto const b = styled("abc");
    EXPECT_FALSE(a->isEqual(b));
    b->addAttribute(NSForegroundColorAttributeName, KVMakeRef<NSColor>(1, 0, 0, 1), {1, 2});
    EXPECT_FALSE(a->isEqual(b));
    b->addAttribute(NSForegroundColorAttributeName, red, {0, 1});
    EXPECT_TRUE(a->isEqual(b));
    EXPECT_EQ(a->hash(), b->hash());
    EXPECT_TRUE(a->copy()->isEqual(b)) << "an immutable and a mutable string can be equal";
    EXPECT_FALSE(a->isEqual(styled("abd")));
    // A removed attribute is as one that was never there.
    a->removeAttribute(NSForegroundColorAttributeName, {0, 3});
    EXPECT_TRUE(a->isEqual(styled("abc")));
}

TEST(NSAttributedString, CopiesAreIndependentAndImmutableOnesShared)
{
    auto const original = styled("abc");
    KVNSRef<NSAttributedString*> const copy = original->copy();
    original->addAttribute(NSForegroundColorAttributeName, red, {0, 3});
    EXPECT_EQ(coloursOf(copy), "...");
    EXPECT_EQ(copy->copy().get(), copy.get());
    EXPECT_NE(static_cast<NSAttributedString*>(copy->mutableCopy().get()), copy.get());
}

TEST(NSAttributedString, AppendAndSubstringKeepTheRuns)
{
    auto const string = styled("ab");
    string->addAttribute(NSForegroundColorAttributeName, red, {1, 1});
    string->append(*string);
    EXPECT_EQ(string->string().toUTF8(), "abab");
    EXPECT_EQ(coloursOf(string), ".r.r");
    struct Row {
        NSRange range;
        char const* text;
        char const* colours;
    } const rows[] = {
        {{0, 4}, "abab", ".r.r"}, {{1, 2}, "ba", "r."},    {{3, 9}, "b", "r"},
        {{4, 1}, "", ""},         {{9, SIZE_MAX}, "", ""}, {{1, 1}, "b", "r"},
    };
    for (Row const& row : rows) {
        auto const part = string->attributedSubstringFromRange(row.range);
        EXPECT_EQ(part->string().toUTF8(), row.text);
        EXPECT_EQ(coloursOf(part), row.colours);
    }
}

TEST(NSAttributedString, RunsFromOutsideAreMended)
{
    NSAttributes::Values values;
    values[NSForegroundColorAttributeName] = red;
    KVNSRef<NSAttributes const*> const attributes = KVMakeRef<NSAttributes>(values);
    NSAttributedString const string(
        "abcdef", {{0, attributes}, {2, attributes}, {1, nullptr}, {3, attributes}, {99, nullptr}});
    EXPECT_EQ(coloursOf(&string), "rrr...");
    EXPECT_EQ(string.runs().size(), 2u);
    EXPECT_EQ(string.runs().back().end, 6u);
    NSAttributedString const shorter("ab", std::vector<NSAttributedString::Run>());
    EXPECT_EQ(coloursOf(&shorter), "..");
}

TEST(NSAttributedString, TraitsComeAndGoAndGiveAFontWhereThereIsNone)
{
    auto const string = styled("abc");
    string->addAttribute(NSFontAttributeName, KVMakeRef<NSFont>(20.0), {0, 1});
    string->applyFontTraits(NSBoldFontMask | NSItalicFontMask, {0, 2});
    string->applyFontTraits(NSUnitalicFontMask, {1, 1});
    auto const fontAt = [&](std::size_t index) {
        return dynamic_cast<NSFont const*>(string->attribute(NSFontAttributeName, index));
    };
    EXPECT_TRUE(fontAt(0)->isEqual(KVMakeRef<NSFont>(20.0, true, true)));
    EXPECT_EQ(fontAt(1), NSFont::systemFont(true)) << "system fonts are shared";
    EXPECT_EQ(fontAt(2), nullptr);
}

TEST(NSAttributedString, ComesBackFromAnArchive)
{
    auto const string = styled("naïve 😀");
    string->addAttribute(NSForegroundColorAttributeName, red, {0, 5});
    string->addAttribute(NSBackgroundColorAttributeName, KVMakeRef<NSColor>(0, 0, 0, 1, "P3"),
                         {2, 4});
    string->addAttribute(NSFontAttributeName, KVMakeRef<NSFont>(20.0, true), {4, 4});
    string->addAttribute(NSUnderlineStyleAttributeName, KVMakeRef<NSNumber>(2), {7, 1});
    KVKeyedCoder coder;
    coder.encodeObject(string, "s");
    auto const reader = KVKeyedCoder::fromBytes(coder.archivedBytes());
    ASSERT_TRUE(reader);
    auto const back =
        reader->decodeObjectOfClass<NSAttributedString>(NSAttributedString::coding, "s");
    ASSERT_TRUE(back);
    EXPECT_TRUE(back->isEqual(string));
}

TEST(NSColor, NamesAreThoseOfTheTableAndCaseCounts)
{
    struct Row {
        char const* name;
        double red, green, blue, alpha;
    } const rows[] = {
        {"darkGray", 1.0 / 3, 1.0 / 3, 1.0 / 3, 1},
        {"clear", 0, 0, 0, 0},
        {"gold", 0.8549019608, 0.733333333333333, 0.125490196078431, 1},
        {"violet", 0.5411764706, 0.168627450980392, 0.886274509803922, 1},
    };
    for (Row const& row : rows) {
        auto const color = NSColor::named(row.name);
        ASSERT_TRUE(color) << row.name;
        EXPECT_TRUE(
            color->isEqual(KVMakeRef<NSColor>(row.red, row.green, row.blue, row.alpha, "sRGB")))
            << row.name;
    }
    for (char const* name : {"Black", "", "redColor", "bogus"})
        EXPECT_FALSE(NSColor::named(name)) << name;
    EXPECT_TRUE(NSColor::greyColor()->isEqual(NSColor::grayColor()));
}

TEST(NSColor, ConvertsToItsOwnSpaceAlone)
{
    auto const color = KVMakeRef<NSColor>(0.1, 0.2, 0.3, 1, "P3");
    EXPECT_TRUE(color->usingColorSpace("P3"));
    EXPECT_FALSE(color->usingColorSpace("sRGB"));
    EXPECT_FALSE(color->isEqual(KVMakeRef<NSColor>(0.1, 0.2, 0.3, 1)));
}

} // namespace
