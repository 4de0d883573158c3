#include <korvane/platform/CMTime.h>

#include <limits>

double CMTimeGetSeconds(CMTime time) noexcept
{
    using limits = std::numeric_limits<double>;
    if (!(time.flags & kCMTimeFlags_Valid))
        return limits::quiet_NaN();
    if (time.flags & kCMTimeFlags_PositiveInfinity)
        return limits::infinity();
    if (time.flags & kCMTimeFlags_NegativeInfinity)
        return -limits::infinity();
    if (time.flags & kCMTimeFlags_Indefinite)
        return limits::quiet_NaN();
    return static_cast<double>(time.value) / time.timescale;
}
