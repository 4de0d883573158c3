#include "time/TimeTesting.h"

#include <korvane/korvane.h>

#include <stdexcept>

using namespace timetest;

namespace {

/// Archives, reads the bytes back and decodes the one object.
template <class T>
KVNSRef<T*> archived(T const& original)
{
    KVKeyedCoder writer;
    writer.encodeObject(&original, "object");
    auto const object = KVKeyedCoder::fromBytes(writer.archivedBytes())
                            ->template decodeObjectOfClass<T>(T::coding, "object");
    if (!object)
        throw std::runtime_error("not read back");
    return object;
}

} // namespace

TEST(VexTimeObj, ComparesByValue)
{
    auto const half = VexTimeObj::timeWithTime(T(1, 2)),
               quarters = VexTimeObj::initWithCMTime(T(2, 4)),
               third = VexTimeObj::initWithVexTime(T(1, 3));
    EXPECT_TRUE(half->isEqual(quarters));
    EXPECT_EQ(half->hash(), quarters->hash());
    EXPECT_EQ(half->hash(), GetCMTimeHash(T(1, 2)));
    EXPECT_FALSE(half->isEqual(third));
    EXPECT_FALSE(half->isEqual(nullptr));
    EXPECT_EQ(half->compare(third), kCFCompareGreaterThan);
    EXPECT_EQ(third->compare(half), kCFCompareLessThan);
    EXPECT_EQ(half->compareWithTime(T(3, 6)), kCFCompareEqualTo);
    EXPECT_EQ(half->compare(nullptr), kCFCompareGreaterThan);
    EXPECT_EQ(text(half->description()), "0.500000");
}

TEST(VexTimeObj, EqualTimesHashAlikeAtTheEnds)
{
    // GetCMTimeHash wraps here, and tells them apart.
    CMTime const whole = T(1ll << 53, 1), halves = T(1ll << 54, 2), turned = T(-(1ll << 53), -1);
    for (CMTime const& other : {halves, turned})
        EXPECT_EQ(KVMakeRef<VexTimeObj>(whole)->hash(), KVMakeRef<VexTimeObj>(other)->hash());
    EXPECT_EQ(KVMakeRef<VexTimeObj>(kCMTimeInvalid)->hash(),
              KVMakeRef<VexTimeObj>(T(5, 3, 0))->hash());
}

TEST(VexTimeRangeObj, HasEndsThatCanBeSet)
{
    auto range = VexTimeRangeObj::rangeWithRange(R(10, 15));
    EXPECT_EQ(range->end(), T(15, 1));
    range->setStart(T(12, 1));
    EXPECT_EQ(range->range(), R(12, 17)) << "the duration stays";
    range->setEnd(T(20, 1));
    EXPECT_EQ(range->range(), R(12, 20)) << "the start stays";
    range->setEnd(T(3, 1));
    EXPECT_EQ(range->range(), R(12, 12));
    range->setDuration(T(-1, 1));
    EXPECT_EQ(range->duration(), T(0, 1));
    auto const copy = KVNSRef<NSObject*>::adopt(range->newCopy());
    range->setRange(R(1, 2));
    EXPECT_FALSE(copy->isEqual(range));
    EXPECT_EQ(text(range->description()), "[1.000000, 2.000000)");
}

TEST(VexTimeRangeObj, SortsByStart)
{
    auto const early = VexTimeRangeObj::initWithCMTimeRange(R(1, 9)),
               late = VexTimeRangeObj::initWithVexTimeRange(R(2, 3));
    EXPECT_EQ(early->sortByStartTimeAscending(late), kCFCompareLessThan);
    EXPECT_EQ(early->sortByStartTimeDescending(late), kCFCompareGreaterThan);
    EXPECT_EQ(early->sortByStartTimeAscending(nullptr), kCFCompareGreaterThan);
    EXPECT_EQ(early->sortByStartTimeDescending(nullptr), kCFCompareLessThan);
}

