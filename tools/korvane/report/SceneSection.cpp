#include "Html.h"
#include "Sections.h"
#include "Timeline.h"

#include "../Markup.h"
#include "../TimeForms.h"
#include "../scene/SceneFile.h"

#include <korvane/time/KVTime.h>

#include <algorithm>
#include <map>

namespace {

using scene::describe;
using scene::isSet;
using scene::Node;

constexpr std::size_t mostElements = 3000; ///< in the tree
constexpr std::size_t deepest = 40;        ///< level of the tree
constexpr std::size_t mostSequences = 8;

scene::Value const& valueOf(Node const& node, std::string_view attribute)
{
    auto const& attributes = node.info().attributes;
    auto const found = std::ranges::find_if(
        attributes, [&](scene::AttributeInfo const& info) { return info.name == attribute; });
    return node.attribute(found == attributes.end() ? 0 : found->token);
}

template <class T>
T const* get(Node const& node, std::string_view attribute)
{
    return std::get_if<T>(&valueOf(node, attribute));
}

std::string nameOf(Node const& node)
{
    auto const* const name = get<KVString>(node, "name");
    return name ? name->toUTF8() : std::string();
}

// --- The tree ---

std::string lineHtml(Node const& node)
{
    std::string html = "<i>" + escaped(node.info().name) + "</i>";
    for (scene::AttributeInfo const& attribute : node.info().attributes) {
        scene::Value const& value = node.attribute(attribute.token);
        if (!isSet(value))
            continue;
        if (std::string_view(attribute.name) == "name")
            html += " <b>" + shownText(nameOf(node)) + "</b>";
        else
            html += " <i>" + escaped(attribute.name) + "</i> " + shownText(describe(value));
    }
    if (isSet(node.content()))
        html += " " + shownText(describe(node.content()));
    return html;
}

/// Nested <details>; what stands in a clip is closed at first.
class TreeWriter {
public:
    void enter(Node const& node, std::size_t depth)
    {
        if (depth == 0)
            return;
        if (depth > deepest)
            ++inside_;
        else if (count_ >= mostElements)
            ++leftOut_;
        else
            open(node, depth);
    }

    void leave(Node const& node, std::size_t depth)
    {
        if (depth == deepest && inside_ > 0) {
            html_ += "<li class=\"leaf\">and " + grouped(inside_) + " more elements inside</li>\n";
            inside_ = 0;
        }
        if (depth == 0 || depth >= open_.size() || !open_[depth])
            return;
        html_ += node.children().empty() ? "" : "</ul></details></li>\n";
        open_[depth] = false;
    }

    std::string html() const
    {
        return "<div class=\"tree\"><ul>\n" + html_ + "</ul></div>\n" +
               (leftOut_ > 0 ? note("and " + grouped(leftOut_) + " more elements") : "");
    }

private:
    void open(Node const& node, std::size_t depth)
    {
        ++count_;
        open_.resize(std::max(open_.size(), depth + 1));
        open_[depth] = true;
        if (node.children().empty()) {
            html_ += "<li class=\"leaf\">" + lineHtml(node) + "</li>\n";
            return;
        }
        unsigned int const element = node.info().element;
        bool const isOpen =
            element == scene::kProject || element == scene::kSequence || element == scene::kGroup;
        html_ += std::string("<li><details") + (isOpen ? " open" : "") + "><summary>" +
                 lineHtml(node) + "</summary><ul>\n";
    }

