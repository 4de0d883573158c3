#pragma once

#include <korvane/korvane.h>

#include <optional>
#include <string>

/// Opens a movie and reads its metadata. Throws ToolError with code 3 when it is no QuickTime or
/// MP4 file, or has no single `moov`.
void openMetadata(KVAtomMetadataHandler& handler, std::string const& path);

/// `colr` of type "nclx" or "nclc": the code points, and whether the range is full.
struct Colour {
    bool isNclx;
    int codes[3];
    bool isFullRange;
};

/// That of the first description; none when it has no `colr` or one of another type.
std::optional<Colour> readColour(KVImageDescAtomBox const& descriptions);
