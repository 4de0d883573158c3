#include "Timeline.h"

#include "Html.h"
#include "Svg.h"

#include "../Markup.h"
#include "../TimeForms.h"

#include <algorithm>
#include <cmath>

namespace {

constexpr double left = 92;
constexpr double right = 1098;
constexpr double across = right - left;
constexpr double rowHeight = 40;
constexpr double rowGap = 6;
constexpr double axisHeight = 24;
constexpr double pointHeight = 20;
constexpr double narrowest = 4;           ///< a bar, in pixels
constexpr double widestGroup = 36;        ///< that still takes more
constexpr std::size_t mostLanes = 6;      ///< of one track
constexpr std::size_t mostRowsDrawn = 12; ///< of one strip
constexpr std::size_t mostRowsInAll = 40;
constexpr std::size_t mostPoints = 200;

/// 1, 2, 5, 10, 15, 30 and so on, in the units of the clock.
std::vector<double> niceSteps()
{
    std::vector<double> steps;
    for (double unit : {0.001, 0.01, 0.1})
        for (double step : {1.0, 2.0, 5.0})
            steps.push_back(unit * step);
    for (double step : {1, 2, 5, 10, 15, 20, 30, 60, 120, 300, 600, 900, 1800, 3600, 7200, 14400,
                        21600, 43200, 86400})
        steps.push_back(step);
    for (double step = 864000; step < 1e20; step *= 10)
        steps.push_back(step);
    return steps;
}

/// "00:01:30", with milliseconds where the step between ticks asks for them.
std::string clockText(double seconds, double step)
{
    if (std::abs(seconds) >= 360000)
        return decimal(seconds, 0) + " s";
    // What is rounded to a tick may lie just below it.
    std::string const text = timecodeText(seconds + (seconds < 0 ? -1e-6 : 1e-6));
    return step < 1 ? text : text.substr(0, text.find(','));
}

double median(std::vector<double> values)
{
    if (values.empty())
        return 0;
    auto const middle = values.begin() + static_cast<std::ptrdiff_t>(values.size() / 2);
    std::nth_element(values.begin(), middle, values.end());
    return *middle;
}

/// How the time is cut into strips, and each into ticks.
struct Strips {
    double origin = 0, length = 1, tick = 1;
    std::size_t count = 1;

    Strips(double first, double last, double usual, std::size_t most)
    {
        std::vector<double> const steps = niceSteps();
        for (double const step : steps) {
            double const start = std::floor(first / step) * step;
            double const strips = std::max(1.0, std::ceil((last - start) / step - 1e-9));
            if (strips > static_cast<double>(most) || (strips > 1 && across * usual / step > 130))
                continue;
            origin = start;
            length = step;
            count = static_cast<std::size_t>(strips);
            break;
        }
        // The labels of the first two ticks, and of the last two, are the closest: one of them
        // stands beside its tick and one in the middle.
        double const farthest = -first > last ? first : last;
        tick = length;
        for (double const step : steps)
            if (across * step / length >= 1.5 * widthOf(clockText(farthest, step)) + 4) {
                tick = std::min(length, step);
                break;
            }
    }
};

/// Items of one row that are drawn as one bar.
struct Bar {
    double from, to; ///< pixels
    TimelineItem const* item;
    std::size_t count;
    double start, end; ///< seconds
};

struct Row {
    std::string label;
    std::vector<TimelineItem const*> items; ///< in order, apart from each other
    std::vector<Span> overlaps;             ///< of its track
};

std::vector<Row> rowsOf(Timeline const& timeline, std::size_t& leftOut)
{
    std::vector<Row> rows;
    for (TimelineTrack const& track : timeline.tracks) {
        std::vector<Span> spans;
        spans.reserve(track.items.size());
        for (TimelineItem const& item : track.items)
            spans.push_back({item.start, item.end});
        std::vector<std::size_t> const lanes = lanesOf(spans, mostLanes);
        std::vector<Row> own(1);
        for (std::size_t i = 0; i < lanes.size(); ++i) {
            if (lanes[i] == mostLanes || rows.size() + lanes[i] >= mostRowsDrawn) {
                ++leftOut;
                continue;
            }
            own.resize(std::max(own.size(), lanes[i] + 1));
            own[lanes[i]].items.push_back(&track.items[i]);
        }
        own[0].label = track.label;
        for (Row& row : own)
            row.overlaps = overlapsOf(spans);
        if (rows.size() < mostRowsDrawn)
            std::move(own.begin(), own.end(), std::back_inserter(rows));
    }
    return rows;
}

class Picture {
public:
    Picture(std::vector<Row> const& rows, std::vector<TimelinePoint> const& points,
            Strips const& strips)
        : rows_(rows), points_(points), strips_(strips), svg_(right + 2, 0)
    {
        double y = 0;
        for (std::size_t i = 0; i < strips.count; ++i) {
            begin_ = strips.origin + static_cast<double>(i) * strips.length;
            end_ = begin_ + strips.length;
            y = drawStrip(y) + (i + 1 < strips.count ? 14 : 0);
        }
        svg_.setHeight(y + 2);
    }

