#include "RangeTimeline.h"

#include "Lanes.h"
#include "Markup.h"

#include <korvane/foundation/KVString.h>
#include <korvane/time/VexTimeRangeAndObject.h>

#include <algorithm>
#include <cmath>

namespace {

/// From 0 at the first numeric time to 1 at the last.
class Scale {
public:
    explicit Scale(std::vector<TimelineSet> const& sets)
    {
        for (TimelineSet const& set : sets)
            for (VexTimeRangeObj const* range : set.ranges)
                for (CMTime const& time : {range->start(), range->end()})
                    take(CMTimeGetSeconds(time));
        if (first_ > last_)
            first_ = last_ = 0;
    }

    double first() const { return first_; }
    double last() const { return last_; }
    double at(CMTime const& time) const
    {
        double const seconds = CMTimeGetSeconds(time);
        if (std::isnan(seconds) || seconds >= last_)
            return 1;
        return seconds <= first_ ? 0 : (seconds - first_) / (last_ - first_);
    }

private:
    void take(double seconds)
    {
        if (!std::isfinite(seconds))
            return;
        first_ = std::min(first_, seconds);
        last_ = std::max(last_, seconds);
    }

    double first_ = INFINITY, last_ = -INFINITY;
};

/// A range's place on a row, in units of a column.
struct Bar {
    VexTimeRangeObj const* range;
    std::size_t from, to;
};

/// The set's ranges in order of time, in as few rows as keep them apart.
std::vector<std::vector<Bar>> rowsOf(TimelineSet const& set, Scale const& scale,
                                     std::size_t columns)
{
    auto const width = static_cast<double>(columns);
    std::vector<Bar> bars;
    for (VexTimeRangeObj const* range : set.ranges) {
        // Rounded, so that ranges that touch do so in the picture.
        auto const from = static_cast<std::size_t>(std::round(scale.at(range->start()) * width));
        auto const to = static_cast<std::size_t>(std::round(scale.at(range->end()) * width));
        std::size_t const first = std::min(from, columns - 1);
        bars.push_back({range, first, std::max(first + 1, to)});
    }
    std::stable_sort(bars.begin(), bars.end(), [](Bar const& a, Bar const& b) {
        return CMTimeCompare(a.range->start(), b.range->start()) < 0;
    });
    std::vector<Span> spans;
    spans.reserve(bars.size());
    for (Bar const& bar : bars)
        spans.push_back({static_cast<double>(bar.from), static_cast<double>(bar.to)});
    std::vector<std::size_t> const lanes = lanesOf(spans);
    std::vector<std::vector<Bar>> rows(1);
    for (std::size_t i = 0; i < bars.size(); ++i) {
        rows.resize(std::max(rows.size(), lanes[i] + 1));
        rows[lanes[i]].push_back(bars[i]);
    }
    return rows;
}

/// "[name==)" of that many characters.
std::string barText(Bar const& bar)
{
    std::size_t const width = bar.to - bar.from;
    if (width == 1)
        return "|";
    std::string const name = nameOf(bar.range).substr(0, width - 2);
    bool const isPlain =
        std::all_of(name.begin(), name.end(), [](char c) { return c >= ' ' && c <= '~'; });
    std::string text = "[" + (isPlain ? name : "");
    text.resize(width - 1, '=');
    return text + ")";
}

std::string secondsText(double seconds)
{
    return KVString::ssprintf("%.3f", seconds);
}

} // namespace

std::string nameOf(VexTimeRangeObj const* range)
{
    auto const* owner = dynamic_cast<VexTimeRangeAndObject const*>(range);
    return owner && owner->object() ? owner->object()->description().toUTF8() : std::string();
}

std::string timelineText(std::vector<TimelineSet> const& sets, std::size_t columns)
{
    Scale const scale(sets);
    std::size_t margin = 0;
    for (TimelineSet const& set : sets)
        margin = std::max(margin, set.label.size() + 1);
    std::string text;
    for (TimelineSet const& set : sets) {
        std::string label = set.label;
        for (auto const& row : rowsOf(set, scale, columns)) {
            std::string line = label;
            for (Bar const& bar : row) {
                line.resize(margin + bar.from, ' ');
                line += barText(bar);
            }
            text += line + "\n";
            label.clear();
        }
    }
    std::string const first = secondsText(scale.first()), last = secondsText(scale.last());
    std::string line(margin, ' ');
    line += first;
    line.resize(std::max(line.size() + 1, margin + columns - std::min(columns, last.size())), ' ');
    return text + line + last + "\n";
}

std::string timelineSvg(std::vector<TimelineSet> const& sets)
{
    constexpr std::size_t columns = 800, margin = 120, rowHeight = 24;
    constexpr char const* colours[] = {"#4878a8", "#b06848", "#58905a"};
    Scale const scale(sets);
    std::string body;
    std::size_t y = 10;
    for (std::size_t i = 0; i < sets.size(); ++i) {
        body += "<text x=\"10\" y=\"" + std::to_string(y + 15) + "\">" + escaped(sets[i].label) +
                "</text>\n";
        for (auto const& row : rowsOf(sets[i], scale, columns)) {
            for (Bar const& bar : row) {
                std::string const name = nameOf(bar.range);
                body += "<g><rect x=\"" + std::to_string(margin + bar.from) + "\" y=\"" +
                        std::to_string(y) + "\" width=\"" + std::to_string(bar.to - bar.from) +
                        "\" height=\"20\" fill=\"" + colours[i % std::size(colours)] +
                        "\" stroke=\"#fff\"/><title>" + escaped(bar.range->description().toUTF8()) +
                        "</title>";
                if (!name.empty() && bar.to - bar.from > 8 * name.size())
                    body += "<text fill=\"#fff\" x=\"" + std::to_string(margin + bar.from + 5) +
                            "\" y=\"" + std::to_string(y + 15) + "\">" + escaped(name) + "</text>";
                body += "</g>\n";
            }
            y += rowHeight;
        }
    }
    y += 16;
    body += "<text x=\"" + std::to_string(margin) + "\" y=\"" + std::to_string(y) + "\">" +
            secondsText(scale.first()) + " s</text>\n<text text-anchor=\"end\" x=\"" +
            std::to_string(margin + columns) + "\" y=\"" + std::to_string(y) + "\">" +
            secondsText(scale.last()) + " s</text>\n";
    std::string const width = std::to_string(margin + columns + 10);
    std::string const height = std::to_string(y + 10);
    return "<svg xmlns=\"http://www.w3.org/2000/svg\" role=\"img\" width=\"" + width +
           "\" height=\"" + height + "\" viewBox=\"0 0 " + width + " " + height +
           "\" font-family=\"sans-serif\" font-size=\"13\">\n<title>Time ranges</title>\n" + body +
           "</svg>\n";
}
