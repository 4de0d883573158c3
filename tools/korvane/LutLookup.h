#pragma once

#include <korvane/colour/lut_t.h>

#include <memory>

/// How a colour between the points of a cube is found.
enum class Interpolation {
    Trilinear,  ///< from the eight corners of its cell
    Tetrahedral ///< from the four corners of the tetrahedron that it lies in, of six in a cell
};

/// Looks colours up in a table: a processor over a table, with which another one can be filled.
/// Colours outside the domain are clamped to it. A curve acts on each channel by itself. The table
/// must be one that was read or filled whole, and must outlive its lookup.
std::unique_ptr<cc::lut_t::processor_t> makeLookup(cc::lut_t const& table,
                                                   Interpolation interpolation);
