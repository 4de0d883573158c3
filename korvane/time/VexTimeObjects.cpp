#include <korvane/platform/Int128_p.h>
#include <korvane/time/CMTimeRangeAndNonretainedObject.h>
#include <korvane/time/KVTime.h>
#include <korvane/time/KVTimeCoding.h>
#include <korvane/time/VexTimePairObj.h>
#include <korvane/time/VexTimeRangeAndObject.h>

#include <typeinfo>

namespace {

/// Equal for times that CMTimeCompare finds equal, and GetCMTimeHash where that does not wrap.
std::size_t hashOf(CMTime const& time) noexcept
{
    if (!CMTimeIsNumeric(time) || time.timescale == 0)
        return 0;
    return static_cast<std::uint32_t>(kv::int128{time.value} * 1024 / time.timescale);
}

std::size_t hashOf(CMTime const& a, CMTime const& b) noexcept
{
    return hashOf(a) * 31 + hashOf(b);
}

bool isEqual(CMTime const& a, CMTime const& b) noexcept
{
    return CMTimeCompare(a, b) == 0;
}

CFComparisonResult order(CMTime const& a, CMTime const& b) noexcept
{
    return static_cast<CFComparisonResult>(CMTimeCompare(a, b));
}

} // namespace

// --- VexTimeObj ---

NSCodingClass const VexTimeObj::coding = {"VexTimeObj", &VexTimeObj::initWithCoder};

KVNSRef<VexTimeObj*> VexTimeObj::timeWithTime(CMTime const& time)
{
    return KVMakeRef<VexTimeObj>(time);
}

KVNSRef<VexTimeObj*> VexTimeObj::initWithCMTime(CMTime const& time)
{
    return KVMakeRef<VexTimeObj>(time);
}

KVNSRef<VexTimeObj*> VexTimeObj::initWithVexTime(CMTime const& time)
{
    return KVMakeRef<VexTimeObj>(time);
}

CFComparisonResult VexTimeObj::compare(VexTimeObj const* other) const noexcept
{
    return other ? compareWithTime(other->time_) : kCFCompareGreaterThan;
}

CFComparisonResult VexTimeObj::compareWithTime(CMTime const& time) const noexcept
{
    return order(time_, time);
}

bool VexTimeObj::isEqual(NSObject const* other) const
{
    auto const* time = dynamic_cast<VexTimeObj const*>(other);
    return time && ::isEqual(time_, time->time_);
}

std::size_t VexTimeObj::hash() const
{
    return hashOf(time_);
}

KVString VexTimeObj::description() const
{
    return KV_CMTimeToString(time_);
}

void VexTimeObj::encodeWithCoder(NSCoder& coder) const
{
    KVEncodeCMTime(coder, time_, "time");
}

KVNSRef<NSObject*> VexTimeObj::initWithCoder(NSCoder& coder)
{
    auto const time = KVDecodeCMTime(coder, "time");
    return time ? KVMakeRef<VexTimeObj>(*time) : nullptr;
}

// --- VexTimePairObj ---

NSCodingClass const VexTimePairObj::coding = {"VexTimePairObj", &VexTimePairObj::initWithCoder};

KVNSRef<VexTimePairObj*> VexTimePairObj::pairWithPair(KVCMTimePair const& pair)
{
    return KVMakeRef<VexTimePairObj>(pair);
}

bool VexTimePairObj::isEqual(NSObject const* other) const
{
    auto const* pair = dynamic_cast<VexTimePairObj const*>(other);
    return pair && ::isEqual(first(), pair->first()) && ::isEqual(second(), pair->second());
}

std::size_t VexTimePairObj::hash() const
{
    return hashOf(first(), second());
}

KVString VexTimePairObj::description() const
{
    KVString text("(");
    text.append(KV_CMTimeToString(first()));
    text.append(", ");
    text.append(KV_CMTimeToString(second()));
    text.append(")");
    return text;
}

NSObject* VexTimePairObj::newCopy() const
{
    return new VexTimePairObj(pair_);
}

void VexTimePairObj::encodeWithCoder(NSCoder& coder) const
{
    KVEncodeCMTime(coder, first(), "first");
    KVEncodeCMTime(coder, second(), "second");
}

KVNSRef<NSObject*> VexTimePairObj::initWithCoder(NSCoder& coder)
{
    auto const first = KVDecodeCMTime(coder, "first"), second = KVDecodeCMTime(coder, "second");
    return first && second ? KVMakeRef<VexTimePairObj>(*first, *second) : nullptr;
}

// --- VexTimeRangeObj ---

NSCodingClass const VexTimeRangeObj::coding = {"VexTimeRangeObj", &VexTimeRangeObj::initWithCoder};

KVNSRef<VexTimeRangeObj*> VexTimeRangeObj::rangeWithRange(CMTimeRange const& range)
{
    return KVMakeRef<VexTimeRangeObj>(range);
}

KVNSRef<VexTimeRangeObj*> VexTimeRangeObj::initWithCMTimeRange(CMTimeRange const& range)
{
    return KVMakeRef<VexTimeRangeObj>(range);
}

KVNSRef<VexTimeRangeObj*> VexTimeRangeObj::initWithVexTimeRange(CMTimeRange const& range)
{
    return KVMakeRef<VexTimeRangeObj>(range);
}

void VexTimeRangeObj::setStart(CMTime const& start) noexcept
{
    range_ = CMTimeRangeSaferMake(start, range_.duration);
}

void VexTimeRangeObj::setEnd(CMTime const& end) noexcept
{
    range_ = KV_CMTimeRangeMakeWithStartEnd(range_.start, end);
}

