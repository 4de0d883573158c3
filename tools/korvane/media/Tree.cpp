// korvane media tree: the atoms of a movie.

#include "../Json.h"
#include "../MovieTree.h"
#include "Commands.h"

#include <korvane/korvane.h>

namespace {

std::string padded(std::string const& text, std::size_t width)
{
    return std::string(width > text.size() ? width - text.size() : 0, ' ') + text;
}

struct TreeOptions {
    std::string file;
    std::string against;
    bool json = false;
};

Json atomsAsJson(std::vector<AtomChange> const& changes, std::size_t& next, int depth, bool marked)
{
    Json atoms = Json::array();
    while (next < changes.size() && changes[next].depth == depth) {
        AtomChange const& change = changes[next++];
        MovieAtom const& atom = change.after ? *change.after : *change.before;
        Json entry = {{"type", atom.type},
                      {"offset", atom.offset},
                      {"size", atom.size},
                      {"header", atom.header}};
        if (marked)
            entry["change"] = AtomChange::kindNames[change.kind];
        Json children = atomsAsJson(changes, next, depth + 1, marked);
        if (!children.empty())
            entry["atoms"] = std::move(children);
        atoms.push_back(std::move(entry));
    }
    return atoms;
}

void tree(TreeOptions const& options)
{
    MovieComparison const movie = compareMovies(options.file, options.against);
    std::uint64_t const length = movie.length;
    std::uint64_t const end = movie.after.back().offset + movie.after.back().size;
    bool const marked = !options.against.empty();

    if (options.json) {
        std::size_t next = 0;
        Json document = {{"file", options.file},
                         {"size", length},
                         {"atoms", atomsAsJson(movie.changes, next, 0, marked)}};
        if (end != length)
            document["unread_from"] = end;
        return printJson(document);
    }
    std::string text = padded("offset", 12) + padded("size", 13) + "  atom\n";
    for (AtomChange const& change : movie.changes) {
        MovieAtom const& atom = change.after ? *change.after : *change.before;
        text += padded(std::to_string(atom.offset), 12) + padded(std::to_string(atom.size), 13);
        text += marked ? std::string(" ") + AtomChange::marks[change.kind] + " " : "  ";
        text += std::string(static_cast<std::size_t>(change.depth) * 2, ' ') + atom.type + "\n";
    }
    if (end != length)
        text += padded(std::to_string(end), 12) + padded(std::to_string(length - end), 13) +
                "  (no atom)\n";
    printOutput(text);
}

} // namespace

void addMediaTree(CLI::App& media)
{
    auto const treeOptions = std::make_shared<TreeOptions>();
    CLI::App& treeCommand =
        *media.add_subcommand("tree", "Print the atoms of a movie with their offsets and sizes");
    treeCommand.add_option("FILE", treeOptions->file, "A QuickTime or MP4 file")->required();
    treeCommand
        .add_option("--against", treeOptions->against,
                    "Mark what is not as in this file: * changed, + new, - gone, > moved")
        ->type_name("FILE");
    addJsonFlag(treeCommand, treeOptions->json);
    treeCommand.callback([treeOptions] { tree(*treeOptions); });
}
