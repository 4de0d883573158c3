#pragma once

#include <korvane/foundation/KVNSRef.h>
#include <korvane/platform/NSCoder.h>
#include <korvane/time/KVTimeRange.h>

class VexTimeRangeObj;

/// What the operations on sets of ranges make their results through, so that a range keeps what it
/// was attached to while it is cut or joined.
class KV_EXPORT VexTimeRangeOperationCopying : public NSObject {
public:
    /// A new object of the receiver's kind with that range and, where it has one, with the
    /// receiver's object.
    virtual KVNSRef<VexTimeRangeObj*> copyWithRange(CMTimeRange const& range) const = 0;
};

/// A range of time as an object, to be kept in arrays and archives. Arrays of them are sets of
/// ranges: see VexTimeRanges.h.
///
/// Treat one as immutable once it is in an array, though there are setters: others may share it.
class KV_EXPORT VexTimeRangeObj : public VexTimeRangeOperationCopying, public NSCoding {
public:
    explicit VexTimeRangeObj(CMTimeRange const& range) noexcept : range_(range) {}
    static KVNSRef<VexTimeRangeObj*> rangeWithRange(CMTimeRange const& range);
    static KVNSRef<VexTimeRangeObj*> initWithCMTimeRange(CMTimeRange const& range);
    static KVNSRef<VexTimeRangeObj*> initWithVexTimeRange(CMTimeRange const& range);

    CMTime start() const noexcept { return range_.start; }
    CMTime duration() const noexcept { return range_.duration; }
    /// `KV_CMTimeRangeEnd` of the range.
    CMTime end() const noexcept { return KV_CMTimeRangeEnd(range_); }
    CMTimeRange range() const noexcept { return range_; }
    void getValue(CMTimeRange* out) const noexcept { *out = range_; }

    void setRange(CMTimeRange const& range) noexcept { range_ = range; }
    /// Keeps the duration.
    void setStart(CMTime const& start) noexcept;
    /// Keeps the start; an end before it leaves the range empty.
    void setEnd(CMTime const& end) noexcept;
    /// Keeps the start; a negative duration becomes 0.
    void setDuration(CMTime const& duration) noexcept;

    /// For sorting; any range comes after null, and before it in the descending order.
    CFComparisonResult sortByStartTimeAscending(VexTimeRangeObj const* other) const noexcept;
    CFComparisonResult sortByStartTimeDescending(VexTimeRangeObj const* other) const noexcept;

    /// An object of the same class with an equal start and duration.
    bool isEqual(NSObject const* other) const override;
    std::size_t hash() const override;
    /// As `KV_CMTimeRangeToString` has it.
    KVString description() const override;
    NSObject* newCopy() const override;

    KVNSRef<VexTimeRangeObj*> copyWithRange(CMTimeRange const& range) const override;

    // --- Archive: key "range"; see KVTimeCoding.h ---

    static NSCodingClass const coding;
    NSCodingClass const& codingClass() const override { return coding; }
    void encodeWithCoder(NSCoder& coder) const override;
    static KVNSRef<NSObject*> initWithCoder(NSCoder& coder);

private:
    CMTimeRange range_;
};
