#pragma once

#include <korvane/foundation/KVNSRef.h>
#include <korvane/platform/CMTime.h>
#include <korvane/platform/NSCoder.h>

/// A time as an object, to be kept in arrays and archives. Immutable.
///
///     auto const cut = KVMakeRef<VexTimeObj>(CMTimeMake(1001, 24000));
///     cut->compareWithTime(kCMTimeZero);      // kCFCompareGreaterThan
class KV_EXPORT VexTimeObj : public NSObject, public NSCoding {
public:
    explicit VexTimeObj(CMTime const& time) noexcept : time_(time) {}
    static KVNSRef<VexTimeObj*> timeWithTime(CMTime const& time);
    static KVNSRef<VexTimeObj*> initWithCMTime(CMTime const& time);
    static KVNSRef<VexTimeObj*> initWithVexTime(CMTime const& time);

    CMTime time() const noexcept { return time_; }
    void getValue(CMTime* out) const noexcept { *out = time_; }

    /// By `CMTimeCompare`; any time comes after null.
    CFComparisonResult compare(VexTimeObj const* other) const noexcept;
    CFComparisonResult compareWithTime(CMTime const& time) const noexcept;

    /// Another VexTimeObj with an equal time: 1/2 equals 2/4.
    bool isEqual(NSObject const* other) const override;
    /// `GetCMTimeHash`, without its wrapping.
    std::size_t hash() const override;
    /// As `KV_CMTimeToString` has it.
    KVString description() const override;

    // --- Archive: key "time"; see KVTimeCoding.h ---

    static NSCodingClass const coding;
    NSCodingClass const& codingClass() const override { return coding; }
    void encodeWithCoder(NSCoder& coder) const override;
    static KVNSRef<NSObject*> initWithCoder(NSCoder& coder);

private:
    CMTime time_;
};
