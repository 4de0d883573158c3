#include <korvane/time/VexTimeRangeSweep_p.h>

#include <korvane/time/VexTimeRangeAndObject.h>

#include <algorithm>
#include <numeric>
#include <unordered_map>

namespace {

constexpr std::int64_t before = INT64_MIN, forever = INT64_MAX; // the infinities
constexpr std::int64_t greatestTicks = std::int64_t{1} << 61;

/// A range in ticks of the common timescale.
struct Span {
    std::int64_t start = 0, end = 0;
    bool isEmpty = true;

    /// Ranges at an infinity end where they start: not empty, but no range overlaps them.
    bool meetsOthers() const noexcept { return !isEmpty && start < end; }
};

/// The timescale on which all times are whole.
class CommonTimescale {
public:
    /// The ranges of both arrays in its ticks, null ones as empty. False if there is no such
    /// timescale or one does not fit.
    bool read(VexTimeRangeArray const& a, VexTimeRangeArray const& b, std::vector<Span>& spans)
    {
        spans.reserve(a.size() + b.size());
        // Once mostly, and again where a later range has made the timescale longer.
        do {
            hasGrown_ = false;
            spans.clear();
            if (!append(a, spans) || !append(b, spans))
                return false;
        } while (hasGrown_);
        return true;
    }

    /// Whether all times are unrounded numbers that have this timescale already, so that ranges can
    /// be made from ticks alone.
    bool isPlain() const noexcept { return isPlain_; }
    CMTimeRange rangeOf(std::int64_t start, std::int64_t end) const noexcept
    {
        auto const timescale = static_cast<CMTimeScale>(timescale_);
        return {CMTimeMake(start, timescale), CMTimeMake(end - start, timescale)};
    }

    std::int64_t ticksOf(std::int64_t seconds) const noexcept { return seconds * timescale_; }

private:
    bool append(VexTimeRangeArray const& ranges, std::vector<Span>& spans)
    {
        for (VexTimeRangeObj const* range : ranges) {
            Span& span = spans.emplace_back();
            std::int64_t duration;
            if (!range)
                continue;
            if (!ticksOf(range->start(), &span.start) || !ticksOf(range->duration(), &duration) ||
                duration < 0)
                return false;
            span.isEmpty = duration == 0;
            span.end = duration == forever                             ? forever
                       : span.start == before || span.start == forever ? span.start
                                                                       : span.start + duration;
        }
        return true;
    }

    bool ticksOf(CMTime const& time, std::int64_t* ticks) noexcept
    {
        if (time.flags != kCMTimeFlags_Valid)
            isPlain_ = false;
        if (!CMTimeIsNumeric(time)) {
            *ticks = CMTimeCompare(time, kCMTimeNegativeInfinity) == 0 ? before : forever;
            return *ticks == before || CMTimeCompare(time, kCMTimePositiveInfinity) == 0;
        }
        if (time.timescale != latest_ && !change(time.timescale))
            return false;
        return time.epoch == 0 && !__builtin_mul_overflow(time.value, factor_, ticks) &&
               *ticks >= -greatestTicks && *ticks <= greatestTicks;
    }

    /// Makes another timescale the one of `latest_` and `factor_`.
    bool change(CMTimeScale timescale) noexcept
    {
        if (timescale < 1)
            return false;
        isPlain_ = isPlain_ && latest_ == 0;
        hasGrown_ = hasGrown_ || (latest_ != 0 && timescale_ % timescale != 0);
        timescale_ = std::lcm(timescale_, std::int64_t{timescale});
        latest_ = timescale;
        factor_ = timescale_ / timescale;
        return timescale_ <= INT32_MAX;
    }

    std::int64_t timescale_ = 1;
    bool hasGrown_ = false, isPlain_ = true;
    CMTimeScale latest_ = 0; // neighbours mostly have one timescale
    std::int64_t factor_ = 0;
};

using Index = std::uint32_t;
constexpr std::size_t greatestCount = UINT32_MAX - 2;

// --- Add ---

/// What the sweep comes to next: a range, by its number.
struct Stop {
    std::int64_t start, end;
    Index group; // ranges of different groups do not meet
    Index id;

    friend bool operator<(Stop const& a, Stop const& b) noexcept
    {
        return a.group != b.group ? a.group < b.group : a.start < b.start;
    }
};

/// Ranges that have been joined, as trees of stops whose root is the one that starts first.
class Joined {
public:
    explicit Joined(std::vector<Stop> const& stops) : stops_(stops), nodes_(stops.size())
    {
        for (Index i = 0; i < nodes_.size(); ++i)
            nodes_[i] = {i, i, stops[i].id, 1};
    }

