#include "time/TimeTesting.h"

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
