#include "time/TimeTesting.h"

#include <korvane/platform/CFNumber.h>
#include <korvane/time/VexTimeRangeAndObject.h>
#include <korvane/time/VexTimeRanges.h>

#include <gmock/gmock.h>

#include <array>
#include <bitset>
#include <random>

using namespace timetest;
using testing::ElementsAre;
using Array = VexTimeRangeArray;

namespace {

Array array(std::vector<CMTimeRange> const& ranges)
{
    Array result;
    for (CMTimeRange const& range : ranges)
        result.push_back(KVMakeRef<VexTimeRangeObj>(range));
    return result;
}

std::vector<CMTimeRange> rangesOf(Array const& array)
{
    std::vector<CMTimeRange> result;
    for (VexTimeRangeObj const* range : array)
        result.push_back(range ? range->range() : kCMTimeRangeInvalid);
    return result;
}

// --- The definitions, as plain as they can be said ---

bool overlap(CMTimeRange const& a, CMTimeRange const& b)
{
    return CMTimeCompare(a.duration, kCMTimeZero) != 0 &&
           CMTimeCompare(b.duration, kCMTimeZero) != 0 &&
           CMTimeCompare(KV_CMTimeRangeEnd(a), b.start) > 0 &&
           CMTimeCompare(a.start, KV_CMTimeRangeEnd(b)) < 0;
}

bool overlap(VexTimeRangeObj const* a, VexTimeRangeObj const* b)
{
    return a && b && overlap(a->range(), b->range());
}

NSObject const* objectOf(VexTimeRangeObj const* range)
{
    auto const* owner = dynamic_cast<VexTimeRangeAndObject const*>(range);
    return owner ? owner->object() : nullptr;
}

Array plainAdd(Array array, Array const& ranges, bool keepObjectsApart)
{
    for (auto const& range : ranges) {
        if (!range || CMTimeCompare(range->duration(), kCMTimeZero) == 0)
            continue;
        Array next;
        CMTimeRange joined = range->range();
        std::ptrdiff_t place = -1;
        for (auto const& element : array) {
            if (!overlap(element, range) ||
                (keepObjectsApart && !CFEqual(objectOf(element), objectOf(range)))) {
                next.push_back(element);
                continue;
            }
            joined = KV_CMTimeRangeUnion(joined, element->range());
            if (place < 0) {
                place = static_cast<std::ptrdiff_t>(next.size());
                next.push_back(element);
            }
        }
        if (place < 0)
            next.push_back(range);
        else
            next[static_cast<std::size_t>(place)] =
                next[static_cast<std::size_t>(place)]->copyWithRange(joined);
        array = next;
    }
    return array;
}

Array plainSubtract(Array array, Array const& ranges)
{
    for (auto const& range : ranges) {
        Array next;
        for (auto const& element : array) {
            if (!overlap(element, range)) {
                next.push_back(element);
                continue;
            }
            CMTime const start = element->start(), end = element->end();
            if (CMTimeCompare(range->start(), start) > 0)
                next.push_back(
                    element->copyWithRange(KV_CMTimeRangeMakeWithStartEnd(start, range->start())));
            if (CMTimeCompare(range->end(), end) < 0)
                next.push_back(
                    element->copyWithRange(KV_CMTimeRangeMakeWithStartEnd(range->end(), end)));
        }
        array = next;
    }
    return array;
}

// --- Random sets ---

struct Source {
    char const* name;
    std::vector<std::int32_t> timescales;
    bool exactRecords;       // the results agree in every field, not only by value
    int infinities = 0;      // one in so many
    std::uint32_t flags = 1; // of numeric times
};

/// Objects keep their identity where the definition keeps it; new ones agree by value.
void expectSame(Array const& result, Array const& plain, Array const& sources, bool exactRecords)
{
    ASSERT_EQ(result.size(), plain.size());
    for (std::size_t i = 0; i < plain.size(); ++i) {
        bool const kept = std::count(sources.begin(), sources.end(), plain[i]) != 0;
        if (kept || !plain[i]) {
            EXPECT_EQ(result[i].get(), plain[i].get());
            continue;
        }
        EXPECT_TRUE(result[i]->isEqual(plain[i]))
            << text(result[i]->description()) << " is not " << text(plain[i]->description());
        if (exactRecords) {
            EXPECT_EQ(result[i]->range(), plain[i]->range());
        }
    }
}

class Sets {
public:
    explicit Sets(Source const& source) : source_(source) {}

