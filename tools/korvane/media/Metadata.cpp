#include "Metadata.h"

#include "../MovieTree.h"
#include "../ToolError.h"

#include <string_view>

void openMetadata(KVAtomMetadataHandler& handler, std::string const& path)
{
    openMovie(handler, path);
    if (!handler.isFileValidType())
        throw badInput(path, "is no QuickTime or MP4 file: its brand is not known");
    if (handler.readMetadata() != 0)
        throw badInput(path, "has no moov atom, or more than one");
}

std::optional<Colour> readColour(KVImageDescAtomBox const& descriptions)
{
    auto const data = descriptions.copyImageDescData(0, KVAtomType("colr"));
    if (!data || data->length() < 10)
        return std::nullopt;
    std::string_view const bytes(reinterpret_cast<char const*>(data->bytes()), data->length());
    bool const isNclx = bytes.starts_with("nclx");
    if (!isNclx && !bytes.starts_with("nclc"))
        return std::nullopt;
    Colour colour{isNclx, {}, isNclx && bytes.size() > 10 && (bytes[10] & 0x80) != 0};
    for (std::size_t i = 0; i < 3; ++i)
        colour.codes[i] = static_cast<unsigned char>(bytes[4 + 2 * i]) << 8 |
                          static_cast<unsigned char>(bytes[5 + 2 * i]);
    return colour;
}
