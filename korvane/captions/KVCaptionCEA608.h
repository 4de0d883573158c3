#pragma once

#include <korvane/captions/KVMutableCaption.h>

class KVMutableCaptionCEA608;

/// A line-21 broadcast caption (CEA-608): text that stands in a grid of character cells.
///
///     // Column 4, row 12, one row high, no animation, no scrolling.
///     auto caption = KVMakeRef<KVCaptionCEA608>(text, range, 4, 12, 1, 0, 0);
///     caption->maxCellX();   // 4 + length - 1
///
/// Positions are cells, from the upper left. The two behaviours are the host's own numbers; they
/// are kept and handed over.
class KV_EXPORT KVCaptionCEA608 : public KVCaption {
public:
    KVCaptionCEA608(NSAttributedString const* string, CMTimeRange const& timeRange, long long cellX,
                    long long cellY, long long height, long long animationBehavior,
                    long long scrollBehavior);
    explicit KVCaptionCEA608(NSCoder& coder);

    int format() const noexcept override { return 1; }

    long long cellX() const noexcept { return cellX_; }
    long long cellY() const noexcept { return cellY_; }
    /// Rows of cells.
    long long height() const noexcept { return height_; }
    long long animationBehavior() const noexcept { return animationBehavior_; }
    long long scrollBehavior() const noexcept { return scrollBehavior_; }
    /// The column of the last unit; for an empty text one to the left of `cellX`.
    long long maxCellX() const noexcept;
    /// `cellX` plus half the text's length, rounded down.
    long long midCellX() const noexcept;

    bool isEqual(NSObject const* other) const override;
    std::size_t hash() const override;

    KVCaption* newCopy() const override;
    KVCaption* newMutableCopy() const override;
    KVNSRef<KVCaptionCEA608*> copy() const;
    KVNSRef<KVMutableCaptionCEA608*> mutableCopy() const;

    /// Adds the keys "cellX", "cellY", "height", "animationBehavior", "scrollBehavior".
    static NSCodingClass const coding;
    NSCodingClass const& codingClass() const override { return coding; }
    void encodeWithCoder(NSCoder& coder) const override;

protected:
    long long cellX_;
    long long cellY_;
    long long height_;
    long long animationBehavior_;
    long long scrollBehavior_;
};

class KV_EXPORT KVMutableCaptionCEA608 final
    : public KVMutableCaptionOf<KVCaptionCEA608, KVMutableCaptionCEA608> {
public:
    using KVMutableCaptionOf::KVMutableCaptionOf;

    void setCellX(long long cellX) noexcept { cellX_ = cellX; }
    void setCellY(long long cellY) noexcept { cellY_ = cellY; }
    void setHeight(long long height) noexcept { height_ = height; }
    void setAnimationBehavior(long long behavior) noexcept { animationBehavior_ = behavior; }
    void setScrollBehavior(long long behavior) noexcept { scrollBehavior_ = behavior; }

    static NSCodingClass const coding;
};