void VexTimeRangeObj::setDuration(CMTime const& duration) noexcept
{
    range_ = CMTimeRangeSaferMake(range_.start, duration);
}

CFComparisonResult
VexTimeRangeObj::sortByStartTimeAscending(VexTimeRangeObj const* other) const noexcept
{
    return other ? order(range_.start, other->range_.start) : kCFCompareGreaterThan;
}

CFComparisonResult
VexTimeRangeObj::sortByStartTimeDescending(VexTimeRangeObj const* other) const noexcept
{
    return other ? order(other->range_.start, range_.start) : kCFCompareLessThan;
}

bool VexTimeRangeObj::isEqual(NSObject const* other) const
{
    auto const* range = dynamic_cast<VexTimeRangeObj const*>(other);
    return range && typeid(*range) == typeid(*this) && CMTimeRangeEqual(range_, range->range_);
}

std::size_t VexTimeRangeObj::hash() const
{
    return hashOf(range_.start, range_.duration);
}

KVString VexTimeRangeObj::description() const
{
    return KV_CMTimeRangeToString(range_);
}

NSObject* VexTimeRangeObj::newCopy() const
{
    return copyWithRange(range_).leak();
}

KVNSRef<VexTimeRangeObj*> VexTimeRangeObj::copyWithRange(CMTimeRange const& range) const
{
    return KVMakeRef<VexTimeRangeObj>(range);
}

void VexTimeRangeObj::encodeWithCoder(NSCoder& coder) const
{
    KVEncodeCMTimeRange(coder, range_, "range");
}

KVNSRef<NSObject*> VexTimeRangeObj::initWithCoder(NSCoder& coder)
{
    auto const range = KVDecodeCMTimeRange(coder, "range");
    return range ? KVMakeRef<VexTimeRangeObj>(*range) : nullptr;
}

// --- VexTimeRangeAndObject ---

NSCodingClass const VexTimeRangeAndObject::coding = {"VexTimeRangeAndObject",
                                                     &VexTimeRangeAndObject::initWithCoder};

KVNSRef<VexTimeRangeAndObject*>
VexTimeRangeAndObject::rangeAndObjectWithRange(CMTimeRange const& range, NSObject const* object)
{
    return KVMakeRef<VexTimeRangeAndObject>(range, object);
}

KVNSRef<VexTimeRangeAndObject*> VexTimeRangeAndObject::initWithCMTimeRange(CMTimeRange const& range,
                                                                           NSObject const* object)
{
    return KVMakeRef<VexTimeRangeAndObject>(range, object);
}

KVNSRef<VexTimeRangeAndObject*>
VexTimeRangeAndObject::initWithVexTimeRange(CMTimeRange const& range, NSObject const* object)
{
    return KVMakeRef<VexTimeRangeAndObject>(range, object);
}

KVNSRef<VexTimeObj*> VexTimeRangeAndObject::startTimeObject() const
{
    return KVMakeRef<VexTimeObj>(start());
}

KVNSRef<VexTimeObj*> VexTimeRangeAndObject::durationObject() const
{
    return KVMakeRef<VexTimeObj>(duration());
}

bool VexTimeRangeAndObject::isEqual(NSObject const* other) const
{
    return VexTimeRangeObj::isEqual(other) &&
           CFEqual(object_, static_cast<VexTimeRangeAndObject const*>(other)->object_);
}

KVString VexTimeRangeAndObject::description() const
{
    KVString text = VexTimeRangeObj::description();
    text.append(" ");
    text.append(object_ ? object_->description() : KVString("(null)"));
    return text;
}

KVNSRef<VexTimeRangeObj*> VexTimeRangeAndObject::copyWithRange(CMTimeRange const& range) const
{
    return KVMakeRef<VexTimeRangeAndObject>(range, object_);
}

void VexTimeRangeAndObject::encodeWithCoder(NSCoder& coder) const
{
    VexTimeRangeObj::encodeWithCoder(coder);
    coder.encodeObject(object_, "object");
}

KVNSRef<NSObject*> VexTimeRangeAndObject::initWithCoder(NSCoder& coder)
{
    auto const range = KVDecodeCMTimeRange(coder, "range");
    if (!range)
        return nullptr;
    KVNSRef<NSObject*> const object =
        coder.decodeObject("object", {&NSStringCodingClass, &NSNumberCodingClass,
                                      &NSDataCodingClass, &NSArrayCodingClass, &NSNullCodingClass,
                                      &VexTimeObj::coding, &VexTimePairObj::coding,
                                      &VexTimeRangeObj::coding, &VexTimeRangeAndObject::coding});
    return KVMakeRef<VexTimeRangeAndObject>(*range, object);
}

// --- CMTimeRangeAndNonretainedObject ---

NSCodingClass const CMTimeRangeAndNonretainedObject::coding = {
    "CMTimeRangeAndNonretainedObject", &CMTimeRangeAndNonretainedObject::initWithCoder};

KVNSRef<CMTimeRangeAndNonretainedObject*>
CMTimeRangeAndNonretainedObject::initWithCMTimeRange(CMTimeRange const& range,
                                                     NSObject const* object)
{
    return KVMakeRef<CMTimeRangeAndNonretainedObject>(range, object);
}

void CMTimeRangeAndNonretainedObject::encodeWithCoder(NSCoder& coder) const
{
    KVEncodeCMTimeRange(coder, range_, "range");
}

KVNSRef<NSObject*> CMTimeRangeAndNonretainedObject::initWithCoder(NSCoder& coder)
{
    auto const range = KVDecodeCMTimeRange(coder, "range");
    return range ? KVMakeRef<CMTimeRangeAndNonretainedObject>(*range, nullptr) : nullptr;
}