    void join(Index a, Index b) noexcept
    {
        a = rootOf(a);
        b = rootOf(b);
        if (a == b)
            return;
        Node &root = nodes_[std::min(a, b)], &child = nodes_[std::max(a, b)];
        child.parent = root.parent;
        if (stops_[child.last].end > stops_[root.last].end)
            root.last = child.last;
        root.leader = std::min(root.leader, child.leader);
        root.size += child.size;
    }

    Index rootOf(Index stop) noexcept
    {
        while (nodes_[stop].parent != stop) {
            nodes_[stop].parent = nodes_[nodes_[stop].parent].parent;
            stop = nodes_[stop].parent;
        }
        return stop;
    }
    bool isAlone(Index root) const noexcept { return nodes_[root].size == 1; }
    /// The stop that ends last.
    Index last(Index root) const noexcept { return nodes_[root].last; }
    /// The lowest number of a range.
    Index leader(Index root) const noexcept { return nodes_[root].leader; }

private:
    struct Node {
        Index parent, last, leader, size;
    };

    std::vector<Stop> const& stops_;
    std::vector<Node> nodes_;
};

/// Joins each range that is added to all that it overlaps. Ranges that are there already, those
/// with numbers below `addedFrom`, are not joined to each other by themselves.
void joinOverlapping(std::vector<Stop> const& stops, std::size_t addedFrom, Joined& joined)
{
    struct Open {
        Index stop;
        std::int64_t end;
    };
    std::vector<Open> there; // those that are there and have begun
    Open added{0, before};   // of those that are added and have begun, the end of the last
    Index group = 0;
    for (Index i = 0; i < stops.size(); ++i) {
        Stop const& stop = stops[i];
        if (stop.group != group) {
            there.clear();
            added.end = before;
            group = stop.group;
        }
        if (stop.start < added.end)
            joined.join(i, added.stop);
        if (stop.id < addedFrom) {
            there.push_back({i, stop.end});
            continue;
        }
        Open reached{i, before}; // what it overlaps is one range from here on
        for (Open const& open : there)
            if (stop.start < open.end) {
                joined.join(i, open.stop);
                reached.end = std::max(reached.end, open.end);
            }
        there.clear();
        if (stop.start < reached.end)
            there.push_back(reached);
        added = {i, std::max(added.end, stop.end)};
    }
}

/// Numbers objects, equal ones alike.
class Groups {
public:
    Index of(NSObject const* object)
    {
        auto& same = byHash_[CFHash(object)];
        for (auto const& [known, group] : same)
            if (CFEqual(known, object))
                return group;
        same.emplace_back(object, count_);
        return count_++;
    }

private:
    std::unordered_map<std::size_t, std::vector<std::pair<NSObject const*, Index>>> byHash_;
    Index count_ = 0;
};

} // namespace

NSObject const* kv::objectOf(VexTimeRangeObj const* range) noexcept
{
    auto const* owner = dynamic_cast<VexTimeRangeAndObject const*>(range);
    return owner ? owner->object() : nullptr;
}

std::optional<VexTimeRangeArray> kv::addBySweep(VexTimeRangeArray const& array,
                                                VexTimeRangeArray const& added,
                                                bool keepObjectsApart)
{
    std::size_t const count = array.size() + added.size();
    CommonTimescale scale;
    std::vector<Span> spans;
    if (count > greatestCount || !scale.read(array, added, spans))
        return std::nullopt;

    // Ranges have numbers, those that are added behind the others.
    auto const rangeAt = [&](std::size_t id) -> KVNSRef<VexTimeRangeObj*> const& {
        return id < array.size() ? array[id] : added[id - array.size()];
    };
    // What becomes of a range: it stays, goes, or is replaced by the union of that number.
    constexpr Index stays = UINT32_MAX, goes = stays - 1;
    std::vector<Index> fates(count, stays);
    std::vector<Stop> stops;
    stops.reserve(count);
    Groups groups;
    for (std::size_t id = 0; id < count; ++id) {
        Span const& span = spans[id];
        if (span.meetsOthers())
            stops.push_back({span.start, span.end,
                             keepObjectsApart ? groups.of(objectOf(rangeAt(id))) : 0,
                             static_cast<Index>(id)});
        else if (span.isEmpty && id >= array.size())
            fates[id] = goes;
    }
    std::sort(stops.begin(), stops.end());

    Joined joined(stops);
    joinOverlapping(stops, array.size(), joined);
    std::vector<CMTimeRange> unions;
    for (Index i = 0; i < stops.size(); ++i) {
        Index const root = joined.rootOf(i), id = stops[i].id;
        if (joined.isAlone(root))
            continue;
        if (id == joined.leader(root)) {
            fates[id] = static_cast<Index>(unions.size());
            Stop const &first = stops[root], &last = stops[joined.last(root)];
            unions.push_back(scale.isPlain() ? scale.rangeOf(first.start, last.end)
                                             : KV_CMTimeRangeUnion(rangeAt(first.id)->range(),
                                                                   rangeAt(last.id)->range()));
        } else {
            fates[id] = goes;
        }
    }

    VexTimeRangeArray result;
    result.reserve(count - static_cast<std::size_t>(std::count(fates.begin(), fates.end(), goes)));
    for (std::size_t id = 0; id < count; ++id) {
        if (fates[id] == goes)
            continue;
        if (fates[id] != stays)
            result.push_back(rangeAt(id)->copyWithRange(unions[fates[id]]));
        else
            result.push_back(rangeAt(id));
    }
    return result;
}

