#include "time/TimeTesting.h"

#include <korvane/platform/CFNumber.h>
#include <korvane/time/VexTimeRangeObj.h>

#include <limits>

using namespace timetest;

namespace {

constexpr CMTime forever = kCMTimePositiveInfinity, before = kCMTimeNegativeInfinity;
constexpr CMTime invalid = kCMTimeInvalid;

} // namespace

TEST(KVTimeRange, MakesSafely)
{
    struct Row {
        CMTime start, duration;
        CMTimeRange range;
    } const rows[] = {
        {T(1, 1), T(2, 1), R(1, 3)},
        {T(1, 1), T(-2, 1), {T(1, 1), kCMTimeZero}},
        {T(1, 1), before, {T(1, 1), kCMTimeZero}},
        {T(1, 1), invalid, {T(1, 1), invalid}},
        {T(1, 1), forever, {T(1, 1), forever}},
        // Only where the end would be rounded are the fields reduced.
        {T(500000000, 1000000000), T(1001, 30000), {T(1, 2), T(1001, 30000)}},
        {T(500000000, 1000000000), T(2002, 60000), {T(1, 2), T(1001, 30000)}},
        {T(500000000, 1000000000, rounded),
         T(1001, 30000),
         {T(500000000, 1000000000, rounded), T(1001, 30000)}},
        // Meant: the trial sum is that of the arguments, a negative duration among them.
        {T(500000000, 1000000000), T(-1001, 30000), {T(1, 2), kCMTimeZero}},
    };
    for (Row const& row : rows) {
        EXPECT_EQ(CMTimeRangeMake(row.start, row.duration), row.range);
        EXPECT_EQ(CMTimeRangeSaferMake(row.start, row.duration), row.range);
    }
    EXPECT_EQ(CMTimeDO_NOT_USE_THIS_ItsToNotGetSpewRangeSaferMake(T(1, 1), T(2, 1)), R(1, 3));
}

TEST(KVTimeRange, MakesFromItsEnds)
{
    struct Row {
        CMTime start, end;
        CMTimeRange range;
    } const rows[] = {
        {T(1, 2), T(3, 4), {T(1, 2), T(1, 4)}},
        {T(3, 1), T(1, 1), {T(3, 1), kCMTimeZero}},
        {before,
         T(5, 1),
         {T(5 - 31536000, 1), T(31536000, 1)}}, // meant: an open start is a year long
        {before, forever, {before, forever}},
        {T(1, 1), forever, {T(1, 1), forever}},
        {T(1, 1), invalid, {T(1, 1), invalid}},
    };
    for (Row const& row : rows)
        EXPECT_EQ(KV_CMTimeRangeMakeWithStartEnd(row.start, row.end), row.range);
    EXPECT_EQ(CMTimeRangeFromTimeToTime(T(3, 1), T(1, 1)), (CMTimeRange{T(3, 1), T(-2, 1)}));
    EXPECT_EQ(CMTimeRangeFromTimeToTime(before, T(1, 1)), (CMTimeRange{before, forever}));
}

TEST(KVTimeRange, Ends)
{
    EXPECT_EQ(KV_CMTimeRangeEnd(R(1, 3)), T(3, 1));
    EXPECT_EQ(KV_CMTimeRangeEnd({before, forever}), forever) << "over all time";
    EXPECT_EQ(KV_CMTimeRangeEnd({before, T(1, 1)}), before);
    EXPECT_EQ(KV_CMTimeRangeEnd({forever, before}), invalid);
    EXPECT_EQ(KV_CMTimeRangeEnd({T(500000000, 1000000000), T(1001, 30000)}), T(16001, 30000));
}

TEST(KVTimeRange, MovesAndJoins)
{
    EXPECT_EQ(KV_CMTimeRangeMakeByAddingOffset(R(1, 3), T(1, 2)), (CMTimeRange{T(3, 2), T(2, 1)}));
    EXPECT_EQ(KV_CMTimeRangeMakeBySubtractingOffset(R(1, 3), T(1, 2)),
              (CMTimeRange{T(1, 2), T(2, 1)}));
    struct Row {
        CMTimeRange a, b, joined;
    } const rows[] = {
        {R(1, 3), R(2, 5), R(1, 5)},
        {R(8, 9), R(2, 5), R(2, 9)},
        {R(2, 5), {T(3, 1), forever}, {T(2, 1), forever}},
        {R(2, 5), {invalid, T(1, 1)}, {T(2, 1), invalid}},
    };
    for (Row const& row : rows) {
        EXPECT_EQ(KV_CMTimeRangeUnion(row.a, row.b), row.joined);
        EXPECT_EQ(KV_CMTimeRangeUnion(row.b, row.a), row.joined);
    }
}

