#include "Svg.h"

#include "../Markup.h"

namespace {

std::string attributes(std::string_view classes)
{
    return classes.empty() ? "" : " class=\"" + std::string(classes) + "\"";
}

/// The end of an element that may have a tooltip in it.
std::string ending(char const* element, std::string_view tooltip)
{
    if (tooltip.empty())
        return "/>\n";
    return "><title>" + escaped(tooltip) + "</title></" + element + ">\n";
}

/// By the first byte of a character, as common typefaces have them: wide scripts begin behind
/// U+2E80.
double widthOf(char lead)
{
    auto const byte = static_cast<unsigned char>(lead);
    if (byte >= 0x80)
        return byte < 0xC0 ? 0 : byte < 0xE2 ? 7.4 : byte == 0xE2 ? 8 : 12.5;
    constexpr std::string_view narrow = " !'()*,-./:;I[]fijlrt|", wide = "%@MWmw";
    return narrow.find(lead) != narrow.npos ? 4.8 : wide.find(lead) != wide.npos ? 11.6 : 7.6;
}

} // namespace

void Svg::rect(double x, double y, double width, double height, std::string_view classes,
               std::string_view tooltip)
{
    body_ += "<rect" + attributes(classes) + " x=\"" + decimal(x) + "\" y=\"" + decimal(y) +
             "\" width=\"" + decimal(width) + "\" height=\"" + decimal(height) + "\"" +
             ending("rect", tooltip);
}

void Svg::line(double x1, double y1, double x2, double y2, std::string_view classes)
{
    body_ += "<line" + attributes(classes) + " x1=\"" + decimal(x1) + "\" y1=\"" + decimal(y1) +
             "\" x2=\"" + decimal(x2) + "\" y2=\"" + decimal(y2) + "\"/>\n";
}

void Svg::path(std::string const& data, std::string_view classes, std::string_view tooltip)
{
    body_ += "<path" + attributes(classes) + " d=\"" + data + "\"" + ending("path", tooltip);
}

void Svg::text(double x, double y, std::string_view content, std::string_view classes)
{
    body_ += "<text" + attributes(classes) + " x=\"" + decimal(x) + "\" y=\"" + decimal(y) + "\">" +
             escaped(content) + "</text>\n";
}

std::string Svg::html(std::string const& id, std::string_view title,
                      std::string_view description) const
{
    std::string const w = decimal(width_), h = decimal(height_);
    return "<svg xmlns=\"http://www.w3.org/2000/svg\" role=\"img\" aria-labelledby=\"" + id +
           "-title " + id + "-desc\" width=\"" + w + "\" height=\"" + h + "\" viewBox=\"0 0 " + w +
           " " + h + "\">\n<title id=\"" + id + "-title\">" + escaped(title) +
           "</title>\n<desc id=\"" + id + "-desc\">" + escaped(description) + "</desc>\n" + body_ +
           "</svg>\n";
}

std::string Svg::scrollHtml(std::string const& id, std::string_view title,
                            std::string_view description) const
{
    return "<div class=\"scroll\" tabindex=\"0\" role=\"region\" aria-label=\"" + escaped(title) +
           "\">" + html(id, title, description) + "</div>\n";
}

double widthOf(std::string_view text)
{
    double width = 0;
    for (char const c : text)
        width += widthOf(c);
    return width;
}

std::string fitted(std::string_view text, double width)
{
    if (widthOf(text) <= width)
        return std::string(text);
    double used = 12; // the ellipsis
    std::size_t count = 0;
    for (char const c : text) {
        used += widthOf(c);
        if (used > width)
            break;
        count += (static_cast<unsigned char>(c) & 0xC0) != 0x80;
    }
    return count < 2 ? "" : clipped(text, count);
}
