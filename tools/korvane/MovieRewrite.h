#pragma once

#include "MovieTree.h"

#include <cstdint>
#include <string>
#include <vector>

/// The chunk offset table of a track.
struct ChunkTable {
    struct Chunk {
        std::uint64_t offset, size; ///< in bytes
    };
    std::string path; ///< "moov/trak[1]/mdia/minf/stbl/stco"
    bool wide;        ///< offsets of 64 bits
    bool external;    ///< the samples of the track lie in another file
    std::vector<Chunk> chunks;
};

/// Every chunk offset table of a movie. Throws ToolError with code 3 when bytes of it are in no
/// atom, or when its sample tables can not be read or lead out of it.
std::vector<ChunkTable> readChunkTables(std::string const& path);

/// What a rewrite of a changed movie would do.
struct RewritePlan {
    std::vector<MovieAtom> before, after;
    std::vector<AtomChange> changes;
    std::vector<ChunkTable> tables;
    long long shift = 0; ///< of every chunk offset
};

/// Plans the rewrite of `file`, whose tree holds the changes. Throws as `readChunkTables` does:
/// what is in no atom would be lost.
RewritePlan planRewrite(KVAtomBoxFile& file, std::string const& path);

/// Throws ToolError with code 1 when chunk offsets, or those of fragments, would be wrong
/// afterwards.
void checkRewrite(RewritePlan const& plan, std::string const& path);

/// Compares every sample that the tables of the two files lead to, and the fragments. Answers the
/// number of bytes compared. Throws ToolError with code 1 at the first that is not the same.
std::uint64_t verifyRewrite(std::string const& original, std::string const& rewritten);
