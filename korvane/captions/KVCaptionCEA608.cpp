#include <korvane/captions/KVCaptionCEA608.h>

KVCaptionCEA608::KVCaptionCEA608(NSAttributedString const* string, CMTimeRange const& timeRange,
                                 long long cellX, long long cellY, long long height,
                                 long long animationBehavior, long long scrollBehavior)
    : KVCaption(string, timeRange),
      cellX_(cellX),
      cellY_(cellY),
      height_(height),
      animationBehavior_(animationBehavior),
      scrollBehavior_(scrollBehavior)
{}

KVCaptionCEA608::KVCaptionCEA608(NSCoder& coder)
    : KVCaption(coder),
      cellX_(coder.decodeInt64("cellX")),
      cellY_(coder.decodeInt64("cellY")),
      height_(coder.decodeInt64("height")),
      animationBehavior_(coder.decodeInt64("animationBehavior")),
      scrollBehavior_(coder.decodeInt64("scrollBehavior"))
{}

namespace {

/// A sum that wraps rather than overflows: `cellX` may be any number.
long long moved(long long cell, std::size_t by) noexcept
{
    return static_cast<long long>(static_cast<unsigned long long>(cell) + by);
}

} // namespace

long long KVCaptionCEA608::maxCellX() const noexcept
{
    return moved(cellX_, text().view().size() - 1);
}

long long KVCaptionCEA608::midCellX() const noexcept
{
    return moved(cellX_, text().view().size() / 2);
}

bool KVCaptionCEA608::isEqual(NSObject const* other) const
{
    if (!KVCaption::isEqual(other))
        return false;
    auto const* caption = dynamic_cast<KVCaptionCEA608 const*>(other);
    return caption && caption->cellX_ == cellX_ && caption->cellY_ == cellY_ &&
           caption->height_ == height_ && caption->animationBehavior_ == animationBehavior_ &&
           caption->scrollBehavior_ == scrollBehavior_;
}

std::size_t KVCaptionCEA608::hash() const
{
    std::size_t hash = KVCaption::hash();
    for (long long field : {cellX_, cellY_, height_, animationBehavior_, scrollBehavior_})
        hash = hash * 31 + static_cast<std::size_t>(field);
    return hash;
}

KVCaption* KVCaptionCEA608::newCopy() const
{
    return new KVCaptionCEA608(*this);
}

KVCaption* KVCaptionCEA608::newMutableCopy() const
{
    return new KVMutableCaptionCEA608(*this);
}

KVNSRef<KVCaptionCEA608*> KVCaptionCEA608::copy() const
{
    return KVNSRef<KVCaptionCEA608*>::adopt(static_cast<KVCaptionCEA608*>(newCopy()));
}

KVNSRef<KVMutableCaptionCEA608*> KVCaptionCEA608::mutableCopy() const
{
    return KVMakeRef<KVMutableCaptionCEA608>(*this);
}

NSCodingClass const KVCaptionCEA608::coding = {
    "KVCaptionCEA608",
    [](NSCoder& coder) -> KVNSRef<NSObject*> { return KVMakeRef<KVCaptionCEA608>(coder); }};

void KVCaptionCEA608::encodeWithCoder(NSCoder& coder) const
{
    KVCaption::encodeWithCoder(coder);
    coder.encodeInt64(cellX_, "cellX");
    coder.encodeInt64(cellY_, "cellY");
    coder.encodeInt64(height_, "height");
    coder.encodeInt64(animationBehavior_, "animationBehavior");
    coder.encodeInt64(scrollBehavior_, "scrollBehavior");
}

NSCodingClass const KVMutableCaptionCEA608::coding = {
    "KVMutableCaptionCEA608",
    [](NSCoder& coder) -> KVNSRef<NSObject*> { return KVMakeRef<KVMutableCaptionCEA608>(coder); }};
