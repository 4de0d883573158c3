#include "Html.h"
#include "Sections.h"
#include "Svg.h"

#include "../FileBytes.h"
#include "../Markup.h"
#include "../MovieRewrite.h"
#include "../MovieTree.h"
#include "../ToolError.h"

#include <algorithm>
#include <array>
#include <optional>
#include <unordered_map>

namespace {

constexpr double left = 64, right = 1098;
constexpr double stripHeight = 40, levelHeight = 24;
constexpr double narrowest = 6;        ///< an atom, in pixels
constexpr std::size_t mostPieces = 80; ///< side by side
constexpr std::size_t mostNodes = 500; ///< below the top
constexpr int deepest = 10;            ///< level that is drawn

/// "* changed", with the marks of `korvane media tree`.
std::string markedName(std::size_t kind)
{
    if (kind == AtomChange::Same)
        return "as before";
    return std::string(1, AtomChange::marks[kind]) + " " + AtomChange::kindNames[kind];
}

/// What became of atoms; empty where there is nothing to compare with.
using Kinds = std::unordered_map<MovieAtom const*, AtomChange const*>;

/// Atoms side by side that are drawn as one.
struct Piece {
    MovieAtom const* atom = nullptr; ///< the first; null for bytes that are in no atom
    std::uint64_t offset = 0, size = 0;
    std::size_t count = 1;
    AtomChange::Kind kind = AtomChange::Same;
    char const* look = "same"; ///< a class; those of changes are the names of the kinds
};

/// By what they became, else by what they are for.
char const* lookOf(MovieAtom const& atom, Kinds const& kinds, AtomChange::Kind kind)
{
    if (!kinds.empty())
        return AtomChange::kindNames[kind];
    return atom.type == "mdat" ? "c0" : atom.children.empty() ? "same" : "c1";
}

std::vector<Piece> piecesOf(std::vector<MovieAtom> const& atoms, Kinds const& kinds)
{
    std::uint64_t total = 0;
    for (MovieAtom const& atom : atoms)
        total += atom.size;
    // Of very many, small neighbours gather until they are worth a place.
    std::uint64_t const worth = atoms.size() > mostPieces ? total / (mostPieces / 2) : 0;
    std::vector<Piece> pieces;
    for (MovieAtom const& atom : atoms) {
        auto const found = kinds.find(&atom);
        AtomChange::Kind const kind = found == kinds.end() ? AtomChange::Same : found->second->kind;
        if (!pieces.empty() && atom.size < worth && pieces.back().size < worth) {
            Piece& piece = pieces.back();
            piece.size += atom.size;
            if (piece.kind != kind) {
                piece.kind = AtomChange::Changed;
                piece.look = AtomChange::kindNames[AtomChange::Changed];
            }
            ++piece.count;
        } else {
            pieces.push_back({&atom, atom.offset, atom.size, 1, kind, lookOf(atom, kinds, kind)});
        }
    }
    return pieces;
}

/// Widths to scale that fill `width`, but none below its minimum.
std::vector<double> scaledWidths(std::vector<double> const& sizes,
                                 std::vector<double> const& minima, double width)
{
    std::vector<double> widths(sizes.size(), -1);
    for (bool changed = true; changed;) {
        changed = false;
        double room = width, total = 0;
        for (std::size_t i = 0; i < sizes.size(); ++i)
            widths[i] >= 0 ? room -= widths[i] : total += sizes[i];
        double const scale = total > 0 ? std::max(room, 0.0) / total : 0;
        for (std::size_t i = 0; i < sizes.size(); ++i)
            if (widths[i] < 0 && sizes[i] * scale < minima[i]) {
                widths[i] = minima[i];
                changed = true;
            }
        if (!changed)
            for (std::size_t i = 0; i < sizes.size(); ++i)
                widths[i] = widths[i] < 0 ? sizes[i] * scale : widths[i];
    }
    return widths;
}

std::string tooltipOf(Piece const& piece)
{
    std::string const place = ", offset " + grouped(piece.offset) + ", " + bytesText(piece.size);
    if (!piece.atom)
        return "bytes that are in no atom" + place;
    if (piece.count > 1)
        return grouped(piece.count) + " atoms from " + piece.atom->type + " on" + place;
    return piece.atom->type + place +
           (piece.kind == AtomChange::Same ? "" : ": " + markedName(piece.kind));
}

void drawPiece(Svg& svg, Piece const& piece, double x, double y, double width, double height)
{
    std::string classes = piece.look;
    if (piece.count > 1 || !piece.atom)
        classes += " many";
    svg.rect(x + 0.5, y + 0.5, std::max(width - 1, 1.0), height - 1, classes, tooltipOf(piece));
    std::string name = piece.count > 1 ? grouped(piece.count) : piece.atom ? piece.atom->type : "?";
    if (piece.kind != AtomChange::Same)
        name.insert(0, markedName(piece.kind).substr(0, 2));
    if (widthOf(name) + 4 > width) // rather no mark than no name
        name.erase(0, piece.kind != AtomChange::Same ? 2 : 0);
    bool const isTall = height > levelHeight;
    if (widthOf(name) + 4 <= width)
        svg.text(x + width / 2, y + height / 2 + (isTall ? -3 : 4), name, "mid");
    std::string const size = bytesText(piece.size);
    if (isTall && widthOf(size) <= width)
        svg.text(x + width / 2, y + height / 2 + 13, size, "mid small");
}

/// The place of a piece in a strip.
struct Box {
    Piece piece;
    double x, width;
};

/// A file from end to end. `length` is drawn as wide as its part of `longest`.
class Strip {
public:
    Strip(std::vector<MovieAtom> const& atoms, Kinds const& kinds, std::uint64_t length,
          std::uint64_t longest)
        : length_(length)
    {
        std::vector<Piece> pieces = piecesOf(atoms, kinds);
        std::uint64_t const end = pieces.back().offset + pieces.back().size;
        if (end < length)
            pieces.push_back({nullptr, end, length - end});
        std::vector<double> sizes;
        for (Piece const& piece : pieces)
            sizes.push_back(static_cast<double>(piece.size));
        double const width =
            (right - left) * static_cast<double>(length) / static_cast<double>(longest);
        auto const widths =
            scaledWidths(sizes, std::vector<double>(pieces.size(), narrowest), width);
        double x = left;
        for (std::size_t i = 0; i < pieces.size(); ++i) {
            boxes_.push_back({pieces[i], x, widths[i]});
            x += widths[i];
        }
    }

