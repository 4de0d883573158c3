#include "Captions.h"

#include <gtest/gtest.h>

namespace {

KVNSRef<NSAttributedString*> plain(char const* text)
{
    return KVMakeRef<NSAttributedString>(text);
}

CMTimeRange const twoSeconds = rangeOf(0, 2);

// --- Queries ---

TEST(KVCaption, FormatFollowsTheClass)
{
    auto const text = plain("a");
    EXPECT_EQ(KVCaption(text, twoSeconds).format(), 0);
    EXPECT_EQ(KVCaptionCEA608(text, twoSeconds, 0, 0, 1, 0, 0).format(), 1);
    EXPECT_EQ(KVCaptioniTT(text, twoSeconds, "r").format(), 2);
    EXPECT_EQ(KVCaptionSRT(text, twoSeconds).format(), 3);
    EXPECT_EQ(KVMutableCaptionSRT(text, twoSeconds).format(), 3);
}

TEST(KVCaption, StyleQueriesReportValueAndRange)
{
    KVMutableCaption caption(plain("abcdef"), twoSeconds);
    caption.setTextColor(NSColor::named("red"), {1, 2});
    caption.setBackgroundColor(NSColor::named("blue"), {0, 3});
    caption.setFontDecoration(5, {2, 2});
    caption.setFontStyle(2, {4, 99});
    caption.setFontWeight(2, {0, 1});
    NSRange range;
    EXPECT_TRUE(caption.copyTextColorAtIndex(2, &range)->isEqual(NSColor::named("red")));
    EXPECT_EQ(range, (NSRange{1, 2}));
    EXPECT_FALSE(caption.copyTextColorAtIndex(0));
    EXPECT_TRUE(caption.copyBackgroundColorAtIndex(0, &range)->isEqual(NSColor::named("blue")));
    EXPECT_EQ(range, (NSRange{0, 3}));
    EXPECT_EQ(caption.fontDecorationAtIndex(3, &range), 5);
    EXPECT_EQ(range, (NSRange{2, 2}));
    EXPECT_EQ(caption.fontDecorationAtIndex(4), 0);
    EXPECT_EQ(caption.fontStyleAtIndex(5, &range), 2);
    EXPECT_EQ(range, (NSRange{4, 2}));
    EXPECT_EQ(caption.fontWeightAtIndex(0), 2);
    EXPECT_EQ(caption.fontWeightAtIndex(1, &range), 1);
    EXPECT_EQ(range, (NSRange{1, 3})) << "text without a font, up to the italic font";
    caption.setFontWeight(1, {0, 1});
    EXPECT_EQ(caption.fontWeightAtIndex(0), 1);
}

TEST(KVCaption, AQueryBeyondTheTextOrWithoutOneFindsNothing)
{
    KVCaption const empty(plain(""), twoSeconds);
    KVMutableCaption none(nullptr, twoSeconds);
    none.setFontWeight(2, {0, 1});
    none.setTextColor(NSColor::blackColor(), {0, 1});
    for (KVCaption const* caption : {&empty, static_cast<KVCaption const*>(&none)}) {
        for (std::size_t index : {std::size_t(0), SIZE_MAX}) {
            NSRange range{7, 7};
            EXPECT_FALSE(caption->copyTextColorAtIndex(index, &range));
            EXPECT_EQ(range, (NSRange{0, 0}));
            EXPECT_EQ(caption->fontDecorationAtIndex(index, &range), 0);
            EXPECT_EQ(caption->fontStyleAtIndex(index, &range), 1);
            EXPECT_EQ(caption->fontWeightAtIndex(index, &range), 1);
        }
    }
    EXPECT_TRUE(none.text().isNull());
    EXPECT_EQ(none.attributedString(), nullptr);
}

// --- Equality ---

TEST(KVCaption, EqualityIsByFormatTimeAndStyledText)
{
    KVCaption const caption(plain("a"), twoSeconds);
    CMTimeRange const sameByValue = {CMTimeMake(0, 600), CMTimeMake(1200, 600)};
    KVMutableCaption changed(plain("a"), sameByValue);
    EXPECT_TRUE(caption.isEqual(&changed));
    EXPECT_TRUE(changed.isEqual(&caption));
    EXPECT_EQ(caption.hash(), changed.hash());
    changed.setTextColor(NSColor::whiteColor(), {0, 1});
    EXPECT_FALSE(caption.isEqual(&changed)) << "attributes count";
    EXPECT_FALSE(caption.isEqual(KVMakeRef<KVCaption>(plain("b"), twoSeconds)));
    EXPECT_FALSE(caption.isEqual(KVMakeRef<KVCaption>(plain("a"), rangeOf(0, 1))));
    EXPECT_FALSE(
        caption.isEqual(KVMakeRef<KVCaptionCEA608>(plain("a"), twoSeconds, 0, 0, 0, 0, 0)));
    EXPECT_FALSE(caption.isEqual(plain("a")));
    EXPECT_FALSE(caption.isEqual(nullptr));
}

TEST(KVCaption, EachFieldOfCEA608Counts)
{
    KVCaptionCEA608 const caption(plain("a"), twoSeconds, 1, 2, 3, 4, 5);
    EXPECT_TRUE(
        caption.isEqual(KVMakeRef<KVMutableCaptionCEA608>(plain("a"), twoSeconds, 1, 2, 3, 4, 5)));
    using Set = void (*)(KVMutableCaptionCEA608&);
    Set const changes[] = {
        [](KVMutableCaptionCEA608& c) { c.setCellX(9); },
        [](KVMutableCaptionCEA608& c) { c.setCellY(9); },
        [](KVMutableCaptionCEA608& c) { c.setHeight(9); },
        [](KVMutableCaptionCEA608& c) { c.setAnimationBehavior(9); },
        [](KVMutableCaptionCEA608& c) { c.setScrollBehavior(9); },
        [](KVMutableCaptionCEA608& c) { c.setTimeRange(rangeOf(1, 2)); },
    };
    for (Set change : changes) {
        auto const other = caption.mutableCopy();
        EXPECT_TRUE(caption.isEqual(other));
        change(*other.get());
        EXPECT_FALSE(caption.isEqual(other));
    }
}

// --- Formats ---

TEST(KVCaptionCEA608, CellsCountFromTheFirstOne)
{
    struct Row {
        char const* text;
        long long cellX, maxCellX, midCellX;
    } const rows[] = {
        {"", 5, 4, 5},
        {"abcd", 5, 8, 7},
        {"abc", 0, 2, 1},
        {"a", -3, -3, -3},
        {"", INT64_MIN, INT64_MAX, INT64_MIN}, // wraps, never traps
    };
    for (Row const& row : rows) {
        KVCaptionCEA608 const caption(plain(row.text), twoSeconds, row.cellX, 0, 1, 0, 0);
        EXPECT_EQ(caption.maxCellX(), row.maxCellX) << row.text;
        EXPECT_EQ(caption.midCellX(), row.midCellX) << row.text;
    }
}

TEST(KVCaptionSRT, IsAlwaysOnBlack)
{
    auto const red = KVMakeRef<NSMutableAttributedString>(KVString("text"));
    red->addAttribute(NSBackgroundColorAttributeName, NSColor::named("red"), {0, 4});
    KVMutableCaptionSRT caption(plain("other"), twoSeconds);
    caption.setAttributedString(red);
    NSRange range;
    EXPECT_TRUE(caption.copyBackgroundColorAtIndex(1, &range)->isEqual(NSColor::blackColor()));
    EXPECT_EQ(range, (NSRange{0, 4}));
    caption.setBackgroundColor(NSColor::named("red"), {1, 2});
    EXPECT_TRUE(caption.copyBackgroundColorAtIndex(1)->isEqual(NSColor::blackColor()));
    EXPECT_TRUE(KVCaptionSRT(red, twoSeconds).isEqual(&caption));
    EXPECT_TRUE(red->attribute(NSBackgroundColorAttributeName, 0)->isEqual(NSColor::named("red")))
        << "the string that was given is copied";
}

TEST(KVCaptioniTT, RubyStandsOverRunsOfOneObject)
{
    KVMutableCaptioniTT caption(plain("漢字です"), twoSeconds, "bottom");
    EXPECT_FALSE(caption.hasRuby());
    EXPECT_EQ(caption.rubyText().size(), 4u);
    caption.setRubyText("かんじ", {0, 2});
    EXPECT_TRUE(caption.hasRuby());
    struct Row {
        std::size_t index;
        char const* ruby;
        NSRange range;
    } const rows[] = {
        {0, "かんじ", {0, 2}},
        {1, "かんじ", {0, 2}},
        {2, nullptr, {2, 2}},
        {4, nullptr, {4, 0}},
    };
    for (Row const& row : rows) {
        NSRange range;
        KVString const ruby = caption.rubyTextAtIndex(row.index, &range);
        EXPECT_EQ(ruby.isNull(), row.ruby == nullptr) << row.index;
        EXPECT_EQ(ruby.toUTF8(), row.ruby ? row.ruby : "");
        EXPECT_EQ(range, row.range);
    }
    // Equal texts of two objects are two runs.
    caption.setRubyText("かんじ", {2, SIZE_MAX});
    NSRange range;
    caption.rubyTextAtIndex(1, &range);
    EXPECT_EQ(range, (NSRange{0, 2}));

    caption.setRubyText(KVString(), {0, 2});
    EXPECT_TRUE(caption.hasRuby());
    caption.setRubyText(KVString(), {2, 2});
    EXPECT_FALSE(caption.hasRuby());
    caption.setRubyText("x", {9, 1});
    EXPECT_FALSE(caption.hasRuby()) << "a range beyond the text sets nothing";
}

TEST(KVCaptioniTT, AChangeOfTextDropsTheRubyAndAChangeOfAttributesKeepsIt)
{
    KVMutableCaptioniTT caption(plain("漢字"), twoSeconds, "bottom");
    caption.setRubyText("かんじ", {0, 2});
    caption.setTextColor(NSColor::goldColor(), {0, 1});
    EXPECT_TRUE(caption.hasRuby());
    caption.setAttributedString(plain("漢字"));
    EXPECT_TRUE(caption.hasRuby());
    EXPECT_TRUE(caption.copyBackgroundColorAtIndex(0)->isEqual(NSColor::blackColor()));
    caption.setAttributedString(plain("漢字です"));
    EXPECT_FALSE(caption.hasRuby());
    EXPECT_EQ(caption.rubyText().size(), 4u);
}

TEST(KVCaptioniTT, RegionAndRubyCountInEquality)
{
    KVCaptioniTT const caption(plain("漢字"), twoSeconds, "bottom");
    KVNSRef<KVMutableCaptioniTT*> const other = caption.mutableCopy();
    EXPECT_TRUE(caption.isEqual(other));
    other->setRubyText("かんじ", {0, 2});
    EXPECT_FALSE(caption.isEqual(other));
    EXPECT_TRUE(other->copy()->isEqual(other)) << "ruby is copied";
    other->setRubyText(KVString(), {0, 2});
    EXPECT_TRUE(caption.isEqual(other));
    other->setRegionString("top");
    EXPECT_FALSE(caption.isEqual(other));
}

// --- Copies and archives, for every class ---

std::vector<KVNSRef<KVCaption*>> oneOfEachClass()
{
    auto const text = KVMakeRef<NSMutableAttributedString>(KVString("漢字 and more"));
    text->addAttribute(NSForegroundColorAttributeName, NSColor::navyColor(), {3, 3});
    text->addAttribute(NSFontAttributeName, NSFont::systemFont(true), {0, 5});
    KVMutableCaptioniTT ruby(text, twoSeconds, "bottom");
    ruby.setRubyText("かんじ", {0, 2});
    return {
        KVMakeRef<KVCaption>(text, twoSeconds),
        KVMakeRef<KVMutableCaption>(text, twoSeconds),
        KVMakeRef<KVCaptionSRT>(text, twoSeconds),
        KVMakeRef<KVMutableCaptionSRT>(text, twoSeconds),
        KVMakeRef<KVCaptionCEA608>(text, twoSeconds, 1, 2, 3, 4, 5),
        KVMakeRef<KVMutableCaptionCEA608>(text, twoSeconds, 1, 2, 3, 4, 5),
        KVMakeRef<KVCaptioniTT>(ruby),
        KVMakeRef<KVMutableCaptioniTT>(ruby),
    };
}

TEST(KVCaption, CopiesAreOfTheSameClassAndMutableCopiesOfItsPartner)
{
    for (KVNSRef<KVCaption*> const& caption : oneOfEachClass()) {
        auto const isMutable = [](KVCaption const* c) {
            return dynamic_cast<KVMutableCaptionProtocol const*>(c) != nullptr;
        };
        KVNSRef<KVCaption*> const copy = caption->copy();
        EXPECT_TRUE(copy->isEqual(caption));
        EXPECT_EQ(copy->hash(), caption->hash());
        EXPECT_EQ(isMutable(copy), isMutable(caption));
        KVNSRef<KVCaption*> const other = caption->mutableCopy();
        EXPECT_TRUE(other->isEqual(caption));
        EXPECT_TRUE(isMutable(other));
        auto* changeable = dynamic_cast<KVMutableCaptionProtocol*>(other.get());
        changeable->setFontStyle(2, {0, 1});
        EXPECT_FALSE(other->isEqual(caption)) << "a copy is independent";
    }
}

TEST(KVCaption, ComesBackFromAnArchiveAsTheSameClass)
{
    for (KVNSRef<KVCaption*> const& caption : oneOfEachClass()) {
        KVKeyedCoder coder;
        coder.encodeObject(caption, "caption");
        auto const reader = KVKeyedCoder::fromBytes(coder.archivedBytes());
        ASSERT_TRUE(reader);
        auto const back = reader->decodeObjectOfClass<KVCaption>(caption->codingClass(), "caption");
        ASSERT_TRUE(back);
        EXPECT_TRUE(back->isEqual(caption));
        EXPECT_EQ(&back->codingClass(), &caption->codingClass());
    }
    NSRange range;
    KVKeyedCoder coder;
    coder.encodeObject(oneOfEachClass()[6], "caption");
    auto const timed = coder.decodeObjectOfClass<KVCaptioniTT>(KVCaptioniTT::coding, "caption");
    EXPECT_TRUE(timed->hasRuby());
    EXPECT_EQ(timed->rubyTextAtIndex(0, &range).toUTF8(), "かんじ");
    EXPECT_EQ(range, (NSRange{0, 2})) << "the entries of one ruby are one object again";
}

TEST(KVCaption, AnArchiveWithStrangeValuesGivesWhatThereIs)
{
    KVKeyedCoder nothing;
    KVCaptioniTT const empty(nothing);
    EXPECT_TRUE(empty.text().isNull());
    EXPECT_TRUE(CMTimeRangeEqual(empty.timeRange(), kCMTimeRangeZero));
    EXPECT_FALSE(empty.hasRuby());

    // A format that is not the class's, fewer ruby entries than units and a flag that they belie.
    KVKeyedCoder strange;
    strange.encodeObject(plain("abc"), "attributedString");
    strange.encodeInt64(1, "format");
    strange.encodeBytes("short", 5, "timeRange");
    std::vector<NSObject const*> const entries = {NSNull::null()};
    strange.encodeObject(KVMakeRef<NSArray>(entries), "rubyText");
    strange.encodeBool(true, "hasRuby");
    KVMutableCaptioniTT caption(strange);
    EXPECT_EQ(caption.format(), 2);
    EXPECT_TRUE(CMTimeRangeEqual(caption.timeRange(), kCMTimeRangeZero));
    EXPECT_TRUE(caption.hasRuby()) << "taken from the archive, not counted again";
    NSRange range;
    EXPECT_TRUE(caption.rubyTextAtIndex(2, &range).isNull());
    EXPECT_EQ(range, (NSRange{0, 3}));
    caption.setRubyText("x", {1, 2});
    EXPECT_EQ(caption.rubyTextAtIndex(2).toUTF8(), "x");
}

} // namespace
