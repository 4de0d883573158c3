#include <korvane/time/VexTimeRangeSweep_p.h>

#include <korvane/time/VexTimeRangeAndObject.h>

#include <algorithm>
#include <numeric>
#include <optional>
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
    /// False if there is none.
    bool take(VexTimeRangeArray const& ranges) noexcept
    {
        return std::all_of(ranges.begin(), ranges.end(), [&](VexTimeRangeObj const* range) {
            return !range || (take(range->start()) && take(range->duration()));
        });
    }

    /// One span for each range. False if one does not fit.
    bool appendSpans(VexTimeRangeArray const& ranges, std::vector<Span>& spans) const
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
        if (timescale_ % time.timescale != 0)
            timescale_ = std::lcm(timescale_, std::int64_t{time.timescale});
        return timescale_ <= INT32_MAX;
    }

    bool ticksOf(CMTime const& time, std::int64_t* ticks) const noexcept
    {
        if (!CMTimeIsNumeric(time))
            return isInfinity(time, ticks);
        return !__builtin_mul_overflow(time.value, timescale_ / time.timescale, ticks) &&
               *ticks >= -greatestTicks && *ticks <= greatestTicks;
    }

    std::int64_t timescale_ = 1;
};

// --- Add ---

/// Ranges that have been joined, as trees whose root is the member with the lowest number.
class Joined {
public:
    explicit Joined(std::vector<Span> const& spans) : spans_(spans), members_(spans.size())
    {
        for (std::size_t id = 0; id < members_.size(); ++id)
            members_[id] = {id, id, id};
    }

    void join(std::size_t a, std::size_t b) noexcept
    {
        a = rootOf(a);
        b = rootOf(b);
        if (a == b)
            return;
        Member &root = members_[std::min(a, b)], &child = members_[std::max(a, b)];
        child.parent = root.parent;
        root.isParent = true;
        if (spans_[child.first].start < spans_[root.first].start)
            root.first = child.first;
        if (spans_[child.last].end > spans_[root.last].end)
            root.last = child.last;
    }

    bool isRoot(std::size_t id) const noexcept { return members_[id].parent == id; }
    bool isAlone(std::size_t root) const noexcept { return !members_[root].isParent; }
    /// The members of a root's tree that start first and end last.
    std::size_t first(std::size_t root) const noexcept { return members_[root].first; }
    std::size_t last(std::size_t root) const noexcept { return members_[root].last; }

private:
    struct Member {
        std::size_t parent, first, last;
        bool isParent = false;
    };

    std::size_t rootOf(std::size_t id) noexcept
    {
        while (!isRoot(id)) {
            members_[id].parent = members_[members_[id].parent].parent;
            id = members_[id].parent;
        }
        return id;
    }

    std::vector<Span> const& spans_;
    std::vector<Member> members_;
};

/// What the sweep comes to next.
struct Stop {
    std::size_t group; // ranges of different groups do not meet
    std::int64_t start, end;
    std::size_t id;

    friend bool operator<(Stop const& a, Stop const& b) noexcept
    {
        return a.group != b.group ? a.group < b.group : a.start < b.start;
    }
};

/// Joins each range that is added to all that it overlaps. Ranges that are there already, those
/// with numbers below `addedFrom`, are not joined to each other by themselves.
void joinOverlapping(std::vector<Stop> const& stops, std::size_t addedFrom, Joined& joined)
{
    struct Open {
        std::size_t id;
        std::int64_t end;
    };
    std::vector<Open> there; // those that are there and have begun
    Open added{0, before};   // of those that are added and have begun, the end of the last
    std::size_t group = 0;
    for (Stop const& stop : stops) {
        if (stop.group != group) {
            there.clear();
            added.end = before;
            group = stop.group;
        }
        if (stop.start < added.end)
            joined.join(stop.id, added.id);
        if (stop.id < addedFrom) {
            there.push_back({stop.id, stop.end});
            continue;
        }
        Open reached{stop.id, before}; // what it overlaps is one range from here on
        for (Open const& open : there)
            if (stop.start < open.end) {
                joined.join(stop.id, open.id);
                reached.end = std::max(reached.end, open.end);
            }
        there.clear();
        if (stop.start < reached.end)
            there.push_back(reached);
        added = {stop.id, std::max(added.end, stop.end)};
    }
}

