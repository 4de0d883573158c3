#pragma once

#include "../Lanes.h"

#include <cstddef>
#include <string>
#include <vector>

/// Something that lasts, on a timeline; times are seconds.
struct TimelineItem {
    double start = 0, end = 0;
    std::string label;   ///< in the bar
    std::string note;    ///< below it, in small letters
    std::string detail;  ///< where the pointer rests
    std::size_t hue = 0; ///< which of `timelineHues` colours
};

/// Something that happens.
struct TimelinePoint {
    double at = 0;
    std::string label;
};

struct TimelineTrack {
    std::string label;
    std::vector<TimelineItem> items;
};

/// What `timelineHtml` draws. Items of one track that overlap go into rows of their own, with the
/// time that they share marked.
struct Timeline {
    std::vector<TimelineTrack> tracks;
    std::vector<TimelinePoint> points;
};

inline constexpr std::size_t timelineHues = 6;

/// Where spans, sorted by their start, overlap: whole stretches, those that touch made one.
std::vector<Span> overlapsOf(std::vector<Span> const& spans);

/// One picture, or with nothing to draw a note. Long timelines are cut into strips, one below the
/// other; items too narrow to be seen are drawn together. Its size is bounded, whatever the number
/// of items: `id` is unique in the page.
std::string timelineHtml(Timeline timeline, std::string const& id, std::string const& title);
