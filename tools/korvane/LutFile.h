#pragma once

#include "Input.h"

#include <korvane/colour/lut_t.h>

#include <string>
#include <utility>
#include <vector>

/// Table `index` of a LUT file. Throws ToolError: code 4 for what cannot be read, code 3, with the
/// line where there is one, for what is no LUT file or has no such table.
cc::lut_t readLut(ReopenableFile const& file, unsigned long index);
/// All tables of a LUT file, one at least. Throws as `readLut` does.
std::vector<cc::lut_t> readLuts(ReopenableFile const& file);

/// Whether the first table's header is that of a LUT file, whatever follows.
bool looksLikeLut(ReopenableFile const& file);

/// "Adobe Cube LUT (.cube)"
char const* formatName(unsigned int format);
/// "3D, 33 x 33 x 33"
std::string sizeText(cc::lut_t const& lut);
/// "red", "green" and "blue" of a cube, "all channels" of a curve.
std::vector<char const*> channelNames(cc::lut_t const& lut);
/// The least and the greatest value of a channel, in the domain's scale.
std::pair<float, float> rangeOf(cc::lut_t const& lut, std::size_t channel);