    std::vector<Box> const& boxes() const noexcept { return boxes_; }

    void draw(Svg& svg, double y, char const* label) const
    {
        svg.text(left - 10, y + stripHeight / 2 + 4, label, "end soft");
        for (Box const& box : boxes_)
            drawPiece(svg, box.piece, box.x, y, box.width, stripHeight);
    }

    /// Offsets where atoms begin, as far as there is room.
    void drawOffsets(Svg& svg, double y) const
    {
        Box const& last = boxes_.back();
        double const end = last.x + last.width;
        std::string const length = bytesText(length_);
        double const lastLabel = end - widthOf(length) - 12;
        double used = 0;
        for (Box const& box : boxes_) {
            std::string const text = grouped(box.piece.offset);
            if (box.x < used || box.x + widthOf(text) > lastLabel)
                continue;
            svg.line(box.x, y, box.x, y + 5, "axisline");
            svg.text(box.x, y + 16, text, "soft");
            used = box.x + widthOf(text) + 10;
        }
        svg.line(end, y, end, y + 5, "axisline");
        svg.text(end, y + 16, length, "soft end");
    }

private:
    std::uint64_t length_;
    std::vector<Box> boxes_;
};

/// An atom below the top, with the room that it needs.
struct Node {
    Piece piece;
    double minimum = narrowest;
    std::vector<Node> children;
};

/// Draws a container level by level, as wide as the picture.
class Magnified {
public:
    Magnified(Svg& svg, Kinds const& kinds,
              std::unordered_map<MovieAtom const*, std::string> const& shifts)
        : svg_(svg), kinds_(kinds), shifts_(shifts)
    {}

    /// The place below the last level.
    double draw(Piece const& container, double y)
    {
        Node const root = nodeOf(container, 0);
        bottom_ = y;
        drawNode(root, left, y, right - left);
        return bottom_;
    }
    std::size_t leftOut() const noexcept { return leftOut_; }

private:
    Node nodeOf(Piece const& piece, int level)
    {
        Node node{piece, narrowest, {}};
        if (piece.count > 1)
            return node;
        std::vector<Piece> const pieces = piecesOf(piece.atom->children, kinds_);
        if (level == deepest || count_ + pieces.size() > mostNodes) {
            leftOut_ += piece.atom->children.size();
            return node;
        }
        count_ += pieces.size();
        double sum = 0;
        for (Piece const& child : pieces) {
            node.children.push_back(nodeOf(child, level + 1));
            sum += node.children.back().minimum;
        }
        node.minimum = std::max(sum, narrowest);
        return node;
    }

