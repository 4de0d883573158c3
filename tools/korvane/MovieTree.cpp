#include "MovieTree.h"

#include "FileBytes.h"
#include "Input.h"
#include "ToolError.h"

#include <algorithm>
#include <cstdio>
#include <filesystem>
#include <iterator>
#include <map>

namespace {

constexpr int kDeepest = 64;

constexpr unsigned int kContainers[] = {
    KVAtomType("moov"), KVAtomType("trak"), KVAtomType("mdia"), KVAtomType("minf"),
    KVAtomType("stbl"), KVAtomType("edts"), KVAtomType("dinf"), KVAtomType("udta"),
    KVAtomType("mvex"), KVAtomType("moof"), KVAtomType("traf"), KVAtomType("mfra"),
    KVAtomType("tref"), KVAtomType("gmhd"), KVAtomType("tapt"), KVAtomType("sinf"),
    KVAtomType("schi"), KVAtomType("strk"), KVAtomType("ilst"), KVAtomType("meta")};

std::string typeText(unsigned int type)
{
    std::string text;
    for (int shift = 24; shift >= 0; shift -= 8) {
        unsigned int const c = type >> shift & 0xFF;
        char escaped[8];
        if (c == 0xA9) { // Mac OS Roman
            text += "\xC2\xA9";
        } else if (c < 0x20 || c > 0x7E) {
            std::snprintf(escaped, sizeof escaped, "\\x%02X", c);
            text += escaped;
        } else {
            text.push_back(static_cast<char>(c));
        }
    }
    return text;
}

MovieAtom makeAtom(KVAtomBox const& box, std::uint64_t offset)
{
    MovieAtom atom;
    atom.type = typeText(box.getType());
    atom.offset = offset;
    atom.size = box.getSize();
    atom.header = box.getHeaderSize();
    return atom;
}

/// The atoms in a description, `start` being where the payload that they were read from begins.
/// With `bytes`, that payload is in memory.
std::vector<MovieAtom> descriptionAtoms(KVAtomBox const& parent, std::uint64_t start,
                                        CFDataRef bytes)
{
    std::vector<MovieAtom> atoms;
    for (int i = 0; i < parent.getChildCount(); ++i) {
        KVAtomBox const& box = *parent.getChild(i);
        // The fixed fields and the colour table have no header and are no atoms.
        if (box.getHeaderSize() == 0)
            continue;
        MovieAtom atom = makeAtom(box, start + box.getOffset());
        atom.children = descriptionAtoms(box, start, bytes);
        if (bytes && atom.children.empty())
            atom.payload = KVCFRef<CFDataRef>::adopt(
                new __CFData(bytes->bytes() + box.getOffset() + atom.header, box.getPayloadSize()));
        atoms.push_back(std::move(atom));
    }
    return atoms;
}

/// Children that may have version and flags in front of them: those of `meta` do in MP4, and not in
/// QuickTime.
void readFullContainer(KVAtomBoxFile& file, KVAtomBox& box)
{
    std::uint64_t const payload = box.getPayloadSize();
    if (payload >= 4) {
        box.setPayloadSize(payload - 4);
        file.readChildAtomBoxHeaders(&box);
        std::uint64_t sum = 0;
        for (int i = 0; i < box.getChildCount(); ++i)
            sum += box.getChild(i)->getSize();
        if (sum == payload - 4)
            return;
        box.setPayloadSize(payload);
    }
    file.readChildAtomBoxHeaders(&box);
}

class TreeReader {
public:
    explicit TreeReader(KVAtomBoxFile& file) : file_(file) {}

    /// `track` is the track that the parent lies in, or null.
    std::vector<MovieAtom> childrenOf(KVAtomBox& parent, KVAtomBox const* track, int depth)
    {
        std::vector<MovieAtom> atoms;
        for (int i = 0; i < parent.getChildCount(); ++i) {
            KVAtomBox& box = *parent.getChild(i);
            unsigned int const type = box.getType();
            bool const isContainer = std::find(std::begin(kContainers), std::end(kContainers),
                                               type) != std::end(kContainers);
            MovieAtom atom = makeAtom(box, box.getOffset());
            if (depth < kDeepest && isContainer) {
                if (type == KVAtomType("meta"))
                    readFullContainer(file_, box);
                else
                    file_.readChildAtomBoxHeaders(&box);
                KVAtomBox const* const within = type == KVAtomType("trak") ? &box : track;
                atom.children = childrenOf(box, within, depth + 1);
            } else if (type == KVAtomType("stsd") && isVideo(track)) {
                auto const data = KVCFRef<CFMutableDataRef>::adopt(new __CFData());
                if (file_.readAtomBoxPayload(&box, data) == 0)
                    atom.children =
                        descriptionAtoms(KVImageDescAtomBox(data).getTopAtomBox(),
                                         box.getOffset() + box.getHeaderSize(), nullptr);
            }
            atoms.push_back(std::move(atom));
        }
        return atoms;
    }

private:
    bool isVideo(KVAtomBox const* track)
    {
        unsigned int handler = 0;
        return file_.readTrackInfo(track, &handler, nullptr) == 0 && handler == KVAtomType("vide");
    }