/// Numbers objects, equal ones alike.
class Groups {
public:
    std::size_t of(NSObject const* object)
    {
        auto& same = byHash_[CFHash(object)];
        for (auto const& [known, group] : same)
            if (CFEqual(known, object))
                return group;
        same.emplace_back(object, count_);
        return count_++;
    }

private:
    std::unordered_map<std::size_t, std::vector<std::pair<NSObject const*, std::size_t>>> byHash_;
    std::size_t count_ = 0;
};

} // namespace

NSObject const* kv::objectOf(VexTimeRangeObj const* range) noexcept
{
    auto const* owner = dynamic_cast<VexTimeRangeAndObject const*>(range);
    return owner ? owner->object() : nullptr;
}

bool kv::addBySweep(VexTimeRangeArray& array, VexTimeRangeArray const& ranges,
                    bool keepObjectsApart)
{
    CommonTimescale scale;
    std::vector<Span> spans;
    spans.reserve(array.size() + ranges.size());
    if (!scale.take(array) || !scale.take(ranges) || !scale.appendSpans(array, spans) ||
        !scale.appendSpans(ranges, spans))
        return false;

    auto const rangeOf = [&](std::size_t id) -> KVNSRef<VexTimeRangeObj*> const& {
        return id < array.size() ? array[id] : ranges[id - array.size()];
    };
    Groups groups;
    std::vector<Stop> stops;
    stops.reserve(spans.size());
    for (std::size_t id = 0; id < spans.size(); ++id)
        if (spans[id].meetsOthers())
            stops.push_back({keepObjectsApart ? groups.of(objectOf(rangeOf(id))) : 0,
                             spans[id].start, spans[id].end, id});
    std::sort(stops.begin(), stops.end());

    Joined joined(spans);
    joinOverlapping(stops, array.size(), joined);

    VexTimeRangeArray result;
    for (std::size_t id = 0; id < spans.size(); ++id) {
        if (!joined.isRoot(id) || (id >= array.size() && spans[id].isEmpty))
            continue;
        if (joined.isAlone(id))
            result.push_back(rangeOf(id));
        else
            result.push_back(rangeOf(id)->copyWithRange(KV_CMTimeRangeUnion(
                rangeOf(joined.first(id))->range(), rangeOf(joined.last(id))->range())));
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
    std::size_t opens, closes;
};

std::vector<Hole> holesOf(std::vector<Span> const& spans)
{
    std::vector<Hole> each, holes;
    for (std::size_t i = 0; i < spans.size(); ++i)
        if (spans[i].meetsOthers())
            each.push_back({spans[i].start, spans[i].end, i, i});
    std::sort(each.begin(), each.end(),
              [](Hole const& a, Hole const& b) { return a.start < b.start; });
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

bool kv::subtractBySweep(VexTimeRangeArray& array, VexTimeRangeArray const& ranges)
{
    CommonTimescale scale;
    std::vector<Span> spans, cuts;
    if (!scale.take(array) || !scale.take(ranges) || !scale.appendSpans(array, spans) ||
        !scale.appendSpans(ranges, cuts))
        return false;

    std::vector<Hole> const holes = holesOf(cuts);
    VexTimeRangeArray result;
    result.reserve(array.size());
    for (std::size_t i = 0; i < array.size(); ++i) {
        auto [start, end, isEmpty] = spans[i];
        auto hole = std::upper_bound(holes.begin(), holes.end(), start,
                                     [](std::int64_t at, Hole const& h) { return at < h.end; });
        if (!spans[i].meetsOthers() || hole == holes.end() || hole->start >= end) {
            result.push_back(array[i]);
            continue;
        }

        CMTime pieceStart = array[i]->start();
        if (start == before) {
            // The first range that cuts into an open start leaves one year of it.
            auto const first = std::find_if(cuts.begin(), cuts.end(), [&](Span const& cut) {
                return cut.meetsOthers() && cut.start < end;
            });
            if (first->start != before) {
                start = first->start - scale.ticksOf(kKV_CMTimeOneYear.value);
                pieceStart =
                    CMTimeSubtract(ranges[static_cast<std::size_t>(first - cuts.begin())]->start(),
                                   kKV_CMTimeOneYear);
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
                emit(ranges[hole->opens]->start());
            pieceStart = ranges[hole->closes]->end();
            start = hole->end;
        }
        if (start < end)
            emit(array[i]->end());
    }
    array = std::move(result);
    return true;
}
