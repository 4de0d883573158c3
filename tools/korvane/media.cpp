// korvane media: QuickTime and MP4 files looked at, and rewritten with other metadata.

#include "commands.h"
#include "media/Commands.h"

#include <CLI/CLI.hpp>

void addMediaCommands(CLI::App& program)
{
    CLI::App& media = *program.add_subcommand("media", "QuickTime and MP4 files");
    media.require_subcommand(1);
    addMediaTree(media);
    addMediaInfo(media);
    addMediaSet(media);
    addMediaStrip(media);
}
