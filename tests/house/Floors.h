#pragma once

#include <filesystem>
#include <iosfwd>
#include <map>
#include <set>
#include <string>
#include <vector>

/// Which floor of the library stands on which, and which file belongs to which floor.
struct Floors {
    /// A floor's name, and the floors that it says it stands on.
    std::map<std::string, std::set<std::string>> below;
    /// The files that the build names, by their path in the source tree.
    std::map<std::string, std::string> floorOfFile;

    /// From the lines that the build writes: `floor NAME BELOW...` and `file NAME PATH`.
    static Floors read(std::istream& lines);

    /// The floor of a file: the one that names it, else the one that names the source beside it,
    /// else the one with its folder's name; empty for a file of none (korvane/korvane.h).
    std::string floorOf(std::filesystem::path const& file) const;

    /// Whether `upper` may include from `lower`: the same floor, or one somewhere below it.
    bool standsOn(std::string const& upper, std::string const& lower) const;
};

/// What is wrong in the tree below `root`/korvane, a line each, in order: an include that goes up,
/// a public header that includes what is neither ours nor the standard library's, a header that
/// does not exist, a private header used from a public one, a source that no floor names.
std::vector<std::string> faultsOfTree(std::filesystem::path const& root, Floors const& floors);
