#include "Captions.h"

#include <gtest/gtest.h>

namespace {

KVNSRef<NSAttributedString*> plain(char const* text)
{
    return KVMakeRef<NSAttributedString>(text);
}

CMTimeRange const twoSeconds = rangeOf(0, 2);

// --- Queries ---

TEST(KVCaption, StyleQueriesReportValueAndRange)
{
    KVMutableCaption caption(plain("abcdef"), twoSeconds);
    caption.setTextColor(NSColor::named("red"), {1, 2});
    caption.setFontDecoration(5, {2, 2});
    caption.setFontStyle(2, {4, 99});
    caption.setFontWeight(2, {0, 1});
    NSRange range;
    EXPECT_TRUE(caption.copyTextColorAtIndex(2, &range)->isEqual(NSColor::named("red")));
    EXPECT_EQ(range, (NSRange{1, 2}));
    EXPECT_FALSE(caption.copyTextColorAtIndex(0));
    EXPECT_EQ(caption.fontDecorationAtIndex(3, &range), 5);
    EXPECT_EQ(range, (NSRange{2, 2}));
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
    KVMutableCaption empty(plain(""), twoSeconds), none(nullptr, twoSeconds);
    none.setFontWeight(2, {0, 1});
    none.setTextColor(NSColor::blackColor(), {0, 1});
    for (KVCaption const* caption : {&empty, &none})
        for (std::size_t index : {std::size_t(0), SIZE_MAX}) {
            NSRange range{7, 7};
            EXPECT_FALSE(caption->copyTextColorAtIndex(index, &range));
            EXPECT_EQ(range, (NSRange{0, 0}));
            EXPECT_EQ(caption->fontDecorationAtIndex(index), 0);
            EXPECT_EQ(caption->fontStyleAtIndex(index), 1);
            EXPECT_EQ(caption->fontWeightAtIndex(index), 1);
        }
    EXPECT_TRUE(none.text().isNull());
}

// --- Equality ---

TEST(KVCaption, EqualityIsByFormatTimeAndStyledText)
{
    KVCaption const caption(plain("a"), twoSeconds);
    KVMutableCaption other(plain("a"), {CMTimeMake(0, 600), CMTimeMake(1200, 600)});
    EXPECT_TRUE(caption.isEqual(&other));
    EXPECT_EQ(caption.hash(), other.hash());
    other.setTextColor(NSColor::whiteColor(), {0, 1});
    KVCaption const text(plain("b"), twoSeconds), time(plain("a"), rangeOf(0, 1));
    KVCaptionCEA608 const format(plain("a"), twoSeconds, 0, 0, 0, 0, 0);
    for (KVCaption const* unequal :
         {static_cast<KVCaption const*>(&other), &text, &time,
          static_cast<KVCaption const*>(&format), static_cast<KVCaption const*>(nullptr)})
        EXPECT_FALSE(caption.isEqual(unequal));
    EXPECT_FALSE(caption.isEqual(plain("a")));
}

TEST(KVCaption, EachFieldOfCEA608Counts)
{
    KVCaptionCEA608 const caption(plain("a"), twoSeconds, 1, 2, 3, 4, 5);
    using Caption = KVMutableCaptionCEA608;
    for (auto const set : {&Caption::setCellX, &Caption::setCellY, &Caption::setHeight,
                           &Caption::setAnimationBehavior, &Caption::setScrollBehavior}) {
        auto const other = caption.mutableCopy();
        EXPECT_TRUE(caption.isEqual(other));
        (other.get()->*set)(9);
        EXPECT_FALSE(caption.isEqual(other));
        EXPECT_TRUE(other->copy()->isEqual(other));
    }
}

// --- Formats ---

TEST(KVCaptionCEA608, CellsCountFromTheFirstOne)
{
    KVCaptionCEA608 const caption(plain("abc"), twoSeconds, 5, 0, 1, 0, 0);
    EXPECT_EQ(caption.maxCellX(), 7);
    EXPECT_EQ(caption.midCellX(), 6);
    KVCaptionCEA608 const empty(plain(""), twoSeconds, INT64_MIN, 0, 1, 0, 0);
    EXPECT_EQ(empty.maxCellX(), INT64_MAX) << "wraps, never traps";
    EXPECT_EQ(empty.midCellX(), INT64_MIN);
}

TEST(KVCaptionSRT, IsAlwaysOnBlack)
{
    auto const red = KVMakeRef<NSMutableAttributedString>(KVString("text"));
    red->addAttribute(NSBackgroundColorAttributeName, NSColor::named("red"), {0, 4});
    KVMutableCaptionSRT caption(plain("other"), twoSeconds);
    caption.setAttributedString(red);
    caption.setBackgroundColor(NSColor::named("red"), {1, 2});
    NSRange range;
    EXPECT_TRUE(caption.copyBackgroundColorAtIndex(1, &range)->isEqual(NSColor::blackColor()));
    EXPECT_EQ(range, (NSRange{0, 4}));
    EXPECT_TRUE(KVCaptionSRT(red, twoSeconds).mutableCopy()->isEqual(caption.copy()));
    EXPECT_TRUE(red->attribute(NSBackgroundColorAttributeName, 0)->isEqual(NSColor::named("red")))
        << "the string that was given is copied";
}

TEST(KVCaptioniTT, RubyStandsOverRunsOfOneObject)
{
    KVMutableCaptioniTT caption(plain("漢字です"), twoSeconds, "bottom");
    caption.setRubyText("かんじ", {0, 2});
    NSRange range;
    EXPECT_EQ(caption.rubyTextAtIndex(1, &range).toUTF8(), "かんじ");
    EXPECT_EQ(range, (NSRange{0, 2}));
    EXPECT_TRUE(caption.rubyTextAtIndex(2, &range).isNull());
    EXPECT_EQ(range, (NSRange{2, 2}));
    EXPECT_TRUE(caption.rubyTextAtIndex(4, &range).isNull());
    EXPECT_EQ(range, (NSRange{4, 0}));
    // Equal texts of two objects are two runs.
    caption.setRubyText("かんじ", {2, SIZE_MAX});
    caption.rubyTextAtIndex(1, &range);
    EXPECT_EQ(range, (NSRange{0, 2}));

    caption.setRubyText(KVString(), {0, 2});
    EXPECT_TRUE(caption.hasRuby());
    caption.setRubyText(KVString(), {2, 2});
    EXPECT_FALSE(caption.hasRuby());
    caption.setRubyText("x", {9, 1});
    EXPECT_FALSE(caption.hasRuby()) << "a range beyond the text sets nothing";

    // A change of attributes keeps the ruby, one of the text drops it.
    caption.setRubyText("かんじ", {0, 2});
    caption.setTextColor(NSColor::goldColor(), {0, 1});
    EXPECT_TRUE(caption.hasRuby());
    caption.setAttributedString(plain("漢字"));
    EXPECT_FALSE(caption.hasRuby());
}

TEST(KVCaptioniTT, RegionAndRubyCountInEquality)
{
    KVCaptioniTT const caption(plain("漢字"), twoSeconds, "bottom");
    auto const ruby = caption.mutableCopy(), region = ruby->copy();
    ruby->setRubyText("かんじ", {0, 2});
    region->setRegionString("top");
    EXPECT_FALSE(caption.isEqual(ruby));
    EXPECT_FALSE(caption.isEqual(region));
    ruby->setRubyText(KVString(), {0, 2});
    EXPECT_TRUE(caption.isEqual(ruby));
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

TEST(KVCaption, CopiesAndArchivesAreOfTheSameClassAndMutableCopiesOfItsPartner)
{
    auto const isMutable = [](KVCaption const* c) {
        return dynamic_cast<KVMutableCaptionProtocol const*>(c) != nullptr;
    };
    for (KVNSRef<KVCaption*> const& caption : oneOfEachClass()) {
        KVNSRef<KVCaption*> const copy = caption->copy(), other = caption->mutableCopy();
        EXPECT_TRUE(copy->isEqual(caption) && other->isEqual(caption));
        EXPECT_EQ(copy->hash(), caption->hash());
        EXPECT_EQ(isMutable(copy), isMutable(caption));
        ASSERT_TRUE(isMutable(other));
        dynamic_cast<KVMutableCaptionProtocol*>(other.get())->setFontStyle(2, {0, 1});
        EXPECT_FALSE(other->isEqual(caption)) << "a copy is independent";

        KVKeyedCoder coder;
        coder.encodeObject(caption, "caption");
        auto const reader = KVKeyedCoder::fromBytes(coder.archivedBytes());
        ASSERT_TRUE(reader);
        auto const back = reader->decodeObjectOfClass<KVCaption>(caption->codingClass(), "caption");
        ASSERT_TRUE(back);
        EXPECT_TRUE(back->isEqual(caption));
        EXPECT_EQ(&back->codingClass(), &caption->codingClass());
        if (auto const* timed = dynamic_cast<KVCaptioniTT*>(back.get())) {
            NSRange range;
            EXPECT_EQ(timed->rubyTextAtIndex(0, &range).toUTF8(), "かんじ");
            EXPECT_EQ(range, (NSRange{0, 2})) << "the entries of one ruby are one object again";
        }
    }
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
