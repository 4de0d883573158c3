#include <korvane/captions/KVCaptionSRT.h>

#include <korvane/captions/KVCaptionText_p.h>

KVCaptionSRT::KVCaptionSRT(NSAttributedString const* string, CMTimeRange const& timeRange)
    : KVCaption(KVCopyOnBlack(string), timeRange)
{}

void KVCaptionSRT::assignAttributedString(NSAttributedString const* string)
{
    attributedStringInternal_ = KVCopyOnBlack(string);
}

KVCaption* KVCaptionSRT::newCopy() const
{
    return new KVCaptionSRT(*this);
}

KVCaption* KVCaptionSRT::newMutableCopy() const
{
    return new KVMutableCaptionSRT(attributedString(), timeRange());
}

KVNSRef<KVCaptionSRT*> KVCaptionSRT::copy() const
{
    return KVNSRef<KVCaptionSRT*>::adopt(static_cast<KVCaptionSRT*>(newCopy()));
}

KVNSRef<KVMutableCaptionSRT*> KVCaptionSRT::mutableCopy() const
{
    return KVMakeRef<KVMutableCaptionSRT>(attributedString(), timeRange());
}

NSCodingClass const KVCaptionSRT::coding = {
    "KVCaptionSRT",
    [](NSCoder& coder) -> KVNSRef<NSObject*> { return KVMakeRef<KVCaptionSRT>(coder); }};

NSCodingClass const KVMutableCaptionSRT::coding = {
    "KVMutableCaptionSRT",
    [](NSCoder& coder) -> KVNSRef<NSObject*> { return KVMakeRef<KVMutableCaptionSRT>(coder); }};
