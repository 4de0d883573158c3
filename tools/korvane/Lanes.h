#pragma once

#include <cstddef>
#include <vector>

/// From one place on a line to another.
struct Span {
    double from, to;
};

/// Puts spans, which are in order of `from`, into as few rows as keep them apart: the row of each,
/// counted from 0. Spans that touch may share a row. With `most` rows taken, what fits into none of
/// them gets `most`.
std::vector<std::size_t> lanesOf(std::vector<Span> const& spans,
                                 std::size_t most = static_cast<std::size_t>(-1));
