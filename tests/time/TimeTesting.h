#pragma once

#include <korvane/time/KVTime.h>
#include <korvane/time/KVTimeRange.h>

#include <gtest/gtest.h>

#include <ostream>
#include <string>

// Times in tests are compared field by field and printed so.

inline bool operator==(CMTime const& a, CMTime const& b)
{
    return a.value == b.value && a.timescale == b.timescale && a.flags == b.flags &&
           a.epoch == b.epoch;
}

inline bool operator==(CMTimeRange const& a, CMTimeRange const& b)
{
    return a.start == b.start && a.duration == b.duration;
}

inline void PrintTo(CMTime const& time, std::ostream* stream)
{
    *stream << time.value << "/" << time.timescale << " flags " << time.flags << " epoch "
            << time.epoch;
}

inline void PrintTo(CMTimeRange const& range, std::ostream* stream)
{
    PrintTo(range.start, stream);
    *stream << " for ";
    PrintTo(range.duration, stream);
}

namespace timetest {

constexpr std::int64_t highest = INT64_MAX, lowest = INT64_MIN;
constexpr std::uint32_t valid = 1, rounded = 3;

constexpr CMTime T(std::int64_t value, std::int32_t timescale, std::uint32_t flags = valid,
                   std::int64_t epoch = 0)
{
    return {value, timescale, flags, epoch};
}

/// From whole seconds to whole seconds.
constexpr CMTimeRange R(std::int64_t start, std::int64_t end)
{
    return {T(start, 1), T(end - start, 1)};
}

inline std::string text(KVString const& string)
{
    return string;
}

} // namespace timetest
