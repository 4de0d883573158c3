#pragma once

#include <korvane/captions/KVMutableCaption.h>

class KVMutableCaptioniTT;

/// A caption of timed text (iTT, a profile of W3C TTML): text on black in a named region, with
/// ruby, small text beside the main one.
///
///     auto caption = KVMakeRef<KVMutableCaptioniTT>(text, range, "bottom");
///     caption->setRubyText("かんじ", {0, 2});
///     caption->rubyTextAtIndex(1);      // "かんじ"
class KV_EXPORT KVCaptioniTT : public KVCaption {
public:
    /// One entry for each UTF-16 unit of the text: the ruby's string, or NSNull. The units of one
    /// annotation hold the same object.
    using RubyText = std::vector<KVNSRef<NSObject const*>>;

    /// The background becomes black, as in KVCaptionSRT; there is no ruby at first.
    KVCaptioniTT(NSAttributedString const* string, CMTimeRange const& timeRange,
                 KVString const& region);
    /// The entries and `hasRuby` are taken as they come.
    explicit KVCaptioniTT(NSCoder& coder);

    int format() const noexcept override { return 2; }

    KVString const& regionString() const noexcept { return regionString_; }
    RubyText const& rubyText() const noexcept { return rubyText_; }
    bool hasRuby() const noexcept { return hasRubyInternal_; }
    bool hasRubyInternal() const noexcept { return hasRubyInternal_; }
    /// Looks at the entries again.
    void recalculateHasRuby() noexcept;
    /// The ruby over a unit, the null string for none, and the widest run whose entries are the
    /// same object.
    KVString rubyTextAtIndex(std::size_t index, NSRange* range = nullptr) const;

    /// That many NSNull.
    static RubyText nullArrayWithCapacity(std::size_t count);

    bool isEqual(NSObject const* other) const override;
    std::size_t hash() const override;

    KVCaption* newCopy() const override;
    KVCaption* newMutableCopy() const override;
    KVNSRef<KVCaptioniTT*> copy() const;
    KVNSRef<KVMutableCaptioniTT*> mutableCopy() const;

    /// Adds the keys "regionString", "rubyText" (an array of strings and NSNull), "hasRuby".
    static NSCodingClass const coding;
    NSCodingClass const& codingClass() const override { return coding; }
    void encodeWithCoder(NSCoder& coder) const override;

protected:
    /// Drops the ruby if the plain text changes; a change of attributes alone keeps it.
    void assignAttributedString(NSAttributedString const* string) override;
    KVString regionString_;
    RubyText rubyText_;
    bool hasRubyInternal_ = false;
};

class KV_EXPORT KVMutableCaptioniTT final
    : public KVMutableCaptionOf<KVCaptioniTT, KVMutableCaptioniTT> {
public:
    using KVMutableCaptionOf::KVMutableCaptionOf;

    void setRegionString(KVString const& region) { regionString_ = region; }
    /// The null string removes the ruby.
    void setRubyText(KVString const& ruby, NSRange range);

    static NSCodingClass const coding;
};
