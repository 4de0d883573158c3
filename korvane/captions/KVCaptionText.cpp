#include <korvane/captions/KVCaptionText.h>

#include <korvane/captions/KVCaptionCEA608.h>
#include <korvane/captions/KVCaptionSRT.h>
#include <korvane/captions/KVCaptionText_p.h>
#include <korvane/captions/KVCaptioniTT.h>

#include <korvane/platform/CFNumber.h>

#include <algorithm>

// --- Styles of a string ---

namespace {

/// The attribute as an object of its class; null for another class, no attribute or no string.
template <class T>
T const* attributeOf(NSAttributedString const* string, NSAttributeName name, std::size_t index,
                     NSRange* range)
{
    if (!string) {
        if (range)
            *range = {0, 0};
        return nullptr;
    }
    return dynamic_cast<T const*>(string->attribute(name, index, range));
}

} // namespace

NSColor const* KVStyle::textColor(NSAttributedString const* string, std::size_t index,
                                  NSRange* range)
{
    return attributeOf<NSColor>(string, NSForegroundColorAttributeName, index, range);
}

NSColor const* KVStyle::backgroundColor(NSAttributedString const* string, std::size_t index,
                                        NSRange* range)
{
    return attributeOf<NSColor>(string, NSBackgroundColorAttributeName, index, range);
}

long long KVStyle::decoration(NSAttributedString const* string, std::size_t index, NSRange* range)
{
    auto const* number = attributeOf<NSNumber>(string, NSUnderlineStyleAttributeName, index, range);
    return number ? number->int64Value() : 0;
}

bool KVStyle::isItalic(NSAttributedString const* string, std::size_t index, NSRange* range)
{
    auto const* font = attributeOf<NSFont>(string, NSFontAttributeName, index, range);
    return font && font->isItalic();
}

bool KVStyle::isBold(NSAttributedString const* string, std::size_t index, NSRange* range)
{
    auto const* font = attributeOf<NSFont>(string, NSFontAttributeName, index, range);
    return font && font->isBold();
}

// --- Black background ---

KVNSRef<NSColor const*> KVBlackForTextColor(NSColor const* textColor)
{
    // Never destroyed: captions may outlive main.
    static NSColor const* const sRGBBlack = NSColor::blackColor().leak();
    if (!textColor || textColor->colorSpaceName().view() == sRGBBlack->colorSpaceName().view())
        return sRGBBlack;
    return KVMakeRef<NSColor>(0, 0, 0, 1, textColor->colorSpaceName());
}

KVNSRef<NSMutableAttributedString*> stringWithBlackBackground(NSAttributedString const* string)
{
    if (!string)
        return nullptr;
    KVNSRef<NSMutableAttributedString*> result = string->mutableCopy();
    KVNSRef<NSColor const*> const black =
        KVBlackForTextColor(KVStyle::textColor(string, 0, nullptr));
    result->addAttribute(NSBackgroundColorAttributeName, black, {0, result->length()});
    return result;
}

KVNSRef<NSAttributedString const*> KVCopyOnBlack(NSAttributedString const* string)
{
    if (!string)
        return nullptr;
    KVNSRef<NSColor const*> const black =
        KVBlackForTextColor(KVStyle::textColor(string, 0, nullptr));
    auto const isOnBlack = [&black](NSAttributedString::Run const& run) {
        return run.attributes &&
               CFEqual(run.attributes->value(NSBackgroundColorAttributeName), black.get());
    };
    if (std::all_of(string->runs().begin(), string->runs().end(), isOnBlack))
        return string->copy();
    return stringWithBlackBackground(string)->copy();
}

// --- Styled text ---

namespace {

/// The value of one property from unit to unit, asked for once a run.
template <class Query>
class RunCursor {
public:
    RunCursor(NSAttributedString const& string, Query* query) : string_(string), query_(query) {}

    auto at(std::size_t index)
    {
        if (index >= end_) {
            NSRange range;
            value_ = query_(&string_, index, &range);
            end_ = std::max(NSMaxRange(range), index + 1);
        }
        return value_;
    }
    /// Where the value that was answered last ends.
    std::size_t end() const noexcept { return end_; }

private:
    using Value = decltype(std::declval<Query*>()(nullptr, 0, nullptr));

