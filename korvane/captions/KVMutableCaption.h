#pragma once

#include <korvane/captions/KVCaption.h>

/// What can be changed in a caption of any format. Ranges count UTF-16 units and are clipped to the
/// text.
///
///     caption->setTextColor(NSColor::goldColor(), {0, 5});
///     caption->setFontWeight(KVCaption::fontWeightBold, {0, 5});
class KV_EXPORT KVMutableCaptionProtocol {
public:
    virtual ~KVMutableCaptionProtocol();

    /// The string is copied; null stands for no text.
    virtual void setAttributedString(NSAttributedString const* string) = 0;
    virtual void setTimeRange(CMTimeRange const& timeRange) = 0;

    // Each makes a changed copy of the string and hands it to `setAttributedString`.
    /// A null colour removes the attribute.
    void setTextColor(CGColor const* color, NSRange range);
    void setBackgroundColor(CGColor const* color, NSRange range);
    /// Becomes the number of the underline attribute.
    void setFontDecoration(long long decoration, NSRange range);
    /// 2 makes the fonts bold, any other number regular.
    void setFontWeight(int weight, NSRange range);
    /// 2 makes the fonts italic, any other number upright.
    void setFontStyle(int style, NSRange range);

protected:
    virtual NSAttributedString const* styledString() const noexcept = 0;
};

/// The write operations over one of the immutable classes, for the class `Mutable` that derives
/// from this and has a `coding` of its own. It adds no state.
template <class Immutable, class Mutable>
class KVMutableCaptionOf : public Immutable, public KVMutableCaptionProtocol {
public:
    using Immutable::Immutable;
    explicit KVMutableCaptionOf(Immutable const& other) : Immutable(other) {}

    KVCaption* newCopy() const override { return copy().leak(); }
    KVNSRef<Mutable*> copy() const
    {
        return KVMakeRef<Mutable>(static_cast<Mutable const&>(*this));
    }
    NSCodingClass const& codingClass() const override { return Mutable::coding; }

    void setAttributedString(NSAttributedString const* string) override
    {
        this->assignAttributedString(string);
    }
    void setTimeRange(CMTimeRange const& timeRange) override { this->timeRange_ = timeRange; }

protected:
    NSAttributedString const* styledString() const noexcept override
    {
        return this->attributedString();
    }
};

class KV_EXPORT KVMutableCaption final : public KVMutableCaptionOf<KVCaption, KVMutableCaption> {
public:
    using KVMutableCaptionOf::KVMutableCaptionOf;

    static NSCodingClass const coding;
};
