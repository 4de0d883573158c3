#pragma once

#include <korvane/time/VexTimeRangeObj.h>

#include <functional>
#include <vector>

// Sets of ranges: arrays of VexTimeRangeObj, or its kind, that are added to, subtracted from,
// masked and mixed.
//
//     VexTimeRangeArray clips = ...;
//     VexTimeMutableRangesSubtractUnsortedRanges(clips, gaps);
//     for (auto const& piece : clips)
//         ...
//
// One rule decides everywhere: two ranges overlap when neither is empty and each starts strictly
// before the other ends. Ranges that touch do not overlap and stay two elements; an empty range,
// and a null element, overlaps nothing, not even a range that it lies in.
//
// What is cut or joined becomes a new object, made by `copyWithRange` of the one that it comes
// from; all others stay the objects that they were. Forms with "Mutable" in their name change their
// first argument; the others work on a copy of it. An array may be given on both sides.
//
// Adding and subtracting unsorted ranges, and collapsing, take O((n + m) log(n + m)) steps for n
// elements and m ranges whose numeric times can be written on one timescale, the least common
// multiple of all, which is at most 2147483647, in 62 bits and in epoch 0. Other times are compared
// one by one, in O(n m).
//
// They may be called from any thread at once; an array that is being changed belongs to one.

using VexTimeRangeArray = std::vector<KVNSRef<VexTimeRangeObj*>>;

/// The indexes, ascending, of the elements that overlap `range`.
KV_EXPORT std::vector<std::size_t>
VexTimeRangesCopyIndexesOfIntersectionsWithRange(VexTimeRangeArray const& array,
                                                 CMTimeRange const& range);

// --- Add ---

/// Every element that overlaps `range` grows to cover it. Whether any did; nothing is added
/// otherwise. The range itself does not grow, so two elements that grew overlap each other
/// afterwards.
KV_EXPORT bool VexTimeMutableRangesAddRange(VexTimeRangeArray& array, CMTimeRange const& range);

/// Adds range after range in this way until one overlaps nothing: in a sorted run the rest lies
/// beyond the array. Whether any element grew.
KV_EXPORT bool VexTimeMutableRangesAddSortedRanges(VexTimeRangeArray& array,
                                                   VexTimeRangeArray const& ranges);
KV_EXPORT VexTimeRangeArray VexTimeRangesAddSortedRanges(VexTimeRangeArray const& array,
                                                         VexTimeRangeArray const& ranges);

/// Each range, joined with all elements that it overlaps, takes the place of the first of them; one
/// that overlaps none is appended. Empty ranges change nothing.
KV_EXPORT void VexTimeMutableRangesAddUnsortedRanges(VexTimeRangeArray& array,
                                                     VexTimeRangeArray const& ranges);
KV_EXPORT VexTimeRangeArray VexTimeRangesAddUnsortedRanges(VexTimeRangeArray const& array,
                                                           VexTimeRangeArray const& ranges);

/// The same, but only ranges with the same object are joined: equal pointers, or objects that are
/// equal (and then have equal hashes). A plain VexTimeRangeObj has none.
KV_EXPORT void
VexTimeMutableRangeAndObjectsAddUnsortedRangeAndObjects(VexTimeRangeArray& array,
                                                        VexTimeRangeArray const& ranges);
/// The elements added one by one, in this way, to an empty array.
KV_EXPORT VexTimeRangeArray VexTimeRangesCollapseRangeAndObjects(VexTimeRangeArray const& array);

// --- Subtract and mask ---

/// The pieces of `range` outside `ranges`, which are sorted by start, in order of time; the whole,
/// as a new object, if none overlaps. A null range has none. A piece from minus infinity starts one
/// year before its end.
KV_EXPORT VexTimeRangeArray VexTimeRangeObjSubtractSortedRanges(VexTimeRangeObj const* range,
                                                                VexTimeRangeArray const& ranges);

/// Each element that overlaps any of the ranges is replaced by its pieces outside them.
KV_EXPORT void VexTimeMutableRangesSubtractUnsortedRanges(VexTimeRangeArray& array,
                                                          VexTimeRangeArray const& ranges);
KV_EXPORT VexTimeRangeArray VexTimeRangesSubtractUnsortedRanges(VexTimeRangeArray const& array,
                                                                VexTimeRangeArray const& ranges);

/// The pieces of `range` inside each element of the mask that it overlaps, in the mask's order.
KV_EXPORT VexTimeRangeArray VexTimeRangesObjANDMask(VexTimeRangeObj const* range,
                                                    VexTimeRangeArray const& mask);
/// Those of all elements of `ranges`, in order.
KV_EXPORT VexTimeRangeArray VexTimeRangesANDMask(VexTimeRangeArray const& ranges,
                                                 VexTimeRangeArray const& mask);

// --- Mix ---

/// Told of an element of each set that overlap, sets `*merge`, false before, to let them merge.
/// `*stop` keeps them apart whatever `*merge` is.
using VexTimeRangesMixBlock =
    std::function<void(VexTimeRangeObj* a, VexTimeRangeObj* b, bool* merge, bool* stop)>;

/// Both sets as one: the elements of `a`, each joined with those of `b` that it may merge with, and
/// then the elements of `b` that are left. An element that has grown meets all that is left of `b`
/// again.
KV_EXPORT VexTimeRangeArray VexTimeRangesMixUsingBlock(VexTimeRangeArray const& a,
                                                       VexTimeRangeArray const& b,
                                                       VexTimeRangesMixBlock const& block);
/// Merges where the elements have the same object, equal pointers or equal objects, or both have
/// none.
KV_EXPORT VexTimeRangeArray VexTimeRangesMix(VexTimeRangeArray const& a,
                                             VexTimeRangeArray const& b);
