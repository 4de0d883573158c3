#pragma once

#include <korvane/platform/CMTimeRange.h>
#include <korvane/platform/NSAttributedString.h>

#include <vector>

/// Styled text that is shown over a time range; immutable. The classes for what a delivery format
/// adds derive from it: KVCaptionSRT, KVCaptionCEA608 and KVCaptioniTT, and each has a mutable
/// partner.
///
///     auto text = KVMakeRef<NSAttributedString>("Good evening.");
///     auto caption = KVMakeRef<KVCaption>(text, CMTimeRangeMake(kCMTimeZero, CMTimeMake(2, 1)));
///     caption->text();     // "Good evening."
///
/// Indexes and ranges count UTF-16 units of the text. A query at or beyond its end answers the
/// value for "nothing there" (null, 0 or 1) with the empty range at the end. Immutable captions may
/// be shared between threads, mutable ones have no lock.
class KV_EXPORT KVCaption : public NSObject, public NSCoding {
public:
    /// What `fontWeightAtIndex` and `fontStyleAtIndex` answer.
    enum : int {
        fontWeightRegular = 1,
        fontWeightBold = 2,
        fontStyleUpright = 1,
        fontStyleItalic = 2
    };

    /// The string is copied; null stands for no text.
    KVCaption(NSAttributedString const* string, CMTimeRange const& timeRange);
    /// What the coder has; a missing time range is an empty one at zero.
    explicit KVCaption(NSCoder& coder);

    // --- Read ---

    /// 0 for a caption of no particular format, 1 for CEA-608, 2 for iTT, 3 for SubRip.
    virtual int format() const noexcept { return 0; }
    /// Unowned, valid until the caption goes or changes; null for no text.
    NSAttributedString const* attributedString() const noexcept
    {
        return attributedStringInternal_;
    }
    /// The plain text; the null string for no text.
    KVString text() const;
    CMTimeRange const& timeRange() const noexcept { return timeRange_; }

    // --- Styles; `*range`, if asked for, becomes the longest range with an equal attribute ---

    KVNSRef<CGColor const*> copyTextColorAtIndex(std::size_t index, NSRange* range = nullptr) const;
    KVNSRef<CGColor const*> copyBackgroundColorAtIndex(std::size_t index,
                                                       NSRange* range = nullptr) const;
    /// The number of the underline attribute; 0 without one.
    long long fontDecorationAtIndex(std::size_t index, NSRange* range = nullptr) const;
    /// 2 if the font is italic, else 1.
    int fontStyleAtIndex(std::size_t index, NSRange* range = nullptr) const;
    /// 2 if the font is bold, else 1.
    int fontWeightAtIndex(std::size_t index, NSRange* range = nullptr) const;

    // --- Compare and copy ---

    /// Equal format, start, duration (by value) and styled text, and what a format adds. A mutable
    /// and an immutable caption can be equal.
    bool isEqual(NSObject const* other) const override;
    std::size_t hash() const override;
    KVString description() const override;

    /// An object of the receiver's own class, so a mutable caption's copy is mutable.
    KVCaption* newCopy() const override;
    /// An object of the matching mutable class.
    virtual KVCaption* newMutableCopy() const;
    KVNSRef<KVCaption*> copy() const;
    /// `dynamic_cast` to KVMutableCaptionProtocol to change it.
    KVNSRef<KVCaption*> mutableCopy() const;

    // --- Archive ---

    /// Keys "attributedString", "timeRange" (see KVTimeCoding.h), "format" (written, not read
    /// back).

    static NSCodingClass const coding;
    NSCodingClass const& codingClass() const override { return coding; }
    void encodeWithCoder(NSCoder& coder) const override;

protected:
    /// How a new text is taken over; formats with rules of their own override it.
    virtual void assignAttributedString(NSAttributedString const* string);

    KVNSRef<NSAttributedString const*> attributedStringInternal_;
    CMTimeRange timeRange_;
};

/// Captions in a row; those functions that need them sorted by start say so.
using KVCaptionArray = std::vector<KVNSRef<KVCaption*>>;