    std::string html_;
    std::vector<bool> open_; ///< by depth, whether the node on the way there is written
    std::size_t count_ = 0;
    std::uint64_t leftOut_ = 0, inside_ = 0;
};

// --- The timelines ---

struct Clip {
    std::string name;
    int track = 0;
    CMTime start = kCMTimeInvalid, end = kCMTimeInvalid;
    std::optional<long long> frames;
    std::size_t group = 0; ///< which of the sequence's, 0 for none
};

struct Sequence {
    std::string name;
    CMTime frame = kCMTimeInvalid;
    std::vector<std::string> groups; ///< names of those that clips stand in
    std::vector<Clip> clips;
    std::vector<TimelinePoint> markers;
};

/// Gathers the clips of each sequence; those outside of any stand in one without a name.
class SequenceReader {
public:
    void enter(Node const& node, std::size_t depth)
    {
        path_.resize(depth);
        Place place = path_.empty() ? Place{} : path_.back();
        switch (node.info().element) {
        case scene::kSequence: {
            place = {sequences_.size() + 1, 0, kCMTimeZero};
            Sequence sequence;
            sequence.name = nameOf(node);
            if (auto const* const frame = get<CMTime>(node, "frame"))
                sequence.frame = *frame;
            sequences_.push_back(std::move(sequence));
            break;
        }
        case scene::kGroup: {
            auto& groups = at(place).groups;
            groups.push_back(nameOf(node));
            place.group = groups.size();
            break;
        }
        case scene::kClip:
            place.start = addClip(node, place);
            break;
        case scene::kMarker:
            addMarker(node, place);
            break;
        default:
            break;
        }
        path_.push_back(place);
    }

    std::vector<Sequence> take()
    {
        if (!outside_.clips.empty())
            sequences_.push_back(std::move(outside_));
        return std::move(sequences_);
    }

private:
    struct Place {
        std::size_t sequence = 0; ///< from 1; 0 outside of any
        std::size_t group = 0;
        CMTime start = kCMTimeZero; ///< of what markers count from
    };

    Sequence& at(Place const& place)
    {
        return place.sequence > 0 ? sequences_[place.sequence - 1] : outside_;
    }

    CMTime addClip(Node const& node, Place const& place)
    {
        Sequence& sequence = at(place);
        Clip clip;
        clip.name = nameOf(node);
        clip.group = place.group;
        if (int const* const track = get<int>(node, "track"))
            clip.track = *track;
        if (auto const* const start = get<CMTime>(node, "start"))
            clip.start = *start;
        for (auto const& child : node.children())
            if (child->info().element == scene::kLength)
                if (auto const* const frames = std::get_if<long long>(&child->content()))
                    clip.frames = *frames;
        clip.end = clip.start;
        if (clip.frames && CMTimeIsNumeric(sequence.frame))
            clip.end = CMTimeAdd(clip.start, CMTimeMultiply(sequence.frame, *clip.frames));
        CMTime const start = clip.start;
        sequence.clips.push_back(std::move(clip));
        return start;
    }

    void addMarker(Node const& node, Place const& place)
    {
        auto const* const time = get<CMTime>(node, "time");
        if (!time)
            return;
        CMTime const at = CMTimeAdd(place.start, *time);
        auto const* const label = std::get_if<KVString>(&node.content());
        if (CMTimeIsNumeric(at))
            this->at(place).markers.push_back(
                {CMTimeGetSeconds(at), label ? clipped(label->toUTF8(), 40) : std::string()});
    }

