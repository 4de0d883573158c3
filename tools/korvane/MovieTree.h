#pragma once

#include <korvane/korvane.h>

#include <cstdint>
#include <functional>
#include <string>
#include <vector>

/// An atom as the tool shows it: also those inside a sample description, where it is that of a
/// video track.
struct MovieAtom {
    std::string type;           ///< what is no text as \xNN
    std::uint64_t offset = 0;   ///< of its first byte
    std::uint64_t size = 0;     ///< header included
    std::uint64_t header = 8;   ///< the header's size
    KVCFRef<CFDataRef> payload; ///< null where it lies in the file
    std::vector<MovieAtom> children;
};

/// Opens a movie for reading. Throws ToolError with code 4 for a file that can not be read and 3
/// for one that holds nothing.
void openMovie(KVAtomBoxFile& file, std::string const& path);

/// The tree of an open file as deep as its containers are known, at most 64 levels.
std::vector<MovieAtom> readMovieTree(KVAtomBoxFile& file);

/// The tree that a write of this file would give, with the places that its atoms would have. The
/// file's own tree is as deep as it was read.
std::vector<MovieAtom> planMovieTree(KVAtomBoxFile const& file);

/// What became of an atom.
struct AtomChange {
    enum Kind { Same, Moved, Changed, New, Gone };
    static constexpr char marks[] = {' ', '>', '*', '+', '-'}; ///< by Kind
    static constexpr char const* kindNames[] = {"same", "moved", "changed", "new", "gone"};

    Kind kind;
    int depth;
    std::string path; ///< "moov/trak[2]/tkhd": which of its kind, from 1, where there are several
    MovieAtom const* before = nullptr;
    MovieAtom const* after = nullptr;
};

/// Whether two leaves of equal size have equal payloads.
using SameBytes = std::function<bool(MovieAtom const& before, MovieAtom const& after)>;

/// Every atom of `after` in document order, and those of `before` that are gone behind their
/// siblings. Atoms are paired by type and place among those of their type. The results point into
/// the trees.
std::vector<AtomChange> compareMovieTrees(std::vector<MovieAtom> const& before,
                                          std::vector<MovieAtom> const& after,
                                          SameBytes const& sameBytes);

/// The trees of a file and of the one that it is compared with, and what became of each atom.
struct MovieComparison {
    std::uint64_t length = 0; ///< of the file, in bytes
    std::vector<MovieAtom> before, after;
    std::vector<AtomChange> changes; ///< they point into the trees
};

/// Reads `path` and compares it with `against`; where that is empty every atom is the same. Throws
/// as `openMovie` does, and with code 4 for bytes that can not be read.
MovieComparison compareMovies(std::string const& path, std::string const& against);
