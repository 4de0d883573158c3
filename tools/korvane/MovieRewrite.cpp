#include "MovieRewrite.h"

#include "FileBytes.h"
#include "ToolError.h"

#include <algorithm>

namespace {

using Chunk = ChunkTable::Chunk;

/// A payload with bounds.
class Payload {
public:
    Payload(KVAtomBoxFile& file, KVAtomBox const* atom)
        : data_(KVCFRef<CFMutableDataRef>::adopt(new __CFData()))
    {
        found_ = file.readAtomBoxPayload(atom, data_) == 0;
    }

    bool found() const noexcept { return found_; }
    bool has(std::uint64_t position, std::uint64_t count) const noexcept
    {
        return position <= data_->length() && count <= data_->length() - position;
    }
    /// The big-endian number of `size` bytes; 0 outside the payload.
    std::uint64_t number(std::uint64_t position, unsigned int size) const noexcept
    {
        std::uint64_t value = 0;
        for (std::uint64_t i = position; has(position, size) && i < position + size; ++i)
            value = value << 8 | data_->bytes()[i];
        return value;
    }

private:
    KVCFRef<CFMutableDataRef> data_;
    bool found_;
};

/// The sizes of a track's samples (ISO/IEC 14496-12, 8.7.3).
class SampleSizes {
public:
    SampleSizes(KVAtomBoxFile& file, KVAtomBox const& table)
        : compact_(!table.findFirstChild(false, KVAtomType("stsz"))),
          payload_(file,
                   table.findFirstChild(false, compact_ ? KVAtomType("stz2") : KVAtomType("stsz"))),
          fixed_(compact_ ? 0 : payload_.number(4, 4)),
          count_(payload_.number(8, 4)),
          bits_(compact_ ? payload_.number(7, 1) : 32)
    {}

