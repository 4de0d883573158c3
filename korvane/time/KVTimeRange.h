#pragma once

#include <korvane/foundation/KVString.h>
#include <korvane/platform/CMTimeRange.h>

// Ranges of time: made, measured, moved and joined. Sets of ranges are in VexTimeRanges.h.
//
//     CMTimeRange shot = KV_CMTimeRangeMakeWithStartEnd(CMTimeMake(10, 1), CMTimeMake(25, 2));
//     CMTimeRange slipped = KV_CMTimeRangeMakeByAddingOffset(shot, CMTimeMake(1001, 24000));
//
// A start is inside its range, an end is not. Times that are not numeric pass through as the
// arithmetic of CMTime has them.

// --- Make ---

/// The range; a negative duration becomes 0. Where the end would be rounded though neither argument
/// is, both are reduced to lowest terms, so that the end is as exact as can be.
KV_EXPORT CMTimeRange CMTimeRangeSaferMake(CMTime start, CMTime duration) noexcept;

/// The same. None of them logs; the two long names are those that promise it.
inline CMTimeRange CMTimeRangeMake(CMTime start, CMTime duration) noexcept
{
    return CMTimeRangeSaferMake(start, duration);
}
inline CMTimeRange CMTimeDO_NOT_USE_THIS_ItsToNotGetSpewRangeSaferMake(CMTime start,
                                                                       CMTime duration) noexcept
{
    return CMTimeRangeSaferMake(start, duration);
}
inline CMTimeRange VexTimeDO_NOT_USE_THIS_ItsToNotGetSpewRangeMake(CMTime start,
                                                                   CMTime duration) noexcept
{
    return CMTimeRangeSaferMake(start, duration);
}

/// One year of 365 days.
inline constexpr CMTime kKV_CMTimeOneYear = {31536000, 1, kCMTimeFlags_Valid, 0};

/// From its ends; empty at `start` if `end` is earlier. A start of minus infinity with a numeric
/// end becomes one year before that end.
KV_EXPORT CMTimeRange KV_CMTimeRangeMakeWithStartEnd(CMTime start, CMTime end) noexcept;
/// From its ends as they are: the duration may be negative or not numeric.
KV_EXPORT CMTimeRange CMTimeRangeFromTimeToTime(CMTime start, CMTime end) noexcept;

/// The range with its start moved by `offset`; the duration stays.
KV_EXPORT CMTimeRange KV_CMTimeRangeMakeByAddingOffset(CMTimeRange const& range,
                                                       CMTime offset) noexcept;
KV_EXPORT CMTimeRange KV_CMTimeRangeMakeBySubtractingOffset(CMTimeRange const& range,
                                                            CMTime offset) noexcept;

/// The smallest range that covers both, and what lies between.
KV_EXPORT CMTimeRange KV_CMTimeRangeUnion(CMTimeRange const& a, CMTimeRange const& b) noexcept;

/// The range, made at least `minimumDuration` long, moved until it starts within `outer` and, if it
/// can, ends there, and then cut to it.
KV_EXPORT CMTimeRange VexTimeRangeAdjustToBeWithinRangeWithMinimumDuration(
    CMTimeRange const& range, CMTimeRange const& outer, CMTime minimumDuration) noexcept;

// --- Ask ---

/// The first time behind the range; plus infinity for a range over all time.
KV_EXPORT CMTime KV_CMTimeRangeEnd(CMTimeRange const& range) noexcept;
/// "[start, end)", each as KV_CMTimeToString has it.
KV_EXPORT KVString KV_CMTimeRangeToString(CMTimeRange const& range);
/// Its ends as sample numbers, for logs: "[105,211)".
KV_EXPORT KVString VexTimeRangeToSampleString(CMTimeRange const& range, CMTime sampleDuration);

// --- Pairs ---

/// Two times that belong together.
struct KVCMTimePair {
    CMTime first;
    CMTime second;
};

constexpr KVCMTimePair VexTimePairMake(CMTime const& first, CMTime const& second) noexcept
{
    return {first, second};
}
/// Both moved by `offset`.
KV_EXPORT KVCMTimePair VexTimePairMakeByAddingOffset(KVCMTimePair const& pair,
                                                     CMTime offset) noexcept;
/// How far the second lies behind the first; negative where it lies before it.
KV_EXPORT CMTime VexTimePairSecondMinusFirst(KVCMTimePair const& pair) noexcept;
