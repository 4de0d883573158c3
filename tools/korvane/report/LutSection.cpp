#include "Html.h"
#include "Sections.h"
#include "Svg.h"

#include "../LutFile.h"
#include "../LutLookup.h"
#include "../LutPlot.h"
#include "../Markup.h"
#include "../Numbers.h"

#include <algorithm>
#include <cmath>

namespace {

constexpr std::size_t mostTables = 8;
constexpr int mostTiles = 17;
constexpr int margin = 44; ///< left of the curves, for the numbers of the axis

/// A drawing of `lutPanel` units, stretched over so many pixels.
std::string panel(std::string const& drawing, int width, int height, std::string const& id,
                  std::string const& title, std::string const& description)
{
    Svg svg(width, height);
    svg.add("<g transform=\"scale(" + decimal(width / double{lutPanel}, 4) + " " +
            decimal(height / double{lutPanel}, 4) + ")\">\n" + drawing + "</g>\n");
    return figure(svg.html(id, title, description), title);
}

std::string curvesHtml(cc::lut_t const& table, cc::lut_t::processor_t const& lookup,
                       std::string const& id)
{
    Svg svg(margin + lutPanel + 16, lutPanel + 40);
    svg.add("<g transform=\"translate(" + std::to_string(margin) + " 12)\">\n" +
            lutCurves(table, lookup) + "</g>\n");
    svg.text(margin + lutPanel / 2.0, 12 + lutPanel + 18, "in", "mid soft");
    svg.text(margin - 10, 12 + lutPanel / 2.0, "out", "end soft");
    bool const isCube = table.kind == cc::lut_t::k3D;
    std::string const title = isCube ? "What becomes of greys, channel by channel" : "The curve";
    std::string const description = "From " + shortest(table.domainMin) + " to " +
                                    shortest(table.domainMax) +
                                    " on both axes; a table without effect is the diagonal.";
    return figure(svg.html(id, title, description), title,
                  isCube ? legend({{"red", "red"}, {"green", "green"}, {"blue", "blue"}})
                         : legend({{"all", "all channels"}}));
}

std::string slicesHtml(cc::lut_t const& table, cc::lut_t::processor_t const& lookup,
                       std::string const& id)
{
    std::string html;
    for (int i = 0; i < 4; ++i) {
        float const part = static_cast<float>(i) / 3;
        float const blue = table.domainMin + (table.domainMax - table.domainMin) * part;
        html += panel(lutSlice(table, lookup, part, mostTiles), 160, 160,
                      id + "-slice" + std::to_string(i),
                      "Blue " + shortest(std::round(blue * 1000) / 1000),
                      "Red grows to the right, green upwards.");
    }
    return html + "<p class=\"axes\">In each slice red grows to the right, green upwards.</p>\n";
}

std::string rampsHtml(cc::lut_t const& table, cc::lut_t::processor_t const& lookup,
                      std::string const& id)
{
    return panel(lutRamps(table, lookup), 688, 110, id + "-ramps",
                 "A grey ramp, and below it what the table makes of it",
                 "Dark to light from left to right.");
}

std::string rangesHtml(cc::lut_t const& table)
{
    std::string html;
    auto const channels = channelNames(table);
    for (std::size_t i = 0; i < channels.size(); ++i) {
        auto const [least, greatest] = rangeOf(table, i);
        html += (i ? "<br>" : "") + decimal(least, 4) + " to " + decimal(greatest, 4) + " in " +
                channels[i];
    }
    return html;
}

} // namespace

std::string lutHtml(ReopenableFile const& file, std::string const& id)
{
    std::vector<cc::lut_t> const tables = readLuts(file);
    std::string html;
    for (std::size_t i = 0; i < std::min(tables.size(), mostTables); ++i) {
        cc::lut_t const& table = tables[i];
        std::string const own = id + "-table" + std::to_string(i);
        auto const lookup = makeLookup(table, Interpolation::Tetrahedral);
        if (tables.size() > 1)
            html += "<h3>Table " + std::to_string(i) + "</h3>\n";
        Facts facts;
        facts.add("Title", table.title.empty() ? "none" : table.title)
            .add("Format", formatName(table.format()))
            .add("Size", sizeText(table))
            .add("Domain", shortest(table.domainMin) + " to " + shortest(table.domainMax))
            .addHtml("Values", rangesHtml(table));
        html += facts.html() + "<h3>Curves and slices</h3>\n<div class=\"panels\">" +
                curvesHtml(table, *lookup, own + "-curves") + "<div class=\"panels aside\">" +
                (table.kind == cc::lut_t::k3D ? slicesHtml(table, *lookup, own) : "") +
                rampsHtml(table, *lookup, own) + "</div></div>\n";
    }
    if (tables.size() > mostTables)
        html += note("and " + grouped(tables.size() - mostTables) + " more tables");
    return html;
}
