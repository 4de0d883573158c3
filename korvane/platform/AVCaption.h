#pragma once

#include <korvane/platform/CMTimeRange.h>
#include <korvane/platform/NSAttributedString.h>

/// Where a caption stands on the picture, and how text moves in there. Immutable. What a `scroll`
/// of a region and an `animation` of a caption mean is up to who sets them: they are carried as
/// they are, and 0 is none.
///
/// Three kinds: the bottom of the picture, as SubRip text has it; a place in the cell grid of
/// line-21 captions (32 columns, 15 rows); a region that a timed-text document defines under a
/// name.
class KV_EXPORT AVCaptionRegion final : public NSObject {
public:
    enum class Kind { subRip, cells, identifier };

    static KVNSRef<AVCaptionRegion*> subRipTextBottomRegion();
    /// `height` rows of cells with the upper left one at column `cellX`, row `cellY`. Not checked
    /// against the grid.
    static KVNSRef<AVCaptionRegion*> regionWithCells(long long cellX, long long cellY,
                                                     long long height, long long scroll);
    static KVNSRef<AVCaptionRegion*> regionWithIdentifier(KVString const& identifier);

    Kind kind() const noexcept { return kind_; }
    /// By kind: "subRipTextBottom", the empty string, or the region's name.
    KVString const& identifier() const noexcept { return identifier_; }
    /// In cells; 0 but for the kind `cells`.
    long long cellX() const noexcept { return cellX_; }
    long long cellY() const noexcept { return cellY_; }
    long long height() const noexcept { return height_; }
    long long scroll() const noexcept { return scroll_; }

    bool isEqual(NSObject const* other) const override;
    std::size_t hash() const override;

private:
    explicit AVCaptionRegion(Kind kind) noexcept : kind_(kind) {}

    Kind kind_;
    KVString identifier_;
    long long cellX_ = 0;
    long long cellY_ = 0;
    long long height_ = 0;
    long long scroll_ = 0;
};

/// Small text beside a caption's own, for its reading. Immutable.
class KV_EXPORT AVCaptionRuby final : public NSObject {
public:
    explicit AVCaptionRuby(KVString const& text) : text_(text) {}
    KVString const& text() const noexcept { return text_; }

    bool isEqual(NSObject const* other) const override;
    std::size_t hash() const override;

private:
    KVString text_;
};

/// A caption as a player takes it: styled text over a time range, a region, ruby over ranges of the
/// text and an animation.
///
///     CMTimeRange const range = {kCMTimeZero, CMTimeMake(2, 1)};
///     auto caption = KVMakeRef<AVCaption>("Hello", range);
///     caption->setRegion(AVCaptionRegion::subRipTextBottomRegion());
///
/// A portable model that can be changed; not synchronised.
class KV_EXPORT AVCaption final : public NSObject {
public:
    /// Ruby over the units from `range.location` on; ascending, never overlapping.
    struct RubyRun {
        NSRange range;
        KVNSRef<AVCaptionRuby const*> ruby;
    };

    AVCaption(KVString const& text, CMTimeRange const& timeRange);

    /// Never the null string.
    KVString const& text() const noexcept { return attributedString_->string(); }
    CMTimeRange const& timeRange() const noexcept { return timeRange_; }

    /// The text with its styles; unowned, never null.
    NSAttributedString const* attributedString() const noexcept { return attributedString_; }
    /// Takes over the attributes of a string with the same text; one with another text is ignored.
    void setAttributes(NSAttributedString const* styled);

    /// Unowned; null when there is none.
    AVCaptionRegion const* region() const noexcept { return region_; }
    /// Retains; null for none.
    void setRegion(AVCaptionRegion const* region) { region_ = region; }
    long long animation() const noexcept { return animation_; }
    void setAnimation(long long animation) noexcept { animation_ = animation; }

    std::vector<RubyRun> const& rubyRuns() const noexcept { return rubyRuns_; }
    /// Behind all ruby that is there; a range that is not, or is empty or beyond the text, is
    /// clipped or ignored.
    void addRuby(AVCaptionRuby const* ruby, NSRange range);

private:
    KVNSRef<NSAttributedString const*> attributedString_;
    CMTimeRange timeRange_;
    KVNSRef<AVCaptionRegion const*> region_;
    long long animation_ = 0;
    std::vector<RubyRun> rubyRuns_;
};
