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
    std::int64_t start, end;
    bool isEmpty;

    /// Ranges at an infinity end where they start: not empty, but no range overlaps them.
    bool meetsOthers() const noexcept { return !isEmpty && start < end; }
};

/// The timescale on which all times are whole, and the ranges in its ticks.
class CommonTimescale {
public:
    /// Appends the ranges, a null element as an empty one. False if there is no such timescale.
    bool take(VexTimeRangeArray const& array, std::vector<CMTimeRange>& ranges)
    {
        ranges.reserve(ranges.size() + array.size());
        for (VexTimeRangeObj const* range : array) {
            ranges.push_back(range ? range->range() : kCMTimeRangeZero);
            if (!take(ranges.back().start) || !take(ranges.back().duration))
                return false;
        }
        return true;
    }

    /// False if the range does not fit.
    bool spanOf(CMTimeRange const& range, Span* span) noexcept
    {
        std::int64_t duration;
        if (!ticksOf(range.start, &span->start) || !ticksOf(range.duration, &duration) ||
            duration < 0)
            return false;
        span->isEmpty = duration == 0;
        span->end = duration == forever                               ? forever
                    : span->start == before || span->start == forever ? span->start
                                                                      : span->start + duration;
        return true;
    }

    std::int64_t ticksOf(std::int64_t seconds) const noexcept { return seconds * timescale_; }

private:
    static bool isInfinity(CMTime const& time, std::int64_t* ticks) noexcept
    {
        *ticks = CMTimeCompare(time, kCMTimeNegativeInfinity) == 0 ? before : forever;
        return *ticks == before || CMTimeCompare(time, kCMTimePositiveInfinity) == 0;
    }

    bool take(CMTime const& time) noexcept
    {
        std::int64_t ticks;
        if (!CMTimeIsNumeric(time))
            return isInfinity(time, &ticks);
        if (time.timescale < 1 || time.epoch != 0)
            return false;
        if (time.timescale != latest_ && timescale_ % time.timescale != 0)
            timescale_ = std::lcm(timescale_, std::int64_t{time.timescale});
        latest_ = time.timescale;
        return timescale_ <= INT32_MAX;
    }

    bool ticksOf(CMTime const& time, std::int64_t* ticks) noexcept
    {
        if (!CMTimeIsNumeric(time))
            return isInfinity(time, ticks);
        if (time.timescale != latest_ || factor_ == 0) {
            latest_ = time.timescale;
            factor_ = timescale_ / latest_;
        }
        return !__builtin_mul_overflow(time.value, factor_, ticks) && *ticks >= -greatestTicks &&
               *ticks <= greatestTicks;
    }

    std::int64_t timescale_ = 1;
    // Neighbours mostly have one timescale.
    std::int64_t latest_ = 1, factor_ = 0;
};

using Index = std::uint32_t;
constexpr std::size_t greatestCount = UINT32_MAX;

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

bool kv::addBySweep(VexTimeRangeArray& array, VexTimeRangeArray const& added, bool keepObjectsApart)
{
    CommonTimescale scale;
    std::vector<CMTimeRange> ranges; // those of the array, and then those that are added
    if (array.size() + added.size() > greatestCount || !scale.take(array, ranges) ||
        !scale.take(added, ranges))
        return false;

    auto const objectAt = [&](std::size_t id) -> VexTimeRangeObj* {
        return id < array.size() ? array[id] : added[id - array.size()];
    };
    constexpr Index none = UINT32_MAX, dropped = none - 1;
    std::vector<Index> stopOf(ranges.size(), none);
    std::vector<Stop> stops;
    stops.reserve(ranges.size());
    Groups groups;
    for (std::size_t id = 0; id < ranges.size(); ++id) {
        Span span;
        if (!scale.spanOf(ranges[id], &span))
            return false;
        if (span.meetsOthers())
            stops.push_back({span.start, span.end,
                             keepObjectsApart ? groups.of(objectOf(objectAt(id))) : 0,
                             static_cast<Index>(id)});
        else if (span.isEmpty && id >= array.size())
            stopOf[id] = dropped;
    }
    std::sort(stops.begin(), stops.end());

    Joined joined(stops);
    joinOverlapping(stops, array.size(), joined);
    for (Index i = 0; i < stops.size(); ++i)
        stopOf[stops[i].id] = i;

    VexTimeRangeArray result;
    result.reserve(array.size());
    for (std::size_t id = 0; id < ranges.size(); ++id) {
        if (stopOf[id] == dropped)
            continue;
        Index const root = stopOf[id] == none ? none : joined.rootOf(stopOf[id]);
        if (root != none && joined.leader(root) != id)
            continue;
        if (root != none && !joined.isAlone(root))
            result.push_back(objectAt(id)->copyWithRange(
                KV_CMTimeRangeUnion(ranges[stops[root].id], ranges[stops[joined.last(root)].id])));
        else if (id < array.size())
            result.push_back(std::move(array[id]));
        else
            result.push_back(added[id - array.size()]);
    }
    array = std::move(result);
    return true;
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

bool kv::subtractBySweep(VexTimeRangeArray& array, VexTimeRangeArray const& subtracted)
{
    CommonTimescale scale;
    std::vector<CMTimeRange> ranges, cuts;
    if (subtracted.size() > greatestCount || !scale.take(array, ranges) ||
        !scale.take(subtracted, cuts))
        return false;

    std::vector<Hole> each; // in the order in which they are given
    each.reserve(cuts.size());
    for (Index i = 0; i < cuts.size(); ++i) {
        Span span;
        if (!scale.spanOf(cuts[i], &span))
            return false;
        if (span.meetsOthers())
            each.push_back({span.start, span.end, i, i});
    }
    std::vector<Span> spans(ranges.size());
    for (std::size_t i = 0; i < ranges.size(); ++i)
        if (!scale.spanOf(ranges[i], &spans[i]))
            return false;
    std::vector<Hole> const holes = joinedHoles(each);

    VexTimeRangeArray result;
    result.reserve(array.size());
    for (std::size_t i = 0; i < array.size(); ++i) {
        std::int64_t start = spans[i].start, end = spans[i].end;
        auto hole = std::upper_bound(holes.begin(), holes.end(), start,
                                     [](std::int64_t at, Hole const& h) { return at < h.end; });
        if (!spans[i].meetsOthers() || hole == holes.end() || hole->start >= end) {
            result.push_back(std::move(array[i]));
            continue;
        }

        CMTime pieceStart = ranges[i].start;
        if (start == before) {
            // The first that cuts into an open start leaves one year of it.
            auto const first = std::find_if(each.begin(), each.end(),
                                            [&](Hole const& cut) { return cut.start < end; });
            if (first->start != before) {
                start = first->start - scale.ticksOf(kKV_CMTimeOneYear.value);
                pieceStart = CMTimeSubtract(cuts[first->opens].start, kKV_CMTimeOneYear);
                while (hole->end <= start)
                    ++hole;
            }
        }
        auto const emit = [&](CMTime const& pieceEnd) {
            result.push_back(
                array[i]->copyWithRange(KV_CMTimeRangeMakeWithStartEnd(pieceStart, pieceEnd)));
        };
        for (; hole != holes.end() && hole->start < end; ++hole) {
            if (hole->start > start)
                emit(cuts[hole->opens].start);
            pieceStart = KV_CMTimeRangeEnd(cuts[hole->closes]);
            start = hole->end;
        }
        if (start < end)
            emit(KV_CMTimeRangeEnd(ranges[i]));
    }
    array = std::move(result);
    return true;
}