    Array next(std::size_t most)
    {
        Array result;
        std::size_t const count = random(most + 1);
        for (std::size_t i = 0; i < count; ++i) {
            if (random(20) == 0) {
                result.push_back(nullptr);
                continue;
            }
            CMTimeRange range = {time(200), time(24)};
            if (source_.infinities && random(source_.infinities) == 0) {
                constexpr CMTime infinite[] = {kCMTimePositiveInfinity, kCMTimeNegativeInfinity};
                range.start = random(2) ? infinite[random(2)] : range.start;
                range.duration = random(2) ? kCMTimePositiveInfinity : range.duration;
            }
            if (random(3) == 0)
                result.push_back(KVMakeRef<VexTimeRangeAndObject>(range, objects_[random(3)]));
            else
                result.push_back(KVMakeRef<VexTimeRangeObj>(range));
        }
        return result;
    }

private:
    std::size_t random(std::size_t below) { return engine_() % below; }

    /// In whole and in third seconds, so that ends meet.
    CMTime time(std::size_t most)
    {
        std::int32_t const scale = source_.timescales[random(source_.timescales.size())];
        auto const thirds = static_cast<std::int64_t>(random(most));
        return T(thirds * scale / 3, scale, source_.flags);
    }

    Source const& source_;
    KVNSRef<NSObject*> objects_[3] = {KVMakeRef<NSNumber>(1), KVMakeRef<NSNumber>(2),
                                      KVMakeRef<NSNumber>(1)}; // the first equals the last
    std::mt19937 engine_{7};
};

// --- Sets as bits ---

using Bits = std::bitset<48>;

/// The half seconds, from 0 on, that lie in an element.
Bits bitsOf(Array const& array)
{
    Bits bits;
    for (VexTimeRangeObj const* range : array)
        for (std::size_t i = 0; i < bits.size(); ++i)
            if (overlap(range->range(), {T(static_cast<std::int64_t>(i), 2), T(1, 2)}))
                bits.set(i);
    return bits;
}

} // namespace

TEST(VexTimeRanges, FindsWhatARangeOverlaps)
{
    Array ranges = array({R(0, 1), R(1, 2), R(1, 1), R(0, 5), R(4, 9)});
    ranges.push_back(nullptr);
    auto const indexes = [&](CMTimeRange const& range) {
        return VexTimeRangesCopyIndexesOfIntersectionsWithRange(ranges, range);
    };
    EXPECT_THAT(indexes(R(1, 2)), ElementsAre(1, 3));
    EXPECT_THAT(indexes(R(0, 9)), ElementsAre(0, 1, 3, 4));
    EXPECT_THAT(indexes(R(9, 10)), ElementsAre());
    EXPECT_THAT(indexes(R(1, 1)), ElementsAre()) << "an empty range lies in none";
    EXPECT_THAT(indexes({kCMTimeNegativeInfinity, kCMTimePositiveInfinity}),
                ElementsAre(0, 1, 3, 4));
}

TEST(VexTimeRanges, GrowsEveryElementThatARangeOverlaps)
{
    Array ranges = array({R(0, 2), R(5, 7), R(3, 6)});
    VexTimeRangeObj* const untouched = ranges[0];
    EXPECT_TRUE(VexTimeMutableRangesAddRange(ranges, R(4, 9)));
    // Meant: both grow, and overlap each other from now on.
    EXPECT_THAT(rangesOf(ranges), ElementsAre(R(0, 2), R(4, 9), R(3, 9)));
    EXPECT_EQ(ranges[0].get(), untouched);
    EXPECT_FALSE(VexTimeMutableRangesAddRange(ranges, R(9, 12))) << "touching";
    EXPECT_FALSE(VexTimeMutableRangesAddRange(ranges, R(1, 1))) << "empty";
}

