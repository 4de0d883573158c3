#include "Captions.h"

#include <gtest/gtest.h>

namespace {

// --- Black background, styled text ---

TEST(StringWithBlackBackground, TakesTheTextColoursSpaceAtTheStart)
{
    auto const text = KVMakeRef<NSMutableAttributedString>(KVString("abc"));
    text->addAttribute(NSForegroundColorAttributeName, KVMakeRef<NSColor>(1, 0, 0, 1, "P3"),
                       {0, 1});
    text->addAttribute(NSForegroundColorAttributeName, NSColor::whiteColor(), {1, 2});
    auto const black = stringWithBlackBackground(text);
    NSRange range;
    EXPECT_TRUE(black->attribute(NSBackgroundColorAttributeName, 2, &range)
                    ->isEqual(KVMakeRef<NSColor>(0, 0, 0, 1, "P3")));
    EXPECT_EQ(range, (NSRange{0, 3}));
    EXPECT_FALSE(text->attribute(NSBackgroundColorAttributeName, 0))
        << "the argument is left alone";
    EXPECT_FALSE(stringWithBlackBackground(nullptr));
}

TEST(KVAttributedStringFromCaption, GivesEveryUnitTheSystemFontAndItsStyles)
{
    KVMutableCaption caption(KVMakeRef<NSAttributedString>("abcdef"), rangeOf(0, 1));
    caption.setFontWeight(2, {0, 2});
    caption.setFontStyle(2, {1, 2});
    caption.setFontDecoration(1, {5, 1});
    caption.setTextColor(NSColor::named("red"), {0, 3});
    auto const text = KVAttributedStringFromCaption(&caption);
    EXPECT_EQ(text->string().toUTF8(), "abcdef");
    EXPECT_EQ(stylesOf(text), "132004");
    EXPECT_EQ(coloursOf(text), "ff0000,-");
    EXPECT_EQ(text->attribute(NSFontAttributeName, 4), NSFont::systemFont());
    EXPECT_FALSE(KVAttributedStringFromCaption(static_cast<KVCaption*>(nullptr)));
    KVCaption const none(nullptr, rangeOf(0, 1));
    EXPECT_EQ(KVAttributedStringFromCaption(&none)->length(), 0u);
}

// --- Conversions ---

TEST(KVCaptionConversion, EachFormatComesBackFromThePlayersModel)
{
    KVCaption const styled(KVMakeRef<NSAttributedString>("漢字"), rangeOf(3, 5));
    auto const text = KVAttributedStringFromCaption(&styled);
    KVMutableCaptioniTT timed(text, rangeOf(3, 5), "top");
    timed.setRubyText("かんじ", {0, 2});
    KVCaptionSRT const subRip(text, rangeOf(3, 5));
    KVCaptionCEA608 const cells(text, rangeOf(3, 5), 4, 12, 1, 7, 8);
    for (KVCaption const* caption :
         {static_cast<KVCaption const*>(&timed), static_cast<KVCaption const*>(&subRip),
          static_cast<KVCaption const*>(&cells)}) {
        auto const model = KVCaptionToAVCaption(caption);
        ASSERT_TRUE(model);
        EXPECT_TRUE(KVCaptionFromAVCaption(model)->isEqual(caption)) << caption->format();
    }
    auto const model = KVCaptionToAVCaption(&timed);
    ASSERT_EQ(model->rubyRuns().size(), 1u);
    EXPECT_EQ(model->rubyRuns()[0].range, (NSRange{0, 2}));
    EXPECT_EQ(KVCaptionToAVCaption(&cells)->animation(), 7);
}

TEST(KVCaptionConversion, TheRegionFollowsTheFormat)
{
    auto const text = KVMakeRef<NSAttributedString>("a");
    auto const bottom = AVCaptionRegion::subRipTextBottomRegion();
    auto const regionOf = [](auto const& caption) {
        return AVCaptionRegionFromKVCaption(&caption);
    };
    EXPECT_TRUE(regionOf(KVCaption(text, rangeOf(0, 1)))->isEqual(bottom));
    EXPECT_TRUE(regionOf(KVCaptionSRT(text, rangeOf(0, 1)))->isEqual(bottom));
    EXPECT_TRUE(regionOf(KVCaptionCEA608(text, rangeOf(0, 1), 4, 12, 2, 7, 8))
                    ->isEqual(AVCaptionRegion::regionWithCells(4, 12, 2, 8)));
    EXPECT_TRUE(regionOf(KVCaptioniTT(text, rangeOf(0, 1), "top"))
                    ->isEqual(AVCaptionRegion::regionWithIdentifier("top")));
    EXPECT_FALSE(AVCaptionRegionFromKVCaption(nullptr));
    EXPECT_FALSE(KVCaptionToAVCaption(nullptr));
    EXPECT_FALSE(KVCaptionFromAVCaption(nullptr));
    KVSetRubyFromAVCaption(nullptr, nullptr);
    KVSetAttributedStringToCaption(nullptr, nullptr);

    AVCaption const placeless("a", rangeOf(0, 1));
    EXPECT_EQ(KVCaptionFromAVCaption(&placeless)->format(), 3);
}

TEST(AVCaption, RubyIsKeptInOrderWithinTheText)
{
    AVCaption caption("abcdef", rangeOf(0, 1));
    auto const ruby = KVMakeRef<AVCaptionRuby>("r");
    caption.addRuby(ruby, {1, 2});
    caption.addRuby(ruby, {2, 2});        // begins within the one before: cut to {3, 1}
    caption.addRuby(ruby, {0, 1});        // lies before it: ignored
    caption.addRuby(ruby, {SIZE_MAX, 4}); // beyond the text
    caption.addRuby(ruby, {5, SIZE_MAX});
    ASSERT_EQ(caption.rubyRuns().size(), 3u);
    EXPECT_EQ(caption.rubyRuns()[1].range, (NSRange{3, 1}));
    EXPECT_EQ(caption.rubyRuns()[2].range, (NSRange{5, 1}));
}

} // namespace
