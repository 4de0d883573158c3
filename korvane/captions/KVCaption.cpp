#include <korvane/captions/KVCaption.h>

#include <korvane/captions/KVCaptionText_p.h>
#include <korvane/captions/KVMutableCaption.h>

#include <korvane/platform/CFNumber.h>

#include <korvane/time/KVTimeCoding.h>
#include <korvane/time/VexTimeRangeObj.h>

KVCaption::KVCaption(NSAttributedString const* string, CMTimeRange const& timeRange)
    : attributedStringInternal_(string ? string->copy() : nullptr), timeRange_(timeRange)
{}

KVCaption::KVCaption(NSCoder& coder)
    : timeRange_(KVDecodeCMTimeRange(coder, "timeRange").value_or(kCMTimeRangeZero))
{
    KVNSRef<NSObject*> const string =
        coder.decodeObject("attributedString", {&NSAttributedString::coding});
    attributedStringInternal_ = dynamic_cast<NSAttributedString const*>(string.get());
}

void KVCaption::assignAttributedString(NSAttributedString const* string)
{
    attributedStringInternal_ = string ? string->copy() : nullptr;
}

KVString KVCaption::text() const
{
    return attributedStringInternal_ ? attributedStringInternal_->string() : KVString();
}

// --- Styles ---

KVNSRef<CGColor const*> KVCaption::copyTextColorAtIndex(std::size_t index, NSRange* range) const
{
    return KVStyle::textColor(attributedStringInternal_, index, range);
}

KVNSRef<CGColor const*> KVCaption::copyBackgroundColorAtIndex(std::size_t index,
                                                              NSRange* range) const
{
    return KVStyle::backgroundColor(attributedStringInternal_, index, range);
}

long long KVCaption::fontDecorationAtIndex(std::size_t index, NSRange* range) const
{
    return KVStyle::decoration(attributedStringInternal_, index, range);
}

int KVCaption::fontStyleAtIndex(std::size_t index, NSRange* range) const
{
    return KVStyle::isItalic(attributedStringInternal_, index, range) ? fontStyleItalic
                                                                      : fontStyleUpright;
}

int KVCaption::fontWeightAtIndex(std::size_t index, NSRange* range) const
{
    return KVStyle::isBold(attributedStringInternal_, index, range) ? fontWeightBold
                                                                    : fontWeightRegular;
}

// --- Compare and copy ---

bool KVCaption::isEqual(NSObject const* other) const
{
    if (this == other)
        return true;
    auto const* caption = dynamic_cast<KVCaption const*>(other);
    return caption && caption->format() == format() &&
           CMTimeRangeEqual(caption->timeRange_, timeRange_) &&
           CFEqual(caption->attributedStringInternal_.get(), attributedStringInternal_.get());
}

std::size_t KVCaption::hash() const
{
    std::size_t const hash = CFHash(attributedStringInternal_) * 31;
    return (hash + VexTimeRangeObj(timeRange_).hash()) * 31 + static_cast<std::size_t>(format());
}

KVString KVCaption::description() const
{
    double const start = CMTimeGetSeconds(timeRange_.start);
    return KVString::ssprintf("<caption %g s + %g s: %s>", start,
                              CMTimeGetSeconds(timeRange_.duration), text().toUTF8().c_str());
}

KVCaption* KVCaption::newCopy() const
{
    return new KVCaption(*this);
}

KVCaption* KVCaption::newMutableCopy() const
{
    return new KVMutableCaption(*this);
}

KVNSRef<KVCaption*> KVCaption::copy() const
{
    return KVNSRef<KVCaption*>::adopt(newCopy());
}

KVNSRef<KVCaption*> KVCaption::mutableCopy() const
{
    return KVNSRef<KVCaption*>::adopt(newMutableCopy());
}

// --- Archive ---

NSCodingClass const KVCaption::coding = {
    "KVCaption", [](NSCoder& coder) -> KVNSRef<NSObject*> { return KVMakeRef<KVCaption>(coder); }};

void KVCaption::encodeWithCoder(NSCoder& coder) const
{
    coder.encodeObject(attributedStringInternal_, "attributedString");
    KVEncodeCMTimeRange(coder, timeRange_, "timeRange");
    coder.encodeInt64(format(), "format");
}

// --- Mutable captions ---

KVMutableCaptionProtocol::~KVMutableCaptionProtocol() = default;

namespace {

/// Hands a copy of the caption's string, changed, back to it; a caption without text stays so.
template <class Change>
void restyle(KVMutableCaptionProtocol& caption, NSAttributedString const* string, Change change)
{
    if (!string)
        return;
    NSMutableAttributedString styled(*string);
    change(styled);
    caption.setAttributedString(&styled);
}

} // namespace

void KVMutableCaptionProtocol::setTextColor(CGColor const* color, NSRange range)
{
    restyle(*this, styledString(), [&](NSMutableAttributedString& string) {
        string.addAttribute(NSForegroundColorAttributeName, color, range);
    });
}

void KVMutableCaptionProtocol::setBackgroundColor(CGColor const* color, NSRange range)
{
    restyle(*this, styledString(), [&](NSMutableAttributedString& string) {
        string.addAttribute(NSBackgroundColorAttributeName, color, range);
    });
}

void KVMutableCaptionProtocol::setFontDecoration(long long decoration, NSRange range)
{
    restyle(*this, styledString(), [&](NSMutableAttributedString& string) {
        string.addAttribute(NSUnderlineStyleAttributeName, KVMakeRef<NSNumber>(decoration), range);
    });
}

void KVMutableCaptionProtocol::setFontWeight(int weight, NSRange range)
{
    restyle(*this, styledString(), [&](NSMutableAttributedString& string) {
        string.applyFontTraits(
            weight == KVCaption::fontWeightBold ? NSBoldFontMask : NSUnboldFontMask, range);
    });
}

void KVMutableCaptionProtocol::setFontStyle(int style, NSRange range)
{
    restyle(*this, styledString(), [&](NSMutableAttributedString& string) {
        string.applyFontTraits(
            style == KVCaption::fontStyleItalic ? NSItalicFontMask : NSUnitalicFontMask, range);
    });
}

NSCodingClass const KVMutableCaption::coding = {
    "KVMutableCaption",
    [](NSCoder& coder) -> KVNSRef<NSObject*> { return KVMakeRef<KVMutableCaption>(coder); }};
