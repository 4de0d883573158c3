#pragma once

#include <korvane/colour/lut_t.h>

#include <vector>

namespace cc {

/// All tables of one LUT file.
///
///     cc::multilut_t luts;
///     if (luts.read("/looks/shaper-and-cube.cube", false) == cc::kSuccess)
///         use(luts.tables);
class KV_EXPORT multilut_t {
public:
    /// A file gives no more tables than this; what it holds beyond is left.
    static constexpr std::size_t kMostTables = 256;

    std::vector<lut_t> tables;

    /// Reads the tables in turn, up to one that fails, whose code is the result and which is left
    /// out. `append` keeps the tables that are held already. A .mga file has one table.
    int read(char const* path, bool append);
};

} // namespace cc
