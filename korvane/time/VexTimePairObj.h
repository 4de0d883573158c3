#pragma once

#include <korvane/foundation/KVNSRef.h>
#include <korvane/platform/NSCoder.h>
#include <korvane/time/KVTimeRange.h>

/// Two times as one object. Treat one as immutable once it is shared, though there are setters.
class KV_EXPORT VexTimePairObj : public NSObject, public NSCoding {
public:
    VexTimePairObj(CMTime const& first, CMTime const& second) noexcept : pair_{first, second} {}
    explicit VexTimePairObj(KVCMTimePair const& pair) noexcept : pair_(pair) {}
    static KVNSRef<VexTimePairObj*> pairWithPair(KVCMTimePair const& pair);

    CMTime first() const noexcept { return pair_.first; }
    CMTime second() const noexcept { return pair_.second; }
    KVCMTimePair pair() const noexcept { return pair_; }
    void getValue(KVCMTimePair* out) const noexcept { *out = pair_; }

    void setFirst(CMTime const& first) noexcept { pair_.first = first; }
    void setSecond(CMTime const& second) noexcept { pair_.second = second; }
    void setPair(KVCMTimePair const& pair) noexcept { pair_ = pair; }

    /// Another VexTimePairObj with equal times.
    bool isEqual(NSObject const* other) const override;
    std::size_t hash() const override;
    /// "(first, second)"
    KVString description() const override;
    NSObject* newCopy() const override;

    // --- Archive: keys "first" and "second"; see KVTimeCoding.h ---

    static NSCodingClass const coding;
    NSCodingClass const& codingClass() const override { return coding; }
    void encodeWithCoder(NSCoder& coder) const override;
    static KVNSRef<NSObject*> initWithCoder(NSCoder& coder);

private:
    KVCMTimePair pair_;
};