    void drawNode(Node const& node, double x, double y, double width)
    {
        drawPiece(svg_, node.piece, x, y, width, levelHeight);
        auto const shift = shifts_.find(node.piece.atom);
        if (node.piece.count == 1 && shift != shifts_.end())
            svg_.rect(x + 1.5, y + 1.5, std::max(width - 3, 1.0), levelHeight - 3, "offsets",
                      node.piece.atom->type + ": " + shift->second);
        bottom_ = std::max(bottom_, y + levelHeight);
        if (node.children.empty())
            return;
        // What is in front of the children, and behind them, belongs to the atom alone.
        std::uint64_t const begin = node.children.front().piece.offset;
        std::uint64_t const end =
            node.children.back().piece.offset + node.children.back().piece.size;
        std::vector<double> sizes{double(begin - std::min(begin, node.piece.offset))}, minima{0};
        for (Node const& child : node.children) {
            sizes.push_back(static_cast<double>(child.piece.size));
            minima.push_back(child.minimum);
        }
        std::uint64_t const own = node.piece.offset + node.piece.size;
        sizes.push_back(double(own - std::min(own, end)));
        minima.push_back(0);
        auto const widths = scaledWidths(sizes, minima, width);
        x += widths[0];
        for (std::size_t i = 0; i < node.children.size(); ++i) {
            drawNode(node.children[i], x, y + levelHeight + 2, widths[i + 1]);
            x += widths[i + 1];
        }
    }

    Svg& svg_;
    Kinds const& kinds_;
    std::unordered_map<MovieAtom const*, std::string> const& shifts_;
    std::size_t count_ = 0, leftOut_ = 0;
    double bottom_ = 0;
};

std::string polygon(double x1, double x2, double y1, double x3, double x4, double y2)
{
    return "M" + decimal(x1) + " " + decimal(y1) + "H" + decimal(x2) + "L" + decimal(x4) + " " +
           decimal(y2) + "H" + decimal(x3) + "z";
}

// --- Chunk offsets ---

std::string signedText(long long value)
{
    return (value < 0 ? "\u2212" : "+") +
           grouped(static_cast<std::uint64_t>(value < 0 ? -value : value));
}

/// "every offset +312", or nothing where none has moved.
std::string shiftText(ChunkTable const& table, std::vector<ChunkTable> const& others)
{
    auto const other = std::find_if(others.begin(), others.end(), [&](ChunkTable const& one) {
        return one.path == table.path && one.chunks.size() == table.chunks.size();
    });
    if (other == others.end())
        return others.empty() ? "" : "another number of offsets";
    std::optional<std::array<long long, 2>> range;
    for (std::size_t i = 0; i < table.chunks.size(); ++i) {
        auto const moved = static_cast<long long>(table.chunks[i].offset - other->chunks[i].offset);
        if (!range)
            range = {{moved, moved}};
        range = {{std::min((*range)[0], moved), std::max((*range)[1], moved)}};
    }
    if (!range || ((*range)[0] == 0 && (*range)[1] == 0))
        return {};
    if ((*range)[0] == (*range)[1])
        return "every offset " + signedText((*range)[0]);
    return "offsets from " + signedText((*range)[0]) + " to " + signedText((*range)[1]);
}

/// The tables, or none and why.
std::vector<ChunkTable> tablesOf(std::string const& path, std::string& notes)
{
    try {
        return readChunkTables(path);
    } catch (ToolError const& error) {
        if (error.code() != ExitCode::BadInput)
            throw;
        std::string_view reason = error.what();
        if (reason.starts_with(path + ": "))
            reason.remove_prefix(path.size() + 2);
        notes += note("The chunk offsets are not shown. " + std::string(reason) + ".");
        return {};
    }
}

std::string atomsTable(MovieComparison const& movie, bool isCompared)
{
    std::vector<Table::Column> columns{{"Offset", true}, {"Size", true}, {"Atom"}};
    if (isCompared)
        columns.insert(columns.end(), {{"Change"}, {"Offset before", true}, {"Size before", true}});
    Table table("Atoms", columns);
    for (AtomChange const& change : movie.changes) {
        if (table.isFull()) {
            table.skip(1);
            continue;
        }
        std::string indent;
        for (int i = 0; i < std::min(change.depth, 16); ++i)
            indent += "\u2003";
        MovieAtom const* const after = change.after;
        MovieAtom const* const before = change.before;
        std::vector<std::string> cells{after ? grouped(after->offset) : "",
                                       after ? grouped(after->size) : "",
                                       indent + shownText((after ? after : before)->type)};
        if (isCompared)
            cells.insert(cells.end(),
                         {markedName(change.kind), before ? grouped(before->offset) : "",
                          before ? grouped(before->size) : ""});
        table.row(cells, AtomChange::kindNames[change.kind]);
    }
    return table.html("atoms");
}

} // namespace

