#pragma once

#include <korvane/time/VexTimeObj.h>
#include <korvane/time/VexTimeRangeObj.h>

/// A range of time that belongs to something: a clip, a marker, a tool of the host.
///
///     auto used = KVMakeRef<VexTimeRangeAndObject>(range, clip);
///     auto pieces = VexTimeRangeObjSubtractSortedRanges(used, gaps);   // each still with its clip
class KV_EXPORT VexTimeRangeAndObject : public VexTimeRangeObj {
public:
    /// Retains the object, which may be null.
    VexTimeRangeAndObject(CMTimeRange const& range, NSObject const* object)
        : VexTimeRangeObj(range), object_(object)
    {}
    static KVNSRef<VexTimeRangeAndObject*> rangeAndObjectWithRange(CMTimeRange const& range,
                                                                   NSObject const* object);
    static KVNSRef<VexTimeRangeAndObject*> initWithCMTimeRange(CMTimeRange const& range,
                                                               NSObject const* object);
    static KVNSRef<VexTimeRangeAndObject*> initWithVexTimeRange(CMTimeRange const& range,
                                                                NSObject const* object);

    /// Unowned; lives as long as this.
    NSObject const* object() const noexcept { return object_; }
    /// The same object, by the name that tools ask for.
    NSObject const* representedToolObject() const noexcept { return object_; }
    /// New objects with the start and the duration.
    KVNSRef<VexTimeObj*> startTimeObject() const;
    KVNSRef<VexTimeObj*> durationObject() const;

    /// An object of the same class with an equal range and an equal object.
    bool isEqual(NSObject const* other) const override;
    /// The range, a blank, and the object's own description, "(null)" for none.
    KVString description() const override;

    KVNSRef<VexTimeRangeObj*> copyWithRange(CMTimeRange const& range) const override;

    // --- Archive: adds the key "object" ---

    static NSCodingClass const coding;
    NSCodingClass const& codingClass() const override { return coding; }
    void encodeWithCoder(NSCoder& coder) const override;
    /// The object is read back if it is a string, number, data, array, NSNull or one of the time
    /// objects; any other comes back as null.
    static KVNSRef<NSObject*> initWithCoder(NSCoder& coder);

private:
    KVNSRef<NSObject const*> object_;
};
