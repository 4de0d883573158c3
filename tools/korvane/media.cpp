// korvane media: QuickTime and MP4 files looked at, and rewritten with other metadata.

#include "commands.h"
#include "media/Commands.h"

#include <CLI/CLI.hpp>

void addMediaCommands(CLI::App& program)
{
    CLI::App& media =
        *program.add_subcommand("media", "Show and change the metadata of QuickTime and MP4 files");
    media.require_subcommand(1);
    addMediaTree(media);
    addMediaInfo(media);
    addMediaSet(media);
    addMediaStrip(media);

    addExamples(media, {"korvane media tree movie.mp4",
                        "korvane media set movie.mp4 sphere.mp4 --spherical equirectangular "
                        "--hdr mastering.json",
                        "korvane media strip sphere.mp4 plain.mp4 --spherical"});
}
