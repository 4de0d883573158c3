#include "LutPlot.h"

#include "Numbers.h"

#include <algorithm>
#include <charconv>
#include <cmath>

namespace {

constexpr int panel = 320;
constexpr int left = 60;
constexpr int top = 50;
constexpr int sliceLeft = left + panel + 60;
constexpr int width = sliceLeft + panel + 20;
constexpr int height = top + panel + 60;
constexpr int samples = 160;

std::string number(double value, int digits = 2)
{
    char text[400];
    auto const end =
        std::to_chars(std::begin(text), std::end(text), value, std::chars_format::fixed, digits)
            .ptr;
    return {text, end};
}

std::string escaped(std::string const& text)
{
    std::string result;
    for (char const c : text)
        switch (c) {
        case '&':
            result += "&amp;";
            break;
        case '<':
            result += "&lt;";
            break;
        case '>':
            result += "&gt;";
            break;
        default:
            // XML has no place for control characters.
            result += static_cast<unsigned char>(c) < ' ' ? ' ' : c;
        }
    return result;
}

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
    return "<text x=\"" + number(x, 0) + "\" y=\"" + number(y, 0) + "\" text-anchor=\"" + anchor +
           "\">" + escaped(content) + "</text>\n";
}

std::string rectangle(double x, double y, double w, double h, std::string const& fill)
{
    return "<rect x=\"" + number(x) + "\" y=\"" + number(y) + "\" width=\"" + number(w) +
           "\" height=\"" + number(h) + "\" fill=\"" + fill + "\"/>\n";
}

std::string grid(cc::lut_t const& table)
{
    std::string lines;
    for (int i = 0; i <= 4; ++i) {
        std::string const x = number(left + panel * i / 4.0, 0);
        std::string const y = number(top + panel * i / 4.0, 0);
        lines += "M" + x + " " + std::to_string(top) + "v" + std::to_string(panel) + "M" +
                 std::to_string(left) + " " + y + "h" + std::to_string(panel);
    }
    return "<path d=\"" + lines + "\" stroke=\"#ddd\" fill=\"none\"/>\n" +
           text(left, top + panel + 18, "middle", shortest(table.domainMin)) +
           text(left + panel, top + panel + 18, "middle", shortest(table.domainMax)) +
           text(left - 8, top + panel + 4, "end", shortest(table.domainMin)) +
           text(left - 8, top + 4, "end", shortest(table.domainMax));
}

std::string curve(Domain const& domain, cc::lut_t::processor_t const& lookup, std::size_t channel,
                  char const* colour)
{
    std::string points;
    for (int i = 0; i <= samples; ++i) {
        float const part = static_cast<float>(i) / samples;
        float const in = domain.colourAt(part);
        float const out = domain.partOf(lookup.process({in, in, in})[channel]);
        points += number(left + panel * double{part}) + "," +
                  number(top + panel * (1.0 - double{out})) + " ";
    }
    return std::string("<polyline fill=\"none\" stroke-width=\"2\" stroke=\"") + colour +
           "\" points=\"" + points + "\"/>\n";
}

/// Rectangles that lie side by side. They are drawn a little larger than they are, without
/// smoothed edges, so that no seams show.
std::string tiles(std::string const& rectangles)
{
    return "<g shape-rendering=\"crispEdges\">\n" + rectangles + "</g>\n";
}

/// Red to the right, green upwards.
std::string cubeSlice(Domain const& domain, cc::lut_t::processor_t const& lookup, int edge,
                      float slice)
{
    std::string result;
    int const count = std::clamp(edge, 2, 33);
    double const side = double{panel} / count;
    float const blue = domain.colourAt(slice);
    for (int y = 0; y < count; ++y)
        for (int x = 0; x < count; ++x) {
            auto const step = static_cast<float>(count - 1);
            cc::rgb_t const in{domain.colourAt(static_cast<float>(x) / step),
                               domain.colourAt(static_cast<float>(y) / step), blue};
            result += rectangle(sliceLeft + x * side, top + (count - 1 - y) * side, side + 0.3,
                                side + 0.3, domain.fillOf(lookup.process(in)));
        }
    return tiles(result) + text(sliceLeft + panel / 2, top + panel + 18, "middle",
                                "red to the right, green upwards, blue " + shortest(blue));
}

std::string ramps(Domain const& domain, cc::lut_t::processor_t const& lookup)
{
    std::string result;
    double const step = double{panel} / samples;
    for (int i = 0; i < samples; ++i) {
        float const grey = domain.colourAt(static_cast<float>(i) / (samples - 1));
        cc::rgb_t const in{grey, grey, grey};
        double const x = sliceLeft + i * step;
        result += rectangle(x, top, step + 0.3, panel / 2, domain.fillOf(in));
        result +=
            rectangle(x, top + panel / 2, step + 0.3, panel / 2, domain.fillOf(lookup.process(in)));
    }
    return tiles(result) + text(sliceLeft + panel / 2, top + panel + 18, "middle",
                                "a grey ramp, and behind the table");
}

} // namespace

std::string plotLut(cc::lut_t const& table, cc::lut_t::processor_t const& lookup, float slice)
{
    Domain const domain(table);
    bool const isCube = table.kind == cc::lut_t::k3D;
    std::string const size = std::to_string(table.size);
    std::string svg = "<svg xmlns=\"http://www.w3.org/2000/svg\" width=\"" + std::to_string(width) +
                      "\" height=\"" + std::to_string(height) + "\" viewBox=\"0 0 " +
                      std::to_string(width) + " " + std::to_string(height) +
                      "\" font-family=\"sans-serif\" font-size=\"12\">\n"
                      "<rect width=\"100%\" height=\"100%\" fill=\"white\"/>\n";
    svg +=
        text(left, 30, "start",
             table.title + (isCube ? " (" + size + " x " + size + " x " + size + ")" : " (curve)"));
    svg += grid(table);
    if (isCube) {
        svg += curve(domain, lookup, 2, "#2255dd");
        svg += curve(domain, lookup, 1, "#22aa33");
        svg += curve(domain, lookup, 0, "#dd2222");
        svg += text(left + panel / 2, top + panel + 18, "middle", "along the neutral axis");
        svg += cubeSlice(domain, lookup, table.size, slice);
    } else {
        svg += curve(domain, lookup, 0, "#333333");
        svg += ramps(domain, lookup);
    }
    return svg + "</svg>\n";
}
