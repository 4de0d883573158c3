#pragma once

#include <korvane/foundation/KVNSRef.h>
#include <korvane/platform/CMTimeRange.h>
#include <korvane/platform/NSCoder.h>

/// A range of time beside an object that somebody else keeps alive.
class KV_EXPORT CMTimeRangeAndNonretainedObject : public NSObject, public NSCoding {
public:
    /// Does not retain: `object` must outlive all use of it through this.
    CMTimeRangeAndNonretainedObject(CMTimeRange const& range, NSObject const* object) noexcept
        : range_(range), object_(object)
    {}
    static KVNSRef<CMTimeRangeAndNonretainedObject*> initWithCMTimeRange(CMTimeRange const& range,
                                                                         NSObject const* object);

    CMTimeRange range() const noexcept { return range_; }
    NSObject const* object() const noexcept { return object_; }

    // --- Archive: key "range"; see KVTimeCoding.h ---

    static NSCodingClass const coding;
    NSCodingClass const& codingClass() const override { return coding; }
    /// The range alone, as nobody would own an object that was read back; `object` is null then.
    void encodeWithCoder(NSCoder& coder) const override;
    static KVNSRef<NSObject*> initWithCoder(NSCoder& coder);

private:
    CMTimeRange range_;
    NSObject const* object_;
};
