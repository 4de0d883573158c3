// korvane media info: the metadata of a movie.

#include "../Input.h"
#include "../Json.h"
#include "Commands.h"
#include "Metadata.h"

namespace {

struct InfoOptions {
    std::string file;
    bool json = false;
};

Json metadataAsJson(NSObject const* value)
{
    auto const* const dictionary = dynamic_cast<CFDictionaryRef>(value);
    if (!dictionary)
        return value->description().toUTF8();
    Json entries = Json::object();
    for (std::size_t i = 0; i < dictionary->count(); ++i)
        entries[dictionary->keyAtIndex(i)->description().toUTF8()] =
            metadataAsJson(dictionary->valueAtIndex(i));
    return entries;
}

void info(InfoOptions const& options)
{
    KVAtomMetadataHandler handler;
    openMetadata(handler, options.file);
    Json metadata = metadataAsJson(handler.copyMetadata());
    // The library gives the first value of a pair under both keys, and no "nclx".
    if (KVImageDescAtomBox const* const descriptions = handler.getImageDesc()) {
        Json& standard = metadata[kKVStandardExtensionsMetadata];
        int first = 0, second = 0;
        if (auto const colour = readColour(*descriptions)) {
            standard["color_primaries"] = std::to_string(colour->codes[0]);
            standard["color_transfer"] = std::to_string(colour->codes[1]);
            standard["color_matrix"] = std::to_string(colour->codes[2]);
        }
        if (descriptions->getImageDescFieldInfo(0, &first, &second) == 0)
            standard["field_detail"] = std::to_string(second);
        if (descriptions->getImageDescPixelAspectInfo(0, &first, &second) == 0)
            standard["pixel_aspect_v"] = std::to_string(second);
        if (standard.empty())
            metadata.erase(kKVStandardExtensionsMetadata);
    }
    KVString type;
    type.setOSType(handler.getFileType());
    if (options.json)
        return printJson({{"file", options.file}, {"type", type.toUTF8()}, {"metadata", metadata}});

    std::string text = "File type " + type.toUTF8() + "\n";
    for (auto const& [section, values] : metadata.items()) {
        text += section + "\n";
        if (values.is_string()) {
            text += "  " + values.get<std::string>() + "\n";
            continue;
        }
        for (auto const& [key, value] : values.items())
            text += "  " + key + std::string(key.size() < 32 ? 32 - key.size() : 1, ' ') +
                    value.get<std::string>() + "\n";
    }
    printOutput(text);
}

} // namespace

void addMediaInfo(CLI::App& media)
{
    auto const infoOptions = std::make_shared<InfoOptions>();
    CLI::App& infoCommand =
        *media.add_subcommand("info", "Print the metadata of a movie's first video track");
    infoCommand.add_option("FILE", infoOptions->file, "A QuickTime or MP4 file")->required();
    addJsonFlag(infoCommand, infoOptions->json);
    infoCommand.callback([infoOptions] { info(*infoOptions); });
}
