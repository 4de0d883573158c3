#include <korvane/time/VexTimeRanges.h>

#include <korvane/time/VexTimeRangeSweep_p.h>

#include <algorithm>

namespace {

/// A range with its end, for tests of overlap.
struct Extent {
    CMTimeRange range;
    CMTime end;
    bool isEmpty;

    explicit Extent(CMTimeRange const& r) noexcept
        : range(r), end(KV_CMTimeRangeEnd(r)), isEmpty(CMTimeCompare(r.duration, kCMTimeZero) == 0)
    {}
    explicit Extent(VexTimeRangeObj const* object) noexcept
        : Extent(object ? object->range() : CMTimeRange{kCMTimeZero, kCMTimeZero})
    {}

    bool overlaps(Extent const& other) const noexcept
    {
        return !isEmpty && !other.isEmpty && CMTimeCompare(end, other.range.start) > 0 &&
               CMTimeCompare(range.start, other.end) < 0;
    }
};

std::vector<Extent> extentsOf(VexTimeRangeArray const& ranges)
{
    std::vector<Extent> extents;
    extents.reserve(ranges.size());
    for (VexTimeRangeObj const* range : ranges)
        extents.emplace_back(range);
    return extents;
}

/// Makes the piece of `object` from `start` to `end`.
KVNSRef<VexTimeRangeObj*> piece(VexTimeRangeObj const* object, CMTime const& start,
                                CMTime const& end)
{
    return object->copyWithRange(KV_CMTimeRangeMakeWithStartEnd(start, end));
}

/// Appends the pieces of `object`, which is not null, outside `ranges`, and tells whether it was
/// cut.
bool appendPieces(VexTimeRangeObj const* object, std::span<Extent const> ranges,
                  VexTimeRangeArray& pieces)
{
    Extent rest(object);
    bool cut = false;
    for (Extent const& hole : ranges) {
        if (!rest.overlaps(hole))
            continue;
        cut = true;
        if (CMTimeCompare(hole.range.start, rest.range.start) > 0)
            pieces.push_back(piece(object, rest.range.start, hole.range.start));
        if (CMTimeCompare(hole.end, rest.end) >= 0)
            return true;
        rest = Extent(KV_CMTimeRangeMakeWithStartEnd(hole.end, rest.end));
    }
    pieces.push_back(object->copyWithRange(rest.range));
    return cut;
}

VexTimeRangeArray addOneByOne(VexTimeRangeArray array, VexTimeRangeArray const& ranges,
                              bool keepObjectsApart)
{
    std::vector<Extent> extents = extentsOf(array);
    for (KVNSRef<VexTimeRangeObj*> const& range : ranges) {
        Extent const added(range);
        if (added.isEmpty)
            continue;
        CMTimeRange joined = added.range;
        std::size_t first = array.size(), kept = 0;
        for (std::size_t i = 0; i < array.size(); ++i) {
            bool const joins =
                extents[i].overlaps(added) &&
                (!keepObjectsApart || CFEqual(kv::objectOf(array[i]), kv::objectOf(range)));
            if (joins) {
                joined = KV_CMTimeRangeUnion(joined, extents[i].range);
                first = std::min(first, i);
            }
            // The place of the first is kept for the union.
            if (!joins || i == first) {
                array[kept] = array[i];
                extents[kept++] = extents[i];
            }
        }
        if (first == array.size()) {
            array.push_back(range);
            extents.push_back(added);
            continue;
        }
        array.resize(kept);
        extents.resize(kept, added);
        array[first] = array[first]->copyWithRange(joined);
        extents[first] = Extent(joined);
    }
    return array;
}

VexTimeRangeArray subtractOneByOne(VexTimeRangeArray array, VexTimeRangeArray const& ranges)
{
    for (VexTimeRangeObj const* range : ranges) {
        Extent const hole(range);
        VexTimeRangeArray result;
        for (KVNSRef<VexTimeRangeObj*> const& element : array) {
            if (Extent(element).overlaps(hole))
                appendPieces(element, {&hole, 1}, result);
            else
                result.push_back(element);
        }
        array = std::move(result);
    }
    return array;
}

VexTimeRangeArray added(VexTimeRangeArray const& array, VexTimeRangeArray const& ranges,
                        bool keepObjectsApart)
{
    auto swept = kv::addBySweep(array, ranges, keepObjectsApart);
    return swept ? std::move(*swept) : addOneByOne(array, ranges, keepObjectsApart);
}

} // namespace

std::vector<std::size_t>
VexTimeRangesCopyIndexesOfIntersectionsWithRange(VexTimeRangeArray const& array,
                                                 CMTimeRange const& range)
{
    Extent const extent(range);
    std::vector<std::size_t> indexes;
    for (std::size_t i = 0; i < array.size(); ++i)
        if (Extent(array[i]).overlaps(extent))
            indexes.push_back(i);
    return indexes;
}

// --- Add ---

bool VexTimeMutableRangesAddRange(VexTimeRangeArray& array, CMTimeRange const& range)
{
    Extent const extent(range);
    bool grew = false;
    for (KVNSRef<VexTimeRangeObj*>& element : array)
        if (Extent(element).overlaps(extent)) {
            element = element->copyWithRange(KV_CMTimeRangeUnion(element->range(), range));
            grew = true;
        }
    return grew;
}