std::string movieHtml(ReopenableFile const& file, std::string const& id, std::string const& before)
{
    bool const isCompared = !before.empty();
    MovieComparison const movie = compareMovies(file.path(), before);
    Kinds after, earlier;
    for (AtomChange const& change : movie.changes) {
        if (change.after)
            after.emplace(change.after, &change);
        if (change.before)
            earlier.emplace(change.before, &change);
    }

    Kinds const none;
    Kinds const& marked = isCompared ? after : none;

    std::string notes;
    std::vector<ChunkTable> const tables = tablesOf(file.path(), notes);
    std::vector<ChunkTable> const oldTables =
        isCompared ? tablesOf(before, notes) : std::vector<ChunkTable>();
    std::unordered_map<std::string, std::string> shiftsByPath;
    Table offsets("Chunk offset tables",
                  {{"Table"}, {"Offsets", true}, {"First offset", true}, {"Since the original"}});
    for (ChunkTable const& table : tables) {
        std::string const shift = shiftText(table, oldTables);
        if (!shift.empty())
            shiftsByPath[table.path] = shift;
        offsets.row({shownText(table.path), grouped(table.chunks.size()),
                     table.chunks.empty() ? "" : grouped(table.chunks[0].offset),
                     !isCompared     ? "not compared"
                     : shift.empty() ? "as before"
                                     : shift});
    }
    std::unordered_map<MovieAtom const*, std::string> shifts;
    for (AtomChange const& change : movie.changes)
        if (auto const found = shiftsByPath.find(change.path);
            change.after && found != shiftsByPath.end())
            shifts.emplace(change.after, found->second);

    std::uint64_t oldLength = 0;
    if (isCompared)
        oldLength = FileBytes(before).length();
    std::uint64_t const longest = std::max(movie.length, oldLength);
    Svg svg(right + 2, 0);
    Strip const strip(movie.after, marked, movie.length, longest);
    double y = 4;
    if (isCompared) {
        Strip const old(movie.before, earlier, oldLength, longest);
        old.draw(svg, y, "original");
        double const from = y + stripHeight;
        y = from + 30;
        for (Box const& box : strip.boxes())
            for (Box const& other : old.boxes())
                if (box.piece.atom && box.piece.count == 1 && after.count(box.piece.atom) &&
                    after.at(box.piece.atom)->before &&
                    after.at(box.piece.atom)->before == other.piece.atom)
                    svg.path(
                        polygon(other.x, other.x + other.width, from, box.x, box.x + box.width, y),
                        box.piece.kind == AtomChange::Moved ? "move" : "wedge");
    }
    strip.draw(svg, y, "file");
    strip.drawOffsets(svg, y + stripHeight);
    y += stripHeight;

    // The container that tells of all others, drawn larger.
    Magnified magnified(svg, marked, shifts);
    auto const& boxes = strip.boxes();
    auto const inner = std::find_if(boxes.begin(), boxes.end(), [](Box const& box) {
        return box.piece.atom && box.piece.count == 1 && box.piece.atom->type == "moov" &&
               !box.piece.atom->children.empty();
    });
    if (inner != boxes.end()) {
        svg.path(polygon(inner->x, inner->x + inner->width, y, left, right, y + 44), "wedge");
        svg.text(left - 10, y + 44 + 16, "moov", "end soft");
        y = magnified.draw(inner->piece, y + 44);
    } else {
        y += 20;
    }
    svg.setHeight(y + 2);

    std::vector<LegendEntry> entries;
    if (isCompared)
        for (std::size_t kind = AtomChange::Same; kind <= AtomChange::Gone; ++kind)
            entries.push_back({AtomChange::kindNames[kind], markedName(kind)});
    else
        entries = {{"c0", "media data"}, {"c1", "container"}, {"same", "other atom"}};
    if (!shifts.empty())
        entries.push_back({"offsets", "chunk offsets moved"});
    Facts facts;
    facts.add("Size", bytesText(movie.length))
        .add("Atoms", grouped(movie.after.empty() ? 0 : after.size()))
        .add("Chunk offset tables", grouped(tables.size()));
    if (isCompared)
        facts.add("Size of the original", bytesText(oldLength));
    std::string html =
        facts.html() + notes + "<h3>Map of the file</h3>\n" + legend(entries) +
        svg.scrollHtml(id + "-map", "Map of the file",
                       "The atoms of the file from left to right, to scale; those that "
                       "would be too narrow to see are drawn wider. Below it moov, "
                       "magnified, with what it contains. The table tells each atom.");
    if (magnified.leftOut() > 0)
        html += note("and " + grouped(magnified.leftOut()) +
                     " more atoms in it, for which the map has no room");
    if (!tables.empty())
        html += "<h3>Chunk offsets</h3>\n" + offsets.html("tables");
    return html + "<h3>Atoms</h3>\n" + atomsTable(movie, isCompared);
}