// --- Subtract ---

namespace {

/// Ranges that overlap or touch, as one. `opens` and `closes` tell which range starts and which
/// ends it.
struct Hole {
    std::int64_t start, end;
    Index opens, closes;
};

std::vector<Hole> joinedHoles(std::vector<Hole> each)
{
    std::sort(each.begin(), each.end(),
              [](Hole const& a, Hole const& b) { return a.start < b.start; });
    std::vector<Hole> holes;
    for (Hole const& next : each) {
        if (holes.empty() || holes.back().end < next.start) {
            holes.push_back(next);
        } else if (holes.back().end < next.end) {
            holes.back().end = next.end;
            holes.back().closes = next.closes;
        }
    }
    return holes;
}

} // namespace

std::optional<VexTimeRangeArray> kv::subtractBySweep(VexTimeRangeArray const& array,
                                                     VexTimeRangeArray const& subtracted)
{
    CommonTimescale scale;
    std::vector<Span> spans;
    if (subtracted.size() > greatestCount || !scale.read(array, subtracted, spans))
        return std::nullopt;

    std::vector<Hole> each; // in the order in which they are given
    each.reserve(subtracted.size());
    for (Index i = 0; i < subtracted.size(); ++i)
        if (Span const& span = spans[array.size() + i]; span.meetsOthers())
            each.push_back({span.start, span.end, i, i});
    std::vector<Hole> const holes = joinedHoles(each);
    // Searched for every element: close together, so that they stay near the processor.
    std::vector<std::int64_t> ends(holes.size());
    std::transform(holes.begin(), holes.end(), ends.begin(), [](Hole const& h) { return h.end; });

    VexTimeRangeArray result;
    result.reserve(array.size());
    for (std::size_t i = 0; i < array.size(); ++i) {
        std::int64_t start = spans[i].start, end = spans[i].end;
        auto hole =
            holes.begin() + (std::upper_bound(ends.begin(), ends.end(), start) - ends.begin());
        if (!spans[i].meetsOthers() || hole == holes.end() || hole->start >= end) {
            result.push_back(array[i]);
            continue;
        }

        VexTimeRangeObj const* const range = array[i];
        CMTime pieceStart = range->start();
        if (start == before) {
            // The first that cuts into an open start leaves one year of it.
            auto const first = std::find_if(each.begin(), each.end(),
                                            [&](Hole const& cut) { return cut.start < end; });
            if (first->start != before) {
                start = first->start - scale.ticksOf(kKV_CMTimeOneYear.value);
                pieceStart = CMTimeSubtract(subtracted[first->opens]->start(), kKV_CMTimeOneYear);
                while (hole->end <= start)
                    ++hole;
            }
        }
        auto const emit = [&](std::int64_t to, auto pieceEnd) {
            result.push_back(range->copyWithRange(
                scale.isPlain() ? scale.rangeOf(start, to)
                                : KV_CMTimeRangeMakeWithStartEnd(pieceStart, pieceEnd())));
        };
        for (; hole != holes.end() && hole->start < end; ++hole) {
            if (hole->start > start)
                emit(hole->start, [&] { return subtracted[hole->opens]->start(); });
            start = hole->end;
            if (!scale.isPlain())
                pieceStart = subtracted[hole->closes]->end();
        }
        if (start < end)
            emit(end, [&] { return range->end(); });
    }
    return result;
}
