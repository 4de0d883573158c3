// korvane media strip: a movie copied without some of its metadata.

#include "../FileBytes.h"
#include "../Input.h"
#include "../MovieTree.h"
#include "../ToolError.h"
#include "Commands.h"
#include "Rewrite.h"

#include <CLI/CLI.hpp>

#include <algorithm>

namespace {

struct StripOptions : RewriteOptions {
    bool spherical = false;
    bool hdr = false;
};

/// Whether the atom holds spherical metadata of the first generation.
bool isSphericalUUID(KVAtomBox const& atom, FileBytes const& bytes)
{
    static constexpr unsigned char kUUID[16] = {0xFF, 0xCC, 0x82, 0x63, 0xF8, 0x55, 0x4A, 0x93,
                                                0x88, 0x14, 0x58, 0x7A, 0x02, 0x52, 0x1F, 0xDD};
    unsigned char start[16];
    return atom.getType() == KVAtomType("uuid") &&
           bytes.read(atom.getOffset() + atom.getHeaderSize(), start, 16) == 16 &&
           std::equal(start, start + 16, kUUID);
}

void stripTrack(StripOptions const& options, KVAtomBoxFile& file, KVAtomBox& track)
{
    checkDescriptions(file, track, options.input);
    FileBytes const bytes(options.input);
    if (options.spherical)
        for (int i = track.getChildCount() - 1; i >= 0; --i)
            if (isSphericalUUID(*track.getChild(i), bytes))
                track.removeChild(i);

    auto const data = KVCFRef<CFMutableDataRef>::adopt(new __CFData());
    file.readTrackSampleDescription(&track, data);
    KVImageDescAtomBox descriptions(data);
    std::vector<unsigned int> types;
    if (options.spherical)
        types.insert(types.end(), {KVAtomType("st3d"), KVAtomType("sv3d")});
    if (options.hdr)
        types.insert(types.end(), {KVAtomType("mdcv"), KVAtomType("clli")});
    for (int i = 0; i < descriptions.getImageDescCount(); ++i)
        for (unsigned int const type : types)
            while (descriptions.removeImageDescData(i, type))
                continue;
    auto const stripped =
        descriptions.copyFullImageDescToData(file.getFileType() == KVAtomType("qt  "));
    KVAtomBox* const stsd = track.findFirstChild(true, KVAtomType("stsd"));
    stsd->setPayloadData(stripped);
    stsd->updateSize();
    stsd->updateParentSizes();
}

void strip(StripOptions const& options)
{
    if (!options.spherical && !options.hdr)
        throw ToolError(ExitCode::Usage, "tell what to strip: --spherical, --hdr");
    checkPaths(options);
    KVAtomBoxFile file;
    openMovie(file, options.input);
    if (file.readAllTrackMediaAtomBoxes() != 0)
        throw badInput(options.input, "has no moov atom, or more than one");
    std::vector<KVAtomBox*> tracks;
    for (int const enabled : {1, 0})
        if (file.findTracks(tracks, KVAtomType("vide"), enabled) != 0)
            throw badInput(options.input, "has a track without handler or header");
    for (KVAtomBox* track : tracks)
        stripTrack(options, file, *track);
    rewrite(file, options);
}

} // namespace

void addMediaStrip(CLI::App& media)
{
    auto const stripOptions = std::make_shared<StripOptions>();
    CLI::App& stripCommand =
        *media.add_subcommand("strip", "Copy a movie without some of its metadata");
    addRewriteOptions(stripCommand, *stripOptions);
    stripCommand.add_flag("--spherical", stripOptions->spherical,
                          "Spherical metadata of both generations, in every video track");
    stripCommand.add_flag("--hdr", stripOptions->hdr, "Mastering display and content light");
    stripCommand.callback([stripOptions] { strip(*stripOptions); });
}