    Svg const& svg() const noexcept { return svg_; }

private:
    double xOf(double seconds) const
    {
        return left + across * std::clamp((seconds - begin_) / strips_.length, 0.0, 1.0);
    }

    bool isHere(TimelineItem const& item) const
    {
        return (item.start < end_ || (item.start == end_ && isLast())) &&
               (item.end > begin_ || item.start >= begin_);
    }

    double drawStrip(double y)
    {
        double const top = y + axisHeight + (points_.empty() ? 0 : pointHeight);
        std::vector<Row const*> rows;
        for (Row const& row : rows_)
            if (!row.label.empty() || std::ranges::any_of(row.items, [&](TimelineItem const* item) {
                    return isHere(*item);
                }))
                rows.push_back(&row);
        double const bottom = top + static_cast<double>(rows.size()) * (rowHeight + rowGap);
        drawAxis(y, bottom - rowGap);
        double rowTop = top;
        for (std::size_t i = 0; i < rows.size(); ++i) {
            svg_.rect(left, rowTop, across, rowHeight, "lane");
            rowTop += rowHeight + rowGap;
        }
        drawPoints(y + axisHeight, bottom - rowGap);
        rowTop = top;
        for (Row const* row : rows) {
            svg_.text(left - 10, rowTop + 24, fitted(row->label, left - 14), "end soft");
            drawBars(*row, rowTop);
            drawOverlaps(*row, rowTop);
            rowTop += rowHeight + rowGap;
        }
        return bottom;
    }

    void drawAxis(double y, double bottom)
    {
        auto const ticks = static_cast<int>(std::lround(strips_.length / strips_.tick));
        for (int i = 0; i <= ticks; ++i) {
            double const at = std::min(begin_ + i * strips_.tick, end_);
            double const x = xOf(at);
            svg_.line(x, y + axisHeight - 5, x, bottom, "line");
            svg_.text(x, y + 13, clockText(at, strips_.tick),
                      i == 0       ? "soft"
                      : i == ticks ? "soft end"
                                   : "soft mid");
        }
        svg_.line(left, y + axisHeight - 5, right, y + axisHeight - 5, "axisline");
    }

    void drawPoints(double y, double bottom)
    {
        std::vector<TimelinePoint const*> here;
        for (TimelinePoint const& point : points_)
            if (point.at >= begin_ && (point.at < end_ || (point.at == end_ && isLast())))
                here.push_back(&point);
        for (std::size_t i = 0; i < here.size(); ++i) {
            double const x = xOf(here[i]->at);
            double const next = i + 1 < here.size() ? xOf(here[i + 1]->at) - 8 : right;
            svg_.line(x, y + 12, x, bottom, "pointline");
            svg_.path("M" + decimal(x) + " " + decimal(y + 3) + "l5 5l-5 5l-5 -5z", "point",
                      here[i]->label + ", " + timecodeText(here[i]->at));
            svg_.text(x + 9, y + 12, fitted(here[i]->label, next - x - 9));
        }
    }

    bool isLast() const
    {
        return end_ >= strips_.origin + strips_.length * (static_cast<double>(strips_.count) - 0.5);
    }

    /// Whether two bars would cover each other, or are both too narrow to lie side by side.
    static bool touches(Bar const& bar, double from, double to)
    {
        return from < bar.to - 0.01 || (from < bar.to + 1 && bar.to - bar.from < 2 * narrowest &&
                                        to - from < 2 * narrowest);
    }

    void drawBars(Row const& row, double y)
    {
        std::vector<Bar> bars;
        for (TimelineItem const* item : row.items) {
            if (!isHere(*item))
                continue;
            double from = xOf(item->start);
            double const to = std::min(std::max(xOf(item->end), from + narrowest), right + 1);
            if (!bars.empty() && touches(bars.back(), from, to)) {
                Bar& last = bars.back();
                if (last.to - last.from < widestGroup || to <= last.to) {
                    last.to = std::max(last.to, to);
                    last.end = item->end;
                    ++last.count;
                    continue;
                }
                from = last.to;
            }
            bars.push_back({from, to, item, 1, item->start, item->end});
        }
        for (Bar const& bar : bars)
            drawBar(bar, y);
    }