    NSAttributedString const& string_;
    Query* query_;
    Value value_{};
    std::size_t end_ = 0;
};

/// All properties advance together, so that the work grows with the runs and not with their square.
KVNSRef<NSMutableAttributedString*> styledText(NSAttributedString const* string)
{
    if (!string)
        return KVMakeRef<NSMutableAttributedString>();
    RunCursor textColor(*string, KVStyle::textColor);
    RunCursor background(*string, KVStyle::backgroundColor);
    RunCursor italic(*string, KVStyle::isItalic);
    RunCursor bold(*string, KVStyle::isBold);
    RunCursor decoration(*string, KVStyle::decoration);

    std::vector<NSAttributedString::Run> runs;
    for (std::size_t index = 0; index < string->length(); index = runs.back().end) {
        NSAttributes::Values values;
        values[NSForegroundColorAttributeName] = textColor.at(index);
        values[NSBackgroundColorAttributeName] = background.at(index);
        bool const isItalic = italic.at(index);
        values[NSFontAttributeName] = NSFont::systemFont(bold.at(index), isItalic);
        if (long long const underline = decoration.at(index))
            values[NSUnderlineStyleAttributeName] = KVMakeRef<NSNumber>(underline);
        std::size_t const end = std::min(
            {textColor.end(), background.end(), italic.end(), bold.end(), decoration.end()});
        runs.push_back({end, KVMakeRef<NSAttributes>(std::move(values))});
    }
    return KVMakeRef<NSMutableAttributedString>(string->string(), std::move(runs));
}

} // namespace

KVNSRef<NSMutableAttributedString*> KVAttributedStringFromCaption(KVCaption const* caption)
{
    return caption ? styledText(caption->attributedString()) : nullptr;
}

KVNSRef<NSMutableAttributedString*> KVAttributedStringFromCaption(AVCaption const* caption)
{
    return caption ? styledText(caption->attributedString()) : nullptr;
}

// --- The player's captions ---

KVNSRef<KVCaption*> KVCaptionFromAVCaption(AVCaption const* caption)
{
    if (!caption)
        return nullptr;
    KVNSRef<NSMutableAttributedString*> const text = KVAttributedStringFromCaption(caption);
    AVCaptionRegion const* region = caption->region();
    AVCaptionRegion::Kind const kind = region ? region->kind() : AVCaptionRegion::Kind::subRip;
    switch (kind) {
    case AVCaptionRegion::Kind::cells:
        return KVMakeRef<KVCaptionCEA608>(text, caption->timeRange(), region->cellX(),
                                          region->cellY(), region->height(), caption->animation(),
                                          region->scroll());
    case AVCaptionRegion::Kind::identifier: {
        KVMutableCaptioniTT withRuby(text, caption->timeRange(), region->identifier());
        KVSetRubyFromAVCaption(&withRuby, caption);
        return KVMakeRef<KVCaptioniTT>(withRuby);
    }
    case AVCaptionRegion::Kind::subRip:
        break;
    }
    return KVMakeRef<KVCaptionSRT>(text, caption->timeRange());
}

KVNSRef<AVCaption*> KVCaptionToAVCaption(KVCaption const* caption)
{
    if (!caption)
        return nullptr;
    auto result = KVMakeRef<AVCaption>(caption->text(), caption->timeRange());
    KVSetAttributedStringToCaption(result, caption->attributedString());
    result->setRegion(AVCaptionRegionFromKVCaption(caption));
    if (auto const* cells = dynamic_cast<KVCaptionCEA608 const*>(caption))
        result->setAnimation(cells->animationBehavior());
    if (auto const* timed = dynamic_cast<KVCaptioniTT const*>(caption)) {
        NSRange run;
        for (std::size_t index = 0; index < caption->text().view().size();
             index = NSMaxRange(run)) {
            KVString const ruby = timed->rubyTextAtIndex(index, &run);
            if (!ruby.isNull())
                result->addRuby(KVMakeRef<AVCaptionRuby>(ruby), run);
        }
    }
    return result;
}

KVNSRef<AVCaptionRegion*> AVCaptionRegionFromKVCaption(KVCaption const* caption)
{
    if (!caption)
        return nullptr;
    if (auto const* cells = dynamic_cast<KVCaptionCEA608 const*>(caption)) {
        return AVCaptionRegion::regionWithCells(cells->cellX(), cells->cellY(), cells->height(),
                                                cells->scrollBehavior());
    }
    if (auto const* timed = dynamic_cast<KVCaptioniTT const*>(caption))
        return AVCaptionRegion::regionWithIdentifier(timed->regionString());
    return AVCaptionRegion::subRipTextBottomRegion();
}

void KVSetRubyFromAVCaption(KVMutableCaptioniTT* caption, AVCaption const* from)
{
    if (!caption || !from)
        return;
    for (AVCaption::RubyRun const& run : from->rubyRuns())
        caption->setRubyText(run.ruby->text(), run.range);
}

void KVSetAttributedStringToCaption(AVCaption* caption, NSAttributedString const* string)
{
    if (caption && string)
        caption->setAttributes(string);
}
