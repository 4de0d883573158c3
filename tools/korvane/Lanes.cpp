#include "Lanes.h"

#include <algorithm>

std::vector<std::size_t> lanesOf(std::vector<Span> const& spans, std::size_t most)
{
    std::vector<double> ends; // of the last span in each row
    std::vector<std::size_t> lanes;
    lanes.reserve(spans.size());
    for (Span const& span : spans) {
        auto const free =
            std::find_if(ends.begin(), ends.end(), [&](double end) { return end <= span.from; });
        auto const lane = static_cast<std::size_t>(free - ends.begin());
        if (lane < ends.size())
            ends[lane] = span.to;
        else if (lane < most)
            ends.push_back(span.to);
        lanes.push_back(lane);
    }
    return lanes;
}