    void drawBar(Bar const& bar, double y)
    {
        bool const isOne = bar.count == 1;
        double const width = bar.to - bar.from;
        std::string const tooltip = isOne ? bar.item->detail
                                          : grouped(bar.count) + " together, " +
                                                timecodeText(bar.start) + " to " +
                                                timecodeText(bar.end);
        svg_.rect(bar.from + 0.5, y + 0.5, std::max(width - 1, 1.0), rowHeight - 1,
                  "c" + std::to_string(bar.item->hue % timelineHues) + (isOne ? "" : " many"),
                  tooltip);
        std::string const label = isOne ? bar.item->label : grouped(bar.count);
        if (std::string const text = fitted(label, width - 10); !text.empty())
            svg_.text(bar.from + 6, y + (isOne && !bar.item->note.empty() ? 17 : 24), text);
        // The second line in smaller letters.
        if (std::string const text = fitted(bar.item->note, (width - 10) * 1.09);
            isOne && !text.empty())
            svg_.text(bar.from + 6, y + 32, text, "small");
    }

    void drawOverlaps(Row const& row, double y)
    {
        std::vector<Bar> bands;
        for (Span const& span : row.overlaps) {
            if (span.from >= end_ || span.to <= begin_)
                continue;
            double const from = xOf(span.from);
            double const to = std::max(xOf(span.to), from + 2);
            if (bands.empty() || from > bands.back().to + 2)
                bands.push_back({from, to, nullptr, 0, span.from, span.to});
            bands.back().to = std::max(bands.back().to, to);
            bands.back().end = span.to;
            ++bands.back().count;
        }
        for (Bar const& band : bands)
            svg_.rect(band.from, y, band.to - band.from, rowHeight, "overlap",
                      (band.count == 1 ? "overlap, " : counted(band.count, "overlap") + ", ") +
                          timecodeText(band.start) + " to " + timecodeText(band.end));
    }

    std::vector<Row> const& rows_;
    std::vector<TimelinePoint> const& points_;
    Strips const& strips_;
    Svg svg_;
    double begin_ = 0, end_ = 0;
};

} // namespace

std::vector<Span> overlapsOf(std::vector<Span> const& spans)
{
    std::vector<Span> overlaps;
    double end = -INFINITY;
    for (Span const& span : spans) {
        double const to = std::min(end, span.to);
        if (span.from < to) {
            if (!overlaps.empty() && span.from <= overlaps.back().to)
                overlaps.back().to = std::max(overlaps.back().to, to);
            else
                overlaps.push_back({span.from, to});
        }
        end = std::max(end, span.to);
    }
    return overlaps;
}

std::string timelineHtml(Timeline timeline, std::string const& id, std::string const& title)
{
    double first = INFINITY, last = -INFINITY;
    std::vector<double> lengths;
    std::size_t count = 0;
    for (TimelineTrack& track : timeline.tracks) {
        std::stable_sort(
            track.items.begin(), track.items.end(),
            [](TimelineItem const& a, TimelineItem const& b) { return a.start < b.start; });
        count += track.items.size();
        for (TimelineItem const& item : track.items) {
            first = std::min(first, item.start);
            last = std::max({last, item.start, item.end});
            lengths.push_back(item.end - item.start);
        }
    }
    if (count == 0)
        return note("There is nothing to draw on a timeline.");
    std::stable_sort(timeline.points.begin(), timeline.points.end(),
                     [](TimelinePoint const& a, TimelinePoint const& b) { return a.at < b.at; });
    for (TimelinePoint const& point : timeline.points) {
        first = std::min(first, point.at);
        last = std::max(last, point.at);
    }
    std::size_t const morePoints =
        timeline.points.size() - std::min(timeline.points.size(), mostPoints);
    timeline.points.resize(timeline.points.size() - morePoints);

    std::size_t leftOut = 0;
    std::vector<Row> const rows = rowsOf(timeline, leftOut);
    Strips const strips(first, last, median(std::move(lengths)),
                        std::clamp<std::size_t>(mostRowsInAll / rows.size(), 1, 8));
    Picture const picture(rows, timeline.points, strips);
    std::string html = picture.svg().scrollHtml(
        id, title,
        counted(count, "item") + " from " + timecodeText(first) + " to " + timecodeText(last) +
            (strips.count > 1 ? ", in " + counted(strips.count, "strip") + " one below the other"
                              : "") +
            ". The table below tells each.");
    if (leftOut > 0)
        html += note("and " + grouped(leftOut) + " more, for which the picture has no rows");
    if (morePoints > 0)
        html += note("and " + grouped(morePoints) + " more markers");
    return html;
}