    KVAtomBoxFile& file_;
};

std::vector<MovieAtom> planChildren(KVAtomBox const& parent, std::uint64_t offset)
{
    std::vector<MovieAtom> atoms;
    for (int i = 0; i < parent.getChildCount(); ++i) {
        KVAtomBox const& box = *parent.getChild(i);
        MovieAtom atom = makeAtom(box, offset);
        if (CFDataRef const data = box.getPayloadData()) {
            atom.payload = data;
            if (box.getType() == KVAtomType("stsd"))
                atom.children = descriptionAtoms(KVImageDescAtomBox(data).getTopAtomBox(),
                                                 offset + atom.header, data);
        } else if (box.getChildCount() > 0) {
            atom.children = planChildren(box, offset + atom.header);
        }
        offset += atom.size;
        atoms.push_back(std::move(atom));
    }
    return atoms;
}

/// The atoms of each type in document order.
std::map<std::string, std::vector<MovieAtom const*>> byType(std::vector<MovieAtom> const& atoms)
{
    std::map<std::string, std::vector<MovieAtom const*>> groups;
    for (MovieAtom const& atom : atoms)
        groups[atom.type].push_back(&atom);
    return groups;
}

class TreeComparer {
public:
    explicit TreeComparer(SameBytes const& sameBytes) : sameBytes_(sameBytes) {}

    /// Whether something at this level or below it is not the same.
    bool compare(std::vector<MovieAtom> const& before, std::vector<MovieAtom> const& after,
                 std::string const& path, int depth)
    {
        auto oldOnes = byType(before), newOnes = byType(after);
        auto const nameOf = [&](std::string const& type, std::size_t place, auto& groups) {
            bool const alone = groups[type].size() == 1;
            return path + type + (alone ? "" : "[" + std::to_string(place + 1) + "]");
        };
        bool differs = false;
        std::map<std::string, std::size_t> seen;
        for (MovieAtom const& atom : after) {
            std::size_t const place = seen[atom.type]++;
            auto const& partners = oldOnes[atom.type];
            MovieAtom const* const old = place < partners.size() ? partners[place] : nullptr;
            std::string const name = nameOf(atom.type, place, newOnes);
            std::size_t const entry = changes.size();
            changes.push_back({old ? AtomChange::Same : AtomChange::New, depth, name, old, &atom});
            bool changed = !old || old->size != atom.size;
            if (!atom.children.empty())
                changed |=
                    compare(old ? old->children : none_, atom.children, name + "/", depth + 1);
            else if (!changed)
                changed = !sameBytes_(*old, atom);
            differs |= changed;
            if (old && changed)
                changes[entry].kind = AtomChange::Changed;
            else if (old && old->offset != atom.offset)
                changes[entry].kind = AtomChange::Moved;
        }
        for (auto const& [type, atoms] : oldOnes)
            for (std::size_t place = newOnes[type].size(); place < atoms.size(); ++place) {
                differs = true;
                changes.push_back(
                    {AtomChange::Gone, depth, nameOf(type, place, oldOnes), atoms[place], nullptr});
            }
        return differs;
    }

    std::vector<AtomChange> changes;

private:
    SameBytes const& sameBytes_;
    std::vector<MovieAtom> const none_;
};

} // namespace

void openMovie(KVAtomBoxFile& file, std::string const& path)
{
    std::error_code error;
    if (path == "-" || std::filesystem::is_fifo(path, error))
        throw inputOutput(path, "a movie is gone through more than once: it must be a file");
    ReopenableFile const reopenable(path);
    if (file.openInputFile(KVURL(reopenable.path().c_str()).cf_url()) != 0)
        throw badInput(path, "is empty, or no regular file");
    if (file.readTopLevelAtomBoxHeaders() != 0 || file.getChildCount() == 0)
        throw badInput(path, "is no QuickTime or MP4 file");
}

std::vector<MovieAtom> readMovieTree(KVAtomBoxFile& file)
{
    return TreeReader(file).childrenOf(file, nullptr, 1);
}

std::vector<MovieAtom> planMovieTree(KVAtomBoxFile const& file)
{
    return planChildren(file, 0);
}

std::vector<AtomChange> compareMovieTrees(std::vector<MovieAtom> const& before,
                                          std::vector<MovieAtom> const& after,
                                          SameBytes const& sameBytes)
{
    TreeComparer comparer(sameBytes);
    comparer.compare(before, after, "", 0);
    return std::move(comparer.changes);
}

MovieComparison compareMovies(std::string const& path, std::string const& against)
{
    MovieComparison result;
    KVAtomBoxFile file;
    openMovie(file, path);
    result.length = file.getSize();
    result.after = readMovieTree(file);
    if (against.empty()) {
        result.changes = compareMovieTrees(result.after, result.after,
                                           [](auto const&, auto const&) { return true; });
        return result;
    }
    KVAtomBoxFile other;
    openMovie(other, against);
    result.before = readMovieTree(other);
    FileBytes const bytes(path), otherBytes(against);
    result.changes =
        compareMovieTrees(result.before, result.after, [&](MovieAtom const& a, MovieAtom const& b) {
            return a.header == b.header && FileBytes::same(otherBytes, a.offset + a.header, bytes,
                                                           b.offset + b.header, b.size - b.header);
        });
    return result;
}
