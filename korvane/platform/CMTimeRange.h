#pragma once

#include <korvane/platform/CMTime.h>

/// The times from `start` up to, not including, `start + duration`. A range of duration 0 is empty.
///
/// Make one by the functions of korvane/time/KVTimeRange.h, which never leave a negative duration
/// in it.
struct CMTimeRange {
    CMTime start;
    CMTime duration;
};

inline constexpr CMTimeRange kCMTimeRangeZero = {kCMTimeZero, kCMTimeZero};
inline constexpr CMTimeRange kCMTimeRangeInvalid = {kCMTimeInvalid, kCMTimeInvalid};

/// Whether starts and durations are equal by `CMTimeCompare`.
inline bool CMTimeRangeEqual(CMTimeRange const& a, CMTimeRange const& b) noexcept
{
    return CMTimeCompare(a.start, b.start) == 0 && CMTimeCompare(a.duration, b.duration) == 0;
}
