#include "LutPlot.h"

#include "Markup.h"
#include "Numbers.h"

#include <algorithm>
#include <cmath>

namespace {

constexpr int panel = lutPanel;
constexpr int left = 60;
constexpr int top = 50;
constexpr int sliceLeft = left + panel + 60;
constexpr int width = sliceLeft + panel + 20;
constexpr int height = top + panel + 60;
constexpr int samples = 160;

/// Colours by their part of the domain, 0 to 1.
class Domain {
public:
    explicit Domain(cc::lut_t const& table)
        : minimum_(table.domainMin), range_(table.domainMax - table.domainMin)
    {}
    float colourAt(float part) const { return minimum_ + range_ * part; }
    float partOf(float value) const
    {
        float const part = (value - minimum_) / range_;
        return !(part > 0.0f) ? 0.0f : part >= 1.0f ? 1.0f : part;
    }
    std::string fillOf(cc::rgb_t const& colour) const
    {
        constexpr char digits[] = "0123456789abcdef";
        std::string result = "#";
        for (float const value : colour) {
            auto const byte = static_cast<unsigned int>(std::lround(partOf(value) * 255.0f));
            result += {digits[byte >> 4], digits[byte & 15]};
        }
        return result;
    }

private:
    float minimum_;
    float range_;
};

std::string text(double x, double y, char const* anchor, std::string const& content)
{
    return "<text x=\"" + decimal(x) + "\" y=\"" + decimal(y) + "\" text-anchor=\"" + anchor +
           "\">" + escaped(content) + "</text>\n";
}

std::string rectangle(double x, double y, double w, double h, std::string const& fill)
{
    return "<rect x=\"" + decimal(x) + "\" y=\"" + decimal(y) + "\" width=\"" + decimal(w) +
           "\" height=\"" + decimal(h) + "\" fill=\"" + fill + "\"/>\n";
}

std::string grid(cc::lut_t const& table)
{
    std::string lines;
    std::string const whole = std::to_string(panel);
    for (int i = 0; i <= 4; ++i) {
        std::string const place = std::to_string(panel * i / 4);
        lines += "M" + place + " 0v" + whole + "M0 " + place + "h" + whole;
    }
    return "<path class=\"grid\" d=\"" + lines + "\" stroke=\"#ddd\" fill=\"none\"/>\n" +
           text(0, panel + 18, "middle", shortest(table.domainMin)) +
           text(panel, panel + 18, "middle", shortest(table.domainMax)) +
           text(-8, panel + 4, "end", shortest(table.domainMin)) +
           text(-8, 4, "end", shortest(table.domainMax));
}

std::string curve(Domain const& domain, cc::lut_t::processor_t const& lookup, std::size_t channel,
                  char const* name, char const* colour)
{
    std::string points;
    for (int i = 0; i <= samples; ++i) {
        float const part = static_cast<float>(i) / samples;
        float const in = domain.colourAt(part);
        float const out = domain.partOf(lookup.process({in, in, in})[channel]);
        points += decimal(panel * double{part}) + "," + decimal(panel * (1.0 - double{out})) + " ";
    }
    return std::string("<polyline class=\"curve ") + name +
           "\" fill=\"none\" stroke-width=\"2\" stroke=\"" + colour + "\" points=\"" + points +
           "\"/>\n";
}

/// Rectangles that lie side by side. They are drawn a little larger than they are, without
/// smoothed edges, so that no seams show.
std::string tiles(std::string const& rectangles)
{
    return "<g shape-rendering=\"crispEdges\">\n" + rectangles + "</g>\n";
}

std::string moved(int x, int y, std::string const& elements)
{
    return "<g transform=\"translate(" + std::to_string(x) + " " + std::to_string(y) + ")\">\n" +
           elements + "</g>\n";
}

} // namespace

std::string lutCurves(cc::lut_t const& table, cc::lut_t::processor_t const& lookup)
{
    Domain const domain(table);
    if (table.kind != cc::lut_t::k3D)
        return grid(table) + curve(domain, lookup, 0, "all", "#333333");
    return grid(table) + curve(domain, lookup, 2, "blue", "#2255dd") +
           curve(domain, lookup, 1, "green", "#22aa33") +
           curve(domain, lookup, 0, "red", "#dd2222");
}

std::string lutSlice(cc::lut_t const& table, cc::lut_t::processor_t const& lookup, float slice,
                     int most)
{
    Domain const domain(table);
    std::string result;
    int const count = std::clamp(table.size, 2, most);
    double const side = double{panel} / count;
    float const blue = domain.colourAt(slice);
    for (int y = 0; y < count; ++y)
        for (int x = 0; x < count; ++x) {
            auto const step = static_cast<float>(count - 1);
            cc::rgb_t const in{domain.colourAt(static_cast<float>(x) / step),
                               domain.colourAt(static_cast<float>(y) / step), blue};
            result += rectangle(x * side, (count - 1 - y) * side, side + 0.3, side + 0.3,
                                domain.fillOf(lookup.process(in)));
        }
    return tiles(result);
}

std::string lutRamps(cc::lut_t const& table, cc::lut_t::processor_t const& lookup)
{
    Domain const domain(table);
    std::string result;
    double const step = double{panel} / samples;
    for (int i = 0; i < samples; ++i) {
        float const grey = domain.colourAt(static_cast<float>(i) / (samples - 1));
        cc::rgb_t const in{grey, grey, grey};
        double const x = i * step;
        result += rectangle(x, 0, step + 0.3, panel / 2, domain.fillOf(in));
        result += rectangle(x, panel / 2, step + 0.3, panel / 2, domain.fillOf(lookup.process(in)));
    }
    return tiles(result);
}

std::string plotLut(cc::lut_t const& table, cc::lut_t::processor_t const& lookup, float slice)
{
    Domain const domain(table);
    bool const isCube = table.kind == cc::lut_t::k3D;
    std::string const size = std::to_string(table.size);
    std::string const title =
        clipped(table.title, 60) +
        (isCube ? " (" + size + " x " + size + " x " + size + ")" : " (curve)");
    std::string const w = std::to_string(width), h = std::to_string(height);
    std::string const svg = "<svg xmlns=\"http://www.w3.org/2000/svg\" role=\"img\" width=\"" + w +
                            "\" height=\"" + h + "\" viewBox=\"0 0 " + w + " " + h +
                            "\" font-family=\"sans-serif\" font-size=\"12\">\n<title>" +
                            escaped(title) +
                            "</title>\n<rect width=\"100%\" height=\"100%\" fill=\"white\"/>\n" +
                            text(left, 30, "start", title);
    std::string curves = lutCurves(table, lookup), side;
    if (isCube) {
        curves += text(panel / 2, panel + 18, "middle", "along the neutral axis");
        side = lutSlice(table, lookup, slice, 33) +
               text(panel / 2, panel + 18, "middle",
                    "red to the right, green upwards, blue " + shortest(domain.colourAt(slice)));
    } else {
        side = lutRamps(table, lookup) +
               text(panel / 2, panel + 18, "middle", "a grey ramp, and behind the table");
    }
    return svg + moved(left, top, curves) + moved(sliceLeft, top, side) + "</svg>\n";
}
