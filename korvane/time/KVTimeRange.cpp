#include <korvane/time/KVTimeRange.h>

#include <korvane/time/KVTime.h>

namespace {

bool isEarlier(CMTime const& a, CMTime const& b) noexcept
{
    return CMTimeCompare(a, b) < 0;
}

CMTime const& earlier(CMTime const& a, CMTime const& b) noexcept
{
    return isEarlier(b, a) ? b : a;
}

CMTime const& later(CMTime const& a, CMTime const& b) noexcept
{
    return isEarlier(a, b) ? b : a;
}

bool isEqual(CMTime const& a, CMTime const& b) noexcept
{
    return CMTimeCompare(a, b) == 0;
}

} // namespace

// --- Make ---

CMTimeRange CMTimeRangeSaferMake(CMTime start, CMTime duration) noexcept
{
    CMTimeRange range = {start, KV_CMTimeIsNegative(duration) ? kCMTimeZero : duration};
    if (CMTimeIsRounded(CMTimeAdd(start, duration)) &&
        !((start.flags | duration.flags) & kCMTimeFlags_HasBeenRounded)) {
        SimpCMTime(&range.start);
        SimpCMTime(&range.duration);
    }
    return range;
}

CMTimeRange KV_CMTimeRangeMakeWithStartEnd(CMTime start, CMTime end) noexcept
{
    if (isEqual(start, kCMTimeNegativeInfinity) && CMTimeIsNumeric(end))
        start = CMTimeSubtract(end, kKV_CMTimeOneYear);
    return CMTimeRangeSaferMake(start, KV_CMTimeSaferSubtract(end, start));
}

CMTimeRange CMTimeRangeFromTimeToTime(CMTime start, CMTime end) noexcept
{
    return {start, KV_CMTimeSaferSubtract(end, start)};
}

CMTimeRange KV_CMTimeRangeMakeByAddingOffset(CMTimeRange const& range, CMTime offset) noexcept
{
    return CMTimeRangeSaferMake(KV_CMTimeSaferAdd(range.start, offset), range.duration);
}

CMTimeRange KV_CMTimeRangeMakeBySubtractingOffset(CMTimeRange const& range, CMTime offset) noexcept
{
    return CMTimeRangeSaferMake(KV_CMTimeSaferSubtract(range.start, offset), range.duration);
}

CMTimeRange KV_CMTimeRangeUnion(CMTimeRange const& a, CMTimeRange const& b) noexcept
{
    CMTime const start = earlier(a.start, b.start);
    CMTime const end = later(KV_CMTimeRangeEnd(a), KV_CMTimeRangeEnd(b));
    if (isEqual(start, kCMTimeNegativeInfinity) && isEqual(end, kCMTimePositiveInfinity))
        return {kCMTimeNegativeInfinity, kCMTimePositiveInfinity};
    return KV_CMTimeRangeMakeWithStartEnd(start, end);
}

CMTimeRange VexTimeRangeAdjustToBeWithinRangeWithMinimumDuration(CMTimeRange const& range,
                                                                 CMTimeRange const& outer,
                                                                 CMTime minimumDuration) noexcept
{
    CMTime const outerEnd = KV_CMTimeRangeEnd(outer);
    CMTimeRange moved = {range.start, later(range.duration, minimumDuration)};
    if (isEarlier(outerEnd, KV_CMTimeRangeEnd(moved)))
        moved.start = KV_CMTimeSaferSubtract(outerEnd, moved.duration);
    moved.start = later(moved.start, outer.start);
    return KV_CMTimeRangeMakeWithStartEnd(moved.start, earlier(KV_CMTimeRangeEnd(moved), outerEnd));
}

// --- Ask ---

CMTime KV_CMTimeRangeEnd(CMTimeRange const& range) noexcept
{
    constexpr std::uint32_t negative = kCMTimeFlags_Valid | kCMTimeFlags_NegativeInfinity;
    constexpr std::uint32_t positive = kCMTimeFlags_Valid | kCMTimeFlags_PositiveInfinity;
    if ((range.start.flags & negative) == negative && (range.duration.flags & positive) == positive)
        return kCMTimePositiveInfinity;
    return KV_CMTimeSaferAdd(range.start, range.duration);
}

KVString KV_CMTimeRangeToString(CMTimeRange const& range)
{
    KVString text("[");
    text.append(KV_CMTimeToString(range.start));
    text.append(", ");
    text.append(KV_CMTimeToString(KV_CMTimeRangeEnd(range)));
    text.append(")");
    return text;
}

KVString VexTimeRangeToSampleString(CMTimeRange const& range, CMTime sampleDuration)
{
    KVString text("[");
    text.append(VexTimeToSampleString(range.start, sampleDuration));
    text.append(",");
    text.append(VexTimeToSampleString(KV_CMTimeRangeEnd(range), sampleDuration));
    text.append(")");
    return text;
}

// --- Pairs ---

KVCMTimePair VexTimePairMakeByAddingOffset(KVCMTimePair const& pair, CMTime offset) noexcept
{
    return {KV_CMTimeSaferAdd(pair.first, offset), KV_CMTimeSaferAdd(pair.second, offset)};
}

CMTime VexTimePairSecondMinusFirst(KVCMTimePair const& pair) noexcept
{
    return KV_CMTimeSaferSubtract(pair.second, pair.first);
}
