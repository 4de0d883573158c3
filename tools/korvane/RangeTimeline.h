#pragma once

#include <korvane/time/VexTimeRanges.h>

#include <string>
#include <vector>

/// The name of a range; empty where it has none.
std::string nameOf(VexTimeRangeObj const* range);

/// Sets of ranges drawn one below the other, each with what it is called.
struct TimelineSet {
    std::string label;
    VexTimeRangeArray ranges;
};

/// Rows of text of `columns` characters, ranges as "[name==)", those that overlap in rows of their
/// own, and below them the seconds at both ends. Infinite ends reach the edge.
std::string timelineText(std::vector<TimelineSet> const& sets, std::size_t columns = 64);

/// The same as a picture.
std::string timelineSvg(std::vector<TimelineSet> const& sets);