    bool isSound() const noexcept
    {
        return payload_.has(0, 12) && (bits_ == 4 || bits_ == 8 || bits_ == 16 || bits_ == 32) &&
               (fixed_ != 0 || payload_.has(12, (count_ * bits_ + 7) / 8));
    }
    std::uint64_t count() const noexcept { return count_; }
    std::uint64_t sumOf(std::uint64_t first, std::uint64_t count) const noexcept
    {
        if (fixed_ != 0)
            return fixed_ * count;
        std::uint64_t sum = 0;
        for (std::uint64_t i = first; i < first + count; ++i)
            sum += bits_ == 4
                       ? payload_.number(12 + i / 2, 1) >> (i % 2 ? 0 : 4) & 15
                       : payload_.number(12 + i * bits_ / 8, static_cast<unsigned>(bits_ / 8));
        return sum;
    }

private:
    bool compact_;
    Payload payload_;
    std::uint64_t fixed_, count_, bits_;
};

/// Whether one of the track's data references leads elsewhere (8.7.2).
bool isExternal(KVAtomBoxFile& file, KVAtomBox const& track)
{
    KVAtomBox* const dinf = track.findFirstChild(true, KVAtomType("dinf"));
    if (!dinf || file.readChildAtomBoxHeaders(dinf) != 0)
        return false;
    Payload const references(file, dinf->findFirstChild(false, KVAtomType("dref")));
    std::uint64_t position = 8;
    for (std::uint64_t i = 0; i < references.number(4, 4) && references.has(position, 12); ++i) {
        if ((references.number(position + 11, 1) & 1) == 0)
            return true;
        position += std::max<std::uint64_t>(references.number(position, 4), 12);
    }
    return false;
}

/// Every chunk with its size; false when the tables contradict each other.
bool readChunks(KVAtomBoxFile& file, KVAtomBox const& samples, ChunkTable& table)
{
    Payload const offsets(
        file, samples.findFirstChild(false, table.wide ? KVAtomType("co64") : KVAtomType("stco")));
    Payload const runs(file, samples.findFirstChild(false, KVAtomType("stsc")));
    SampleSizes const sizes(file, samples);
    unsigned int const width = table.wide ? 8 : 4;
    std::uint64_t const count = offsets.number(4, 4);
    std::uint64_t const runCount = runs.number(4, 4);
    if (!offsets.has(0, 8) || !offsets.has(8, count * width))
        return false;
    if (count == 0)
        return true;
    if (!runs.has(8, runCount * 12) || !sizes.isSound() || runCount == 0 || runs.number(8, 4) != 1)
        return false;
    std::uint64_t run = 0, sample = 0;
    for (std::uint64_t i = 0; i < count; ++i) {
        // First chunk, samples a chunk, description (8.7.4).
        while (run + 1 < runCount && runs.number(8 + 12 * (run + 1), 4) <= i + 1)
            ++run;
        std::uint64_t const wanted = runs.number(12 + 12 * run, 4);
        std::uint64_t const inChunk = std::min(wanted, sizes.count() - sample);
        table.chunks.push_back(
            {offsets.number(8 + i * width, width), sizes.sumOf(sample, inChunk)});
        sample += inChunk;
    }
    return true;
}

/// Atoms must fill the file and the containers that the library takes apart.
void checkCoverage(KVAtomBox const& box, std::string const& path)
{
    if (box.getChildCount() == 0)
        return;
    std::uint64_t end = box.getOffset() + box.getHeaderSize();
    for (int i = 0; i < box.getChildCount(); ++i) {
        end += box.getChild(i)->getSize();
        checkCoverage(*box.getChild(i), path);
    }
    if (end != box.getOffset() + box.getSize())
        throw badInput(path, "the bytes from " + std::to_string(end) +
                                 " on are no atom: the file is cut short, or holds something else "
                                 "there");
}

[[noreturn]] void refuse(std::string const& path, std::string const& reason)
{
    throw ToolError(ExitCode::Failed, path + ": " + reason + "; nothing was written");
}

std::string chunkName(ChunkTable const& table, Chunk const& chunk)
{
    return table.path + ": chunk " + std::to_string(&chunk - table.chunks.data() + 1) +
           " at offset " + std::to_string(chunk.offset);
}

std::string signedText(long long value)
{
    return (value < 0 ? "" : "+") + std::to_string(value);
}

void checkTables(RewritePlan const& plan, std::string const& path)
{
    std::vector<AtomChange const*> top;
    for (AtomChange const& change : plan.changes)
        if (change.depth == 0 && change.before)
            top.push_back(&change);
    std::sort(top.begin(), top.end(), [](AtomChange const* a, AtomChange const* b) {
        return a->before->offset < b->before->offset;
    });
    for (ChunkTable const& table : plan.tables) {
        if (table.external) {
            if (plan.shift != 0)
                refuse(path, table.path +
                                 ": the samples lie in another file, and the offsets into "
                                 "it would be moved by " +
                                 signedText(plan.shift));
            continue;
        }
        for (Chunk const& chunk : table.chunks) {
            auto const after = static_cast<long long>(chunk.offset) + plan.shift;
            if (!table.wide && (after < 0 || after > 0xFFFFFFFFLL))
                refuse(path, chunkName(table, chunk) + " would move by " + signedText(plan.shift) +
                                 ", past what its 32 bits hold");
            auto const next = std::upper_bound(top.begin(), top.end(), chunk.offset,
                                               [](std::uint64_t offset, AtomChange const* change) {
                                                   return offset < change->before->offset;
                                               });
            AtomChange const* const home = next == top.begin() ? nullptr : *(next - 1);
            if (chunk.size == 0)
                continue;
            if (!home || !home->after || home->kind == AtomChange::Changed ||
                chunk.offset + chunk.size > home->before->offset + home->before->size)
                refuse(path, chunkName(table, chunk) + " does not lie in an atom that is copied");
            auto const moved = static_cast<long long>(home->after->offset) -
                               static_cast<long long>(home->before->offset);
            if (moved != plan.shift)
                refuse(path, chunkName(table, chunk) + " would move by " + signedText(moved) +
                                 " with its " + home->before->type + " atom, but the table by " +
                                 signedText(plan.shift));
        }
    }
}

/// Offsets from the start of the file that no table of chunks holds: in fragments (8.8.7, 8.8.10)
/// and for auxiliary information (8.7.9).
void checkOtherOffsets(RewritePlan const& plan, std::string const& path, FileBytes const& bytes)
{
    std::uint64_t fragmentMoves = 0;
    for (AtomChange const& change : plan.changes)
        if (change.depth == 0 && change.before && change.before->type == "moof" &&
            (!change.after || change.after->offset != change.before->offset))
            ++fragmentMoves;
    for (MovieAtom const& fragment : plan.before) {
        if (fragmentMoves > 0 && fragment.type == "mfra")
            refuse(path, "its mfra atom holds the places of fragments that would move");
        if (fragmentMoves == 0 || fragment.type != "moof")
            continue;
        for (MovieAtom const& track : fragment.children)
            for (MovieAtom const& header : track.children) {
                std::uint8_t flags[4] = {};
                bytes.read(header.offset + header.header, flags, sizeof flags);
                if (track.type == "traf" && header.type == "tfhd" && (flags[3] & 1))
                    refuse(path, "the fragment at offset " + std::to_string(fragment.offset) +
                                     " would move, and counts its data from the start of the file");
            }
    }
    for (AtomChange const& change : plan.changes)
        if (plan.shift != 0 && change.path.find("stbl/saio") != std::string::npos)
            refuse(path, change.path + " holds offsets into media data that would move");
}

std::vector<MovieAtom> fragmentsOf(std::string const& path)
{
    KVAtomBoxFile file;
    openMovie(file, path);
    std::vector<MovieAtom> atoms = planMovieTree(file);
    bool const fragmented = std::any_of(atoms.begin(), atoms.end(),
                                        [](MovieAtom const& atom) { return atom.type == "moof"; });
    std::erase_if(atoms, [&](MovieAtom const& atom) {
        return !fragmented || (atom.type != "moof" && atom.type != "mdat");
    });
    return atoms;
}

} // namespace

