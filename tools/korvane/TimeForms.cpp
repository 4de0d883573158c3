#include "TimeForms.h"

#include <korvane/time/KVTime.h>

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
