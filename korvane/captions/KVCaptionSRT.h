#pragma once

#include <korvane/captions/KVMutableCaption.h>

class KVMutableCaptionSRT;

/// A SubRip caption: text and styles alone, always on black. Whatever string it is given, the
/// background attribute becomes black over all of it (see `stringWithBlackBackground`).
///
///     auto caption = KVMakeRef<KVCaptionSRT>(text, range);
///     caption->copyBackgroundColorAtIndex(0);   // black
class KV_EXPORT KVCaptionSRT : public KVCaption {
public:
    KVCaptionSRT(NSAttributedString const* string, CMTimeRange const& timeRange);
    /// What the coder has, its background as it stands.
    explicit KVCaptionSRT(NSCoder& coder) : KVCaption(coder) {}

    int format() const noexcept override { return 3; }

    KVCaption* newCopy() const override;
    KVCaption* newMutableCopy() const override;
    KVNSRef<KVCaptionSRT*> copy() const;
    KVNSRef<KVMutableCaptionSRT*> mutableCopy() const;

    static NSCodingClass const coding;
    NSCodingClass const& codingClass() const override { return coding; }

protected:
    void assignAttributedString(NSAttributedString const* string) override;
};

class KV_EXPORT KVMutableCaptionSRT final
    : public KVMutableCaptionOf<KVCaptionSRT, KVMutableCaptionSRT> {
public:
    using KVMutableCaptionOf::KVMutableCaptionOf;

    static NSCodingClass const coding;
};
