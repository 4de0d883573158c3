#pragma once

#include <korvane/foundation/KVCFRef.h>
#include <korvane/foundation/KVString.h>
#include <korvane/platform/CFDictionary.h>
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
KV_EXPORT CMTime VexTimePairSecondMinusFirst(KVCMTimePair const& pair) noexcept;

// --- Frame numbers ---

/// Sample numbers for logs: "105", "[105,211)".
KV_EXPORT KVString VexTimeCopySampleString(CMTime time, CMTime sampleDuration);
KV_EXPORT KVString VexTimeToSampleString(CMTime time, CMTime sampleDuration);
KV_EXPORT KVString VexTimeRangeToSampleString(CMTimeRange const& range, CMTime sampleDuration);

/// Seconds times `rate`, in frames per second.
KV_EXPORT double VexTimeToRealFrameWithRate(CMTime const& time, double rate) noexcept;
/// The whole frame that this lies in, negative times too; what lies within 1e-7 before a frame
/// counts to it. Out of range the nearest end, NaN 0.
KV_EXPORT std::int64_t VexTimeToFrameWithRate(CMTime const& time, double rate) noexcept;

// --- Dictionaries ---

/// { "value", "timescale", "flags", "epoch" }, each a number.
KV_EXPORT KVCFRef<CFDictionaryRef> CMTimeCopyAsDictionary(CMTime const& time);
/// Invalid for null, and when a number is missing or does not fit its field.
KV_EXPORT CMTime CMTimeMakeFromDictionary(CFDictionaryRef dictionary) noexcept;
/// { "start", "duration" }, each a dictionary.
KV_EXPORT KVCFRef<CFDictionaryRef> CMTimeRangeCopyAsDictionary(CMTimeRange const& range);
/// Each time that is missing or bad is invalid; a negative duration becomes 0.
KV_EXPORT CMTimeRange CMTimeRangeMakeFromDictionary(CFDictionaryRef dictionary) noexcept;