TEST(KVTimeRange, AdjustsToAnother)
{
    struct Row {
        CMTimeRange range;
        std::int64_t minimum;
        CMTimeRange adjusted;
    } const rows[] = {
        {R(12, 14), 1, R(12, 14)},  {R(12, 12), 3, R(12, 15)}, // made longer
        {R(5, 8), 1, R(10, 13)},                               // moved in
        {R(19, 23), 1, R(16, 20)},  {R(19, 19), 5, R(15, 20)}, {R(5, 90), 1, R(10, 20)}, // cut
        {R(12, 13), 50, R(10, 20)},
    };
    for (Row const& row : rows)
        EXPECT_EQ(VexTimeRangeAdjustToBeWithinRangeWithMinimumDuration(row.range, R(10, 20),
                                                                       T(row.minimum, 1)),
                  row.adjusted);
}

TEST(KVTimeRange, PrintsForLogs)
{
    EXPECT_EQ(text(KV_CMTimeRangeToString(R(1, 3))), "[1.000000, 3.000000)");
    EXPECT_EQ(text(KV_CMTimeRangeToString({before, forever})), "[-inf, inf)");
    CMTime const frame = T(1001, 30000);
    EXPECT_EQ(text(VexTimeToSampleString(T(352, 100), frame)), "105");
    EXPECT_EQ(text(VexTimeCopySampleString(T(-352, 100), frame)), "-105");
    EXPECT_EQ(text(VexTimeRangeToSampleString({T(352, 100), T(352, 100)}, frame)), "[105,210)");
}

TEST(KVTimeRange, CountsFramesAtARate)
{
    EXPECT_EQ(VexTimeToRealFrameWithRate(T(1, 2), 25), 12.5);
    struct Row {
        CMTime time;
        double rate;
        std::int64_t frame;
    } const rows[] = {
        {T(1, 2), 25, 12},
        {T(-1, 2), 25, -13},
        {T(1001, 30000), 29.97002997002997, 1}, // a breath below frame 1
        {T(99999, 100000), 1, 0},
        {T(99999999, 100000000), 1, 1},
        {forever, 25, highest},
        {before, 25, lowest},
        {invalid, 25, 0},
        {T(1, 1), std::numeric_limits<double>::max(), highest},
    };
    for (Row const& row : rows)
        EXPECT_EQ(VexTimeToFrameWithRate(row.time, row.rate), row.frame);
}

TEST(KVTimeRange, BecomesADictionary)
{
    CMTimeRange const range = {T(lowest, INT32_MIN, 0xFFFFFFFF, highest), T(5, 3, rounded)};
    auto const dictionary = CMTimeRangeCopyAsDictionary(range);
    EXPECT_EQ(CMTimeRangeMakeFromDictionary(dictionary), range);
    auto const* start = dynamic_cast<CFDictionaryRef>(dictionary->value("start"));
    ASSERT_TRUE(start);
    for (char const* key : {"value", "timescale", "flags", "epoch"})
        EXPECT_TRUE(start->value(key)) << key;

    CMTimeRange const backward = {T(0, 1), T(-1, 1)};
    EXPECT_EQ(CMTimeRangeMakeFromDictionary(CMTimeRangeCopyAsDictionary(backward)).duration,
              kCMTimeZero);
    EXPECT_EQ(CMTimeRangeMakeFromDictionary(nullptr), kCMTimeRangeInvalid);
    EXPECT_EQ(CMTimeMakeFromDictionary(nullptr), kCMTimeInvalid);
}

TEST(KVTimeRange, RefusesADictionaryOfNoTime)
{
    auto const time = CMTimeCopyAsDictionary(T(1, 2));
    struct Row {
        char const* key;
        KVNSRef<NSObject*> value;
    } const rows[] = {
        {"value", nullptr},
        {"epoch", KVMakeRef<VexTimeRangeObj>(R(0, 1))},
        {"timescale", KVMakeRef<NSNumber>(1ll << 31)},
        {"timescale", KVMakeRef<NSNumber>(-(1ll << 31) - 1)},
        {"flags", KVMakeRef<NSNumber>(1ll << 32)},
        {"flags", KVMakeRef<NSNumber>(-1)},
    };
    for (Row const& row : rows) {
        auto const changed =
            KVCFRef<CFMutableDictionaryRef>::adopt(CFDictionaryCreateMutableCopy(nullptr, 0, time));
        EXPECT_EQ(CMTimeMakeFromDictionary(changed), T(1, 2));
        changed->setValue(row.key, row.value);
        EXPECT_EQ(CMTimeMakeFromDictionary(changed), kCMTimeInvalid) << row.key;
    }
}