bool VexTimeMutableRangesAddSortedRanges(VexTimeRangeArray& array, VexTimeRangeArray const& ranges)
{
    if (&array == &ranges)
        return VexTimeMutableRangesAddSortedRanges(array, VexTimeRangeArray(ranges));
    bool grew = false;
    for (VexTimeRangeObj const* range : ranges) {
        if (!range || !VexTimeMutableRangesAddRange(array, range->range()))
            break;
        grew = true;
    }
    return grew;
}

VexTimeRangeArray VexTimeRangesAddSortedRanges(VexTimeRangeArray const& array,
                                               VexTimeRangeArray const& ranges)
{
    VexTimeRangeArray copy = array;
    VexTimeMutableRangesAddSortedRanges(copy, ranges);
    return copy;
}

void VexTimeMutableRangesAddUnsortedRanges(VexTimeRangeArray& array,
                                           VexTimeRangeArray const& ranges)
{
    array = added(array, ranges, false);
}

VexTimeRangeArray VexTimeRangesAddUnsortedRanges(VexTimeRangeArray const& array,
                                                 VexTimeRangeArray const& ranges)
{
    return added(array, ranges, false);
}

void VexTimeMutableRangeAndObjectsAddUnsortedRangeAndObjects(VexTimeRangeArray& array,
                                                             VexTimeRangeArray const& ranges)
{
    array = added(array, ranges, true);
}

VexTimeRangeArray VexTimeRangesCollapseRangeAndObjects(VexTimeRangeArray const& array)
{
    return added({}, array, true);
}

// --- Subtract and mask ---

VexTimeRangeArray VexTimeRangeObjSubtractSortedRanges(VexTimeRangeObj const* range,
                                                      VexTimeRangeArray const& ranges)
{
    VexTimeRangeArray pieces;
    if (range)
        appendPieces(range, extentsOf(ranges), pieces);
    return pieces;
}

void VexTimeMutableRangesSubtractUnsortedRanges(VexTimeRangeArray& array,
                                                VexTimeRangeArray const& ranges)
{
    array = VexTimeRangesSubtractUnsortedRanges(array, ranges);
}

VexTimeRangeArray VexTimeRangesSubtractUnsortedRanges(VexTimeRangeArray const& array,
                                                      VexTimeRangeArray const& ranges)
{
    auto swept = kv::subtractBySweep(array, ranges);
    return swept ? std::move(*swept) : subtractOneByOne(array, ranges);
}

namespace {

void appendMasked(VexTimeRangeObj const* range, std::span<Extent const> mask,
                  VexTimeRangeArray& pieces)
{
    Extent const extent(range);
    for (Extent const& inside : mask) {
        if (!extent.overlaps(inside))
            continue;
        bool const startsInside = CMTimeCompare(extent.range.start, inside.range.start) >= 0;
        bool const endsInside = CMTimeCompare(extent.end, inside.end) <= 0;
        pieces.push_back(piece(range, startsInside ? extent.range.start : inside.range.start,
                               endsInside ? extent.end : inside.end));
    }
}

} // namespace

VexTimeRangeArray VexTimeRangesObjANDMask(VexTimeRangeObj const* range,
                                          VexTimeRangeArray const& mask)
{
    VexTimeRangeArray pieces;
    appendMasked(range, extentsOf(mask), pieces);
    return pieces;
}

VexTimeRangeArray VexTimeRangesANDMask(VexTimeRangeArray const& ranges,
                                       VexTimeRangeArray const& mask)
{
    std::vector<Extent> const extents = extentsOf(mask);
    VexTimeRangeArray pieces;
    for (VexTimeRangeObj const* range : ranges)
        appendMasked(range, extents, pieces);
    return pieces;
}

// --- Mix ---

VexTimeRangeArray VexTimeRangesMixUsingBlock(VexTimeRangeArray const& a, VexTimeRangeArray const& b,
                                             VexTimeRangesMixBlock const& block)
{
    VexTimeRangeArray mixed = a, left = b;
    std::vector<Extent> extents = extentsOf(left);
    for (KVNSRef<VexTimeRangeObj*>& element : mixed) {
        Extent extent(element);
        for (std::size_t i = 0; i < left.size();) {
            bool merge = false, stop = false;
            if (extent.overlaps(extents[i]))
                block(element, left[i], &merge, &stop);
            if (!merge || stop) {
                ++i;
                continue;
            }
            element = element->copyWithRange(KV_CMTimeRangeUnion(extent.range, extents[i].range));
            extent = Extent(element);
            left.erase(left.begin() + static_cast<std::ptrdiff_t>(i));
            extents.erase(extents.begin() + static_cast<std::ptrdiff_t>(i));
            i = 0;
        }
    }
    mixed.insert(mixed.end(), left.begin(), left.end());
    return mixed;
}

VexTimeRangeArray VexTimeRangesMix(VexTimeRangeArray const& a, VexTimeRangeArray const& b)
{
    return VexTimeRangesMixUsingBlock(
        a, b, [](VexTimeRangeObj* x, VexTimeRangeObj* y, bool* merge, bool* stop) {
            *merge = CFEqual(kv::objectOf(x), kv::objectOf(y));
            *stop = !*merge;
        });
}