    std::vector<Place> path_;
    std::vector<Sequence> sequences_;
    Sequence outside_;
};

/// "96096/24000 s", with "about" before what could not be kept exactly.
std::string exactText(CMTime const& time)
{
    std::string const text = timeFraction(time);
    if (!CMTimeIsNumeric(time))
        return text;
    return (CMTimeIsRounded(time) ? "about " : "") + text + " s";
}

std::string clockOf(CMTime const& time)
{
    return CMTimeIsNumeric(time) ? timecodeText(CMTimeGetSeconds(time)) : std::string();
}

std::string sequenceHtml(Sequence const& sequence, std::string const& id)
{
    std::map<int, TimelineTrack> tracks;
    Table table("Clips", {{"Clip"},
                          {"Track", true},
                          {"Start", true},
                          {"Exact start", true},
                          {"End", true},
                          {"Exact end", true},
                          {"Frames", true}});
    std::uint64_t withoutTime = 0;
    std::vector<bool> groupIsUsed(sequence.groups.size() + 1);
    for (Clip const& clip : sequence.clips) {
        std::string const frames = clip.frames ? std::to_string(*clip.frames) : "";
        if (table.isFull())
            table.skip(1);
        else
            table.row({shownText(clip.name), std::to_string(clip.track), clockOf(clip.start),
                       exactText(clip.start), clockOf(clip.end), exactText(clip.end), frames});
        if (!CMTimeIsNumeric(clip.start) || !CMTimeIsNumeric(clip.end)) {
            ++withoutTime;
            continue;
        }
        TimelineTrack& track = tracks[clip.track];
        track.label = "track " + std::to_string(clip.track);
        std::string const name = clipped(clip.name, 60);
        double const start = CMTimeGetSeconds(clip.start);
        groupIsUsed[clip.group] = true;
        track.items.push_back({start, std::max(start, CMTimeGetSeconds(clip.end)), name,
                               frames.empty() ? "" : frames + " frames",
                               name + ": " + clockOf(clip.start) + " to " + clockOf(clip.end) +
                                   ", exactly " + exactText(clip.start) + " to " +
                                   exactText(clip.end),
                               clip.group});
    }
    Timeline timeline;
    // The highest track lies on top of the others.
    for (auto track = tracks.rbegin(); track != tracks.rend(); ++track)
        timeline.tracks.push_back(std::move(track->second));
    timeline.points = sequence.markers;

    std::vector<LegendEntry> entries;
    for (std::size_t group = 1; group < groupIsUsed.size() && entries.size() < 12; ++group)
        if (groupIsUsed[group])
            entries.push_back({"c" + std::to_string(group % timelineHues),
                               sequence.groups[group - 1].empty() ? "group without a name"
                                                                  : sequence.groups[group - 1]});
    if (!sequence.markers.empty())
        entries.push_back({"point", "marker"});

    std::string html =
        legend(entries) + timelineHtml(std::move(timeline), id,
                                       "Clips of " + clipped(sequence.name, 60) + " over time");
    if (withoutTime > 0)
        html += note(counted(withoutTime, "clip") + " without a start is not drawn");
    if (!CMTimeIsNumeric(sequence.frame))
        html += note("Lengths count frames, and no frame's length is told here: clips are drawn at "
                     "their start alone.");
    return html + table.html("clips");
}

} // namespace

std::string sceneHtml(ReopenableFile const& file, std::string const& id)
{
    auto const document = std::make_unique<scene::Document>();
    scene::load(file.path(), *document);
    TreeWriter tree;
    SequenceReader reader;
    std::uint64_t elements = 0;
    walk(
        document->root,
        [&](Node const& node, std::size_t depth) {
            elements += depth > 0;
            tree.enter(node, depth);
            reader.enter(node, depth);
        },
        [&](Node const& node, std::size_t depth) { tree.leave(node, depth); });
    std::vector<Sequence> const sequences = reader.take();

    std::uint64_t clips = 0;
    for (Sequence const& sequence : sequences)
        clips += sequence.clips.size();
    Facts facts;
    facts.add("Form", nameOf(document->form))
        .add("Size", bytesText(document->bytes))
        .add("Elements", grouped(elements))
        .add("Clips", grouped(clips))
        .add("Hash", hashOf(document->root).getString().toUTF8());
    std::string html = facts.html();
    for (std::size_t i = 0; i < std::min(sequences.size(), mostSequences); ++i) {
        Sequence const& sequence = sequences[i];
        html += "<h3>Sequence " + shownText(sequence.name);
        if (CMTimeIsNumeric(sequence.frame))
            html += ", frames of " + exactText(sequence.frame);
        html += "</h3>\n" + sequenceHtml(sequence, id + "-sequence" + std::to_string(i));
    }
    if (sequences.size() > mostSequences)
        html += note("and " + grouped(sequences.size() - mostSequences) + " more sequences");
    return html + "<h3>Tree</h3>\n" + tree.html();
}
