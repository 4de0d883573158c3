#pragma once

#include <korvane/colour/lut_t.h>

#include <string>

/// A picture of a table as SVG: its curves, along the neutral axis of a cube, and beside them a
/// slice through a cube at blue = `slice` (0 to 1 over the domain), or a grey ramp and what a curve
/// makes of it.
std::string plotLut(cc::lut_t const& table, cc::lut_t::processor_t const& lookup, float slice);
