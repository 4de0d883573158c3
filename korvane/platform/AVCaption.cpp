#include <korvane/platform/AVCaption.h>

#include <algorithm>

KVNSRef<AVCaptionRegion*> AVCaptionRegion::subRipTextBottomRegion()
{
    auto region = KVNSRef<AVCaptionRegion*>::adopt(new AVCaptionRegion(Kind::subRip));
    region->identifier_ = "subRipTextBottom";
    return region;
}

KVNSRef<AVCaptionRegion*> AVCaptionRegion::regionWithCells(long long cellX, long long cellY,
                                                           long long height, long long scroll)
{
    auto region = KVNSRef<AVCaptionRegion*>::adopt(new AVCaptionRegion(Kind::cells));
    region->cellX_ = cellX;
    region->cellY_ = cellY;
    region->height_ = height;
    region->scroll_ = scroll;
    return region;
}

KVNSRef<AVCaptionRegion*> AVCaptionRegion::regionWithIdentifier(KVString const& identifier)
{
    auto region = KVNSRef<AVCaptionRegion*>::adopt(new AVCaptionRegion(Kind::identifier));
    region->identifier_ = identifier;
    return region;
}

bool AVCaptionRegion::isEqual(NSObject const* other) const
{
    auto const* region = dynamic_cast<AVCaptionRegion const*>(other);
    return region && region->kind_ == kind_ && region->cellX_ == cellX_ &&
           region->cellY_ == cellY_ && region->height_ == height_ && region->scroll_ == scroll_ &&
           region->identifier_.view() == identifier_.view();
}

std::size_t AVCaptionRegion::hash() const
{
    return CFHash(identifier_.cf_str()) + static_cast<std::size_t>(cellX_) * 31 +
           static_cast<std::size_t>(cellY_);
}

bool AVCaptionRuby::isEqual(NSObject const* other) const
{
    auto const* ruby = dynamic_cast<AVCaptionRuby const*>(other);
    return ruby && ruby->text_.view() == text_.view();
}

std::size_t AVCaptionRuby::hash() const
{
    return CFHash(text_.cf_str());
}

AVCaption::AVCaption(KVString const& text, CMTimeRange const& timeRange)
    : attributedString_(KVMakeRef<NSAttributedString>(text)), timeRange_(timeRange)
{}

void AVCaption::setAttributes(NSAttributedString const* styled)
{
    if (styled && styled->string().view() == text().view())
        attributedString_ = styled->copy();
}

void AVCaption::addRuby(AVCaptionRuby const* ruby, NSRange range)
{
    std::size_t const length = attributedString_->length();
    std::size_t const free = rubyRuns_.empty() ? 0 : NSMaxRange(rubyRuns_.back().range);
    std::size_t const location = std::min(range.location, length);
    std::size_t const start = std::max(location, free);
    std::size_t const end = location + std::min(range.length, length - location);
    if (ruby && end > start)
        rubyRuns_.push_back({{start, end - start}, ruby});
}
