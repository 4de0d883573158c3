#include "TimeForms.h"

#include <korvane/captions/KVSRTCaptionsExporter.h>
#include <korvane/time/KVTime.h>

#include <cmath>

std::string timeFraction(CMTime const& time)
{
    if (!CMTimeIsNumeric(time))
        return KV_CMTimeToString(time);
    return std::to_string(time.value) + "/" + std::to_string(time.timescale);
}

Json timeJson(CMTime const& time)
{
    if (!CMTimeIsNumeric(time))
        return {{"kind", timeFraction(time)}};
    return {{"value", time.value},
            {"timescale", time.timescale},
            {"seconds", CMTimeGetSeconds(time)},
            {"rounded", CMTimeIsRounded(time)}};
}

std::string timecodeText(double seconds)
{
    return (seconds < 0 ? "-" : "") + KVTimecodeStringFromTimeInSeconds(std::abs(seconds)).toUTF8();
}
