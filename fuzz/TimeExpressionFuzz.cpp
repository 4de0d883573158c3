// The tool's expressions: each is refused with a place in it, or has a time that can be written and
// read again.

#include "../tools/korvane/TimeExpression.h"

#include <korvane/time/KVTime.h>

#include <cstdlib>
#include <string>

extern "C" int LLVMFuzzerTestOneInput(std::uint8_t const* data, std::size_t size)
{
    try {
        CMTime const time = evaluateTime({reinterpret_cast<char const*>(data), size});
        if (!CMTimeIsNumeric(time) || time.value == INT64_MIN)
            return 0;
        std::string const written =
            std::to_string(time.value) + "/" + std::to_string(time.timescale);
        if (CMTimeCompare(parseTime(written), time) != 0)
            std::abort();
    } catch (TimeSyntaxError const&) {}
    return 0;
}