std::vector<ChunkTable> readChunkTables(std::string const& path)
{
    KVAtomBoxFile file;
    openMovie(file, path);
    if (file.readAllTrackMediaAtomBoxes() != 0)
        throw badInput(path, "has no moov atom, or more than one");
    checkCoverage(file, path);
    std::vector<ChunkTable> tables;
    std::vector<KVAtomBox*> tracks;
    file.findAllChildren(tracks, true, KVAtomType("trak"));
    for (std::size_t i = 0; i < tracks.size(); ++i) {
        std::string const name = tracks.size() > 1 ? "trak[" + std::to_string(i + 1) + "]" : "trak";
        KVAtomBox const* const samples = tracks[i]->findFirstChild(true, KVAtomType("stbl"));
        if (!samples)
            continue;
        for (bool const wide : {false, true}) {
            char const* const type = wide ? "co64" : "stco";
            if (!samples->findFirstChild(false, wide ? KVAtomType("co64") : KVAtomType("stco")))
                continue;
            ChunkTable table{
                "moov/" + name + "/mdia/minf/stbl/" + type, wide, isExternal(file, *tracks[i]), {}};
            if (!readChunks(file, *samples, table))
                throw badInput(path, table.path + ": the sample tables of this track contradict "
                                                  "each other");
            for (Chunk const& chunk : table.chunks)
                if (!table.external &&
                    (chunk.offset > file.getSize() || chunk.size > file.getSize() - chunk.offset))
                    throw badInput(path, table.path + ": leads to offset " +
                                             std::to_string(chunk.offset) +
                                             ", where the file has no such bytes");
            tables.push_back(std::move(table));
        }
    }
    return tables;
}

RewritePlan planRewrite(KVAtomBoxFile& file, std::string const& path)
{
    RewritePlan plan;
    plan.tables = readChunkTables(path);
    plan.shift = file.getMediaDataShift();
    plan.after = planMovieTree(file);
    KVAtomBoxFile original;
    openMovie(original, path);
    plan.before = readMovieTree(original);
    FileBytes const bytes(path);
    plan.changes = compareMovieTrees(
        plan.before, plan.after, [&](MovieAtom const& before, MovieAtom const& after) {
            if (!after.payload)
                return true;
            std::vector<std::uint8_t> old(after.payload->length());
            std::size_t const got =
                bytes.read(before.offset + before.header, old.data(), old.size());
            return got == old.size() && std::equal(old.begin(), old.end(), after.payload->bytes());
        });
    return plan;
}

void checkRewrite(RewritePlan const& plan, std::string const& path)
{
    checkTables(plan, path);
    checkOtherOffsets(plan, path, FileBytes(path));
}

std::uint64_t verifyRewrite(std::string const& original, std::string const& rewritten)
{
    FileBytes const before(original), after(rewritten);
    std::uint64_t compared = 0;
    auto const compare = [&](std::uint64_t offset, std::uint64_t newOffset, std::uint64_t size,
                             std::string const& what) {
        if (!FileBytes::same(before, offset, after, newOffset, size))
            throw ToolError(ExitCode::Failed, original + ": after the rewrite the bytes of " +
                                                  what + " are not the same; nothing was kept");
        compared += size;
    };
    auto const oldTables = readChunkTables(original), newTables = readChunkTables(rewritten);
    bool const alike = std::equal(oldTables.begin(), oldTables.end(), newTables.begin(),
                                  newTables.end(), [](auto const& a, auto const& b) {
                                      return a.path == b.path && a.chunks.size() == b.chunks.size();
                                  });
    if (!alike)
        throw ToolError(ExitCode::Failed,
                        original +
                            ": after the rewrite the sample tables are not the same; nothing "
                            "was kept");
    for (std::size_t i = 0; i < oldTables.size(); ++i)
        for (std::size_t j = 0; !oldTables[i].external && j < oldTables[i].chunks.size(); ++j) {
            Chunk const &a = oldTables[i].chunks[j], &b = newTables[i].chunks[j];
            compare(a.offset, b.offset, std::max(a.size, b.size), chunkName(oldTables[i], a));
        }
    auto const oldFragments = fragmentsOf(original), newFragments = fragmentsOf(rewritten);
    for (std::size_t i = 0; i < std::max(oldFragments.size(), newFragments.size()); ++i) {
        if (i >= oldFragments.size() || i >= newFragments.size() ||
            oldFragments[i].size != newFragments[i].size)
            throw ToolError(ExitCode::Failed, original +
                                                  ": after the rewrite the fragments are not "
                                                  "the same; nothing was kept");
        compare(oldFragments[i].offset, newFragments[i].offset, oldFragments[i].size,
                oldFragments[i].type + " at offset " + std::to_string(oldFragments[i].offset));
    }
    return compared;
}