TEST(VexTimeRanges, AddsASortedRunUntilOneMissesAll)
{
    Array ranges = array({R(10, 12), R(20, 22)});
    // Meant: a range in front of all ends the run as one behind all does.
    EXPECT_FALSE(VexTimeMutableRangesAddSortedRanges(ranges, array({R(0, 1), R(11, 15)})));
    EXPECT_THAT(rangesOf(ranges), ElementsAre(R(10, 12), R(20, 22)));
    EXPECT_TRUE(
        VexTimeMutableRangesAddSortedRanges(ranges, array({R(11, 15), R(16, 17), R(21, 30)})));
    EXPECT_THAT(rangesOf(ranges), ElementsAre(R(10, 15), R(20, 22)));
    Array const copy = VexTimeRangesAddSortedRanges(ranges, array({R(14, 16), R(21, 30)}));
    EXPECT_THAT(rangesOf(copy), ElementsAre(R(10, 16), R(20, 30)));
    EXPECT_THAT(rangesOf(ranges), ElementsAre(R(10, 15), R(20, 22)));
    EXPECT_TRUE(VexTimeMutableRangesAddSortedRanges(ranges, ranges));
    EXPECT_FALSE(VexTimeMutableRangesAddSortedRanges(ranges, {nullptr}));
}

TEST(VexTimeRanges, AddsUnsortedRanges)
{
    struct Row {
        std::vector<CMTimeRange> array, added, result;
    } const rows[] = {
        {{R(0, 1)}, {R(1, 2)}, {R(0, 1), R(1, 2)}}, // touching ranges stay two
        {{R(0, 1), R(9, 10), R(4, 5)}, {R(3, 12)}, {R(0, 1), R(3, 12)}},
        {{R(4, 5), R(0, 1)}, {R(2, 3), R(2, 2), R(0, 9)}, {R(0, 9)}},
        {{R(3, 3)}, {R(0, 9)}, {R(3, 3), R(0, 9)}}, // empty ranges are not joined
        // Elements that overlap each other are joined only by a range that reaches both.
        {{R(0, 4), R(2, 8)}, {R(0, 1)}, {R(0, 4), R(2, 8)}},
        {{R(0, 4), R(2, 8)}, {R(3, 5)}, {R(0, 8)}},
        {{R(0, 9)},
         {{kCMTimeNegativeInfinity, kCMTimePositiveInfinity}},
         {{kCMTimeNegativeInfinity, kCMTimePositiveInfinity}}},
    };
    for (Row const& row : rows) {
        Array const before = array(row.array);
        Array const after = VexTimeRangesAddUnsortedRanges(before, array(row.added));
        EXPECT_EQ(rangesOf(after), row.result);
        EXPECT_EQ(rangesOf(before), row.array);
    }
}

