#pragma once

#include <korvane/colour/lut_t.h>

#include <string>

/// The side of the square, from (0, 0) on, in which the parts of a picture are drawn as SVG
/// elements.
inline constexpr int lutPanel = 320;

/// A grid with the domain's ends beside it, and the curves of the table, along the neutral axis of
/// a cube.
std::string lutCurves(cc::lut_t const& table, cc::lut_t::processor_t const& lookup);
/// A slice through a cube at blue = `slice`, 0 to 1 over the domain: red to the right, green
/// upwards, `most` tiles along a side at most.
std::string lutSlice(cc::lut_t const& table, cc::lut_t::processor_t const& lookup, float slice,
                     int most);
/// A grey ramp, and below it what the table makes of it.
std::string lutRamps(cc::lut_t const& table, cc::lut_t::processor_t const& lookup);

/// A picture of a table as SVG: its curves, along the neutral axis of a cube, and beside them a
/// slice through a cube at blue = `slice` (0 to 1 over the domain), or a grey ramp and what a curve
/// makes of it.
std::string plotLut(cc::lut_t const& table, cc::lut_t::processor_t const& lookup, float slice);