TEST(VexTimePairObj, HoldsTwoTimes)
{
    auto const pair = VexTimePairObj::pairWithPair(
        VexTimePairMakeByAddingOffset(VexTimePairMake(T(1, 4), T(1, 2)), T(1, 4)));
    EXPECT_EQ(VexTimePairSecondMinusFirst(pair->pair()), T(1, 4));
    auto const equal = KVMakeRef<VexTimePairObj>(T(2, 4), T(6, 8));
    EXPECT_TRUE(pair->isEqual(equal));
    EXPECT_EQ(pair->hash(), equal->hash());
    EXPECT_FALSE(pair->isEqual(KVMakeRef<VexTimePairObj>(T(3, 4), T(1, 2))));
    EXPECT_EQ(text(pair->description()), "(0.500000, 0.750000)");
    auto const copy = KVNSRef<NSObject*>::adopt(pair->newCopy());
    pair->setFirst(T(0, 1));
    EXPECT_FALSE(copy->isEqual(pair));
}

TEST(VexTimeRangeAndObject, BelongsToItsObject)
{
    KVString const name("clip");
    auto const range = VexTimeRangeAndObject::rangeAndObjectWithRange(R(1, 3), name.cf_str());
    EXPECT_EQ(range->representedToolObject(), name.cf_str());
    EXPECT_EQ(range->startTimeObject()->time(), T(1, 1));
    EXPECT_EQ(range->durationObject()->time(), T(2, 1));
    EXPECT_EQ(text(range->description()), "[1.000000, 3.000000) clip");

    EXPECT_TRUE(range->isEqual(
        VexTimeRangeAndObject::initWithCMTimeRange(R(1, 3), KVString("clip").cf_str())));
    EXPECT_FALSE(range->isEqual(
        VexTimeRangeAndObject::initWithVexTimeRange(R(1, 3), KVString("other").cf_str())));
    // Equality holds both ways round: a plain range is of another class.
    auto const plain = KVMakeRef<VexTimeRangeObj>(R(1, 3));
    EXPECT_FALSE(range->isEqual(plain));
    EXPECT_FALSE(plain->isEqual(range));

    auto const cut = range->copyWithRange(R(2, 3));
    EXPECT_EQ(cut->range(), R(2, 3));
    EXPECT_EQ(dynamic_cast<VexTimeRangeAndObject&>(*cut).object(), name.cf_str());
}

TEST(CMTimeRangeAndNonretainedObject, DoesNotRetain)
{
    auto const object = KVMakeRef<NSNumber>(1);
    auto const range = CMTimeRangeAndNonretainedObject::initWithCMTimeRange(R(1, 3), object);
    EXPECT_EQ(object->retainCount(), 1u);
    EXPECT_EQ(range->object(), object.get());
    auto const back = archived(*range);
    EXPECT_EQ(back->range(), R(1, 3));
    EXPECT_EQ(back->object(), nullptr);
}

TEST(VexTimeCoding, KeepsEveryField)
{
    CMTime const time = T(-1001, 24000, rounded, 7);
    CMTimeRange const range = {time, T(5, 3)};
    EXPECT_EQ(archived(VexTimeObj(time))->time(), time);
    auto const pair = archived(VexTimePairObj(time, kCMTimePositiveInfinity));
    EXPECT_EQ(pair->first(), time);
    EXPECT_EQ(pair->second(), kCMTimePositiveInfinity);
    EXPECT_EQ(archived(VexTimeRangeObj(range))->range(), range);
    auto const boxed = KVMakeRef<VexTimeObj>(T(1, 1));
    auto const owned = archived(VexTimeRangeAndObject(range, boxed));
    EXPECT_EQ(owned->range(), range);
    EXPECT_TRUE(CFEqual(owned->object(), boxed));
    EXPECT_EQ(archived(VexTimeRangeAndObject(range, nullptr))->object(), nullptr);
}

TEST(VexTimeCoding, RefusesWhatIsNoTime)
{
    KVKeyedCoder coder;
    EXPECT_FALSE(KVDecodeCMTime(coder, "none"));
    coder.encodeBytes("short", 5, "time");
    coder.encodeBytes("short", 5, "range");
    coder.encodeInt64(5, "first");
    for (auto* make : {&VexTimeObj::initWithCoder, &VexTimePairObj::initWithCoder,
                       &VexTimeRangeObj::initWithCoder, &VexTimeRangeAndObject::initWithCoder,
                       &CMTimeRangeAndNonretainedObject::initWithCoder})
        EXPECT_FALSE(make(coder));
    CMTimeRange const backward = {T(0, 1), T(-5, 1)};
    coder.encodeBytes(&backward, sizeof backward, "range");
    EXPECT_EQ(KVDecodeCMTimeRange(coder, "range")->duration, kCMTimeZero);
}