TEST(VexTimeRanges, SubtractsSortedRangesFromOne)
{
    constexpr CMTimeRange always = {kCMTimeNegativeInfinity, kCMTimePositiveInfinity};
    struct Row {
        CMTimeRange range;
        std::vector<CMTimeRange> holes, pieces;
    } const rows[] = {
        {R(0, 3), {R(1, 2)}, {R(0, 1), R(2, 3)}},
        {R(0, 3), {R(-1, 1), R(2, 9)}, {R(1, 2)}},
        {R(0, 3), {R(3, 4)}, {R(0, 3)}}, // touching
        {R(0, 3), {R(0, 3)}, {}},
        {R(0, 9), {R(1, 2), R(2, 3), R(3, 3), R(2, 5)}, {R(0, 1), R(5, 9)}},
        {R(4, 4), {R(0, 9)}, {R(4, 4)}}, // an empty range is not cut
        // An open start becomes a year before the first cut.
        {always, {R(1, 2)}, {R(1 - 31536000, 1), {T(2, 1), kCMTimePositiveInfinity}}},
        {R(0, 3), {always}, {}},
    };
    for (Row const& row : rows) {
        auto const range = KVMakeRef<VexTimeRangeObj>(row.range);
        EXPECT_EQ(rangesOf(VexTimeRangeObjSubtractSortedRanges(range, array(row.holes))),
                  row.pieces);
        EXPECT_EQ(rangesOf(VexTimeRangesSubtractUnsortedRanges({range}, array(row.holes))),
                  row.pieces);
    }
    auto const owner = KVMakeRef<NSNumber>(1);
    auto const owned = KVMakeRef<VexTimeRangeAndObject>(R(0, 3), owner);
    for (auto const& piece : VexTimeRangeObjSubtractSortedRanges(owned, array({R(1, 2)})))
        EXPECT_EQ(objectOf(piece), owner.get());
    EXPECT_TRUE(VexTimeRangeObjSubtractSortedRanges(nullptr, {}).empty());
}

TEST(VexTimeRanges, MaskKeepsWhatIsInside)
{
    Array const ranges = array({R(0, 10), R(20, 22), R(5, 5)});
    Array const mask = array({R(8, 21), R(-5, 1), R(2, 3), R(10, 20)});
    // In the order of the mask, sorted or not.
    EXPECT_THAT(rangesOf(VexTimeRangesObjANDMask(ranges[0], mask)),
                ElementsAre(R(8, 10), R(0, 1), R(2, 3)));
    EXPECT_THAT(rangesOf(VexTimeRangesANDMask(ranges, mask)),
                ElementsAre(R(8, 10), R(0, 1), R(2, 3), R(20, 21)));
    EXPECT_TRUE(VexTimeRangesObjANDMask(nullptr, mask).empty());
}

TEST(VexTimeRanges, MixesUnderATest)
{
    Array const a = array({R(0, 4), R(10, 12)});
    Array const b = array({R(11, 20), R(6, 8), R(3, 7), R(30, 31)});
    // R(0, 4) grows by R(3, 7) and then reaches R(6, 8), which had been passed.
    EXPECT_THAT(rangesOf(VexTimeRangesMix(a, b)), ElementsAre(R(0, 8), R(10, 20), R(30, 31)));

    int calls = 0;
    auto const refuse = [&](VexTimeRangeObj*, VexTimeRangeObj*, bool* merge, bool* stop) {
        ++calls;
        *merge = calls == 2 || calls == 3;
        *stop = calls == 2;
    };
    // The first pair is not let, the second is stopped, the third merges.
    EXPECT_THAT(rangesOf(VexTimeRangesMixUsingBlock(array({R(0, 9)}),
                                                    array({R(1, 2), R(2, 3), R(8, 10)}), refuse)),
                ElementsAre(R(0, 10), R(1, 2), R(2, 3)));
    EXPECT_EQ(calls, 5) << "what had been refused is asked about again";

    auto const clip = KVMakeRef<NSNumber>(1), other = KVMakeRef<NSNumber>(2);
    Array const clips = {KVMakeRef<VexTimeRangeAndObject>(R(0, 4), clip)};
    Array const others = {KVMakeRef<VexTimeRangeAndObject>(R(2, 6), other),
                          KVMakeRef<VexTimeRangeAndObject>(R(3, 5), KVMakeRef<NSNumber>(1)),
                          KVMakeRef<VexTimeRangeObj>(R(0, 1))};
    EXPECT_THAT(rangesOf(VexTimeRangesMix(clips, others)), ElementsAre(R(0, 5), R(2, 6), R(0, 1)));
}

TEST(VexTimeRanges, AnArrayMayBeOnBothSides)
{
    Array ranges = array({R(0, 2), R(1, 3), R(5, 6)});
    VexTimeMutableRangesAddUnsortedRanges(ranges, ranges);
    EXPECT_THAT(rangesOf(ranges), ElementsAre(R(0, 3), R(5, 6)));
    VexTimeMutableRangesSubtractUnsortedRanges(ranges, ranges);
    EXPECT_TRUE(ranges.empty());
}

TEST(VexTimeRanges, WholeSetsAgreeWithRangeByRange)
{
    Source const sources[] = {
        {"one timescale", {600}, true},
        {"one timescale, rounded", {600}, true, 0, rounded},
        {"several timescales", {1, 3, 600, 24000, 30000, 90000}, false},
        {"infinities", {600}, true, 5},
        {"no common timescale", {1000000007, 998244353, 30000}, true},
        {"infinities without a common timescale", {1000000007, 998244353}, true, 5},
    };
    for (Source const& source : sources) {
        SCOPED_TRACE(source.name);
        Sets sets(source);
        for (int i = 0; i < 300 && !testing::Test::HasFailure(); ++i) {
            Array const a = sets.next(12), b = sets.next(12);
            Array both = a;
            both.insert(both.end(), b.begin(), b.end());
            expectSame(VexTimeRangesAddUnsortedRanges(a, b), plainAdd(a, b, false), both,
                       source.exactRecords);
            Array apart = a;
            VexTimeMutableRangeAndObjectsAddUnsortedRangeAndObjects(apart, b);
            expectSame(apart, plainAdd(a, b, true), both, source.exactRecords);
            expectSame(VexTimeRangesCollapseRangeAndObjects(a), plainAdd({}, a, true), both,
                       source.exactRecords);
            expectSame(VexTimeRangesSubtractUnsortedRanges(a, b), plainSubtract(a, b), both,
                       source.exactRecords);
        }
    }
}

TEST(VexTimeRanges, WhatTheyCoverObeysTheLawsOfSets)
{
    std::mt19937 engine(3);
    // With a timescale in common and without one, which are two ways of calculating.
    for (auto const& scales : {std::array{2, 600}, std::array{1996488706, 2000000014}})
        for (int i = 0; i < 300 && !testing::Test::HasFailure(); ++i) {
            auto const next = [&] {
                std::vector<CMTimeRange> ranges(engine() % 6);
                for (CMTimeRange& range : ranges) {
                    std::int32_t const scale = scales[engine() % 2];
                    auto const time = [&](std::int64_t half) {
                        return T(half * (scale / 2), scale);
                    };
                    range.start = time(static_cast<std::int64_t>(engine() % 40));
                    range.duration = time(static_cast<std::int64_t>(engine() % 9));
                }
                return array(ranges);
            };
            Array const a = next(), b = next();
            Bits const inA = bitsOf(a), inB = bitsOf(b);
            Array const sum = VexTimeRangesAddUnsortedRanges(a, b);
            Array const difference = VexTimeRangesSubtractUnsortedRanges(a, b);
            EXPECT_EQ(bitsOf(sum), inA | inB);
            EXPECT_EQ(bitsOf(VexTimeRangesMix(a, b)), inA | inB);
            EXPECT_EQ(bitsOf(difference), inA & ~inB);
            EXPECT_EQ(bitsOf(VexTimeRangesANDMask(a, b)), inA & inB);
            EXPECT_EQ(bitsOf(VexTimeRangesCollapseRangeAndObjects(a)), inA);
            // A second time changes nothing.
            EXPECT_THAT(VexTimeRangesAddUnsortedRanges(sum, b),
                        testing::Pointwise(testing::Truly([](auto const& pair) {
                                               return std::get<0>(pair)->isEqual(std::get<1>(pair));
                                           }),
                                           sum));
            EXPECT_EQ(VexTimeRangesSubtractUnsortedRanges(difference, b), difference);
        }
}
