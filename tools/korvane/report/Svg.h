#pragma once

#include <string>
#include <string_view>

/// A picture for the page: elements with classes, which the page's style colours.
///
///     Svg svg(1100, 200);
///     svg.rect(10, 10, 50, 20, "c0", "the first clip");
///     page += svg.scrollHtml("clips", "Clips", "Two clips on a timeline.");
///
/// Text that a function takes is escaped by it.
class Svg {
public:
    Svg(double width, double height) : width_(width), height_(height) {}

    void setHeight(double height) noexcept { height_ = height; }
    /// `tooltip` is shown where the pointer rests.
    void rect(double x, double y, double width, double height, std::string_view classes,
              std::string_view tooltip = {});
    void line(double x1, double y1, double x2, double y2, std::string_view classes);
    void path(std::string const& data, std::string_view classes, std::string_view tooltip = {});
    /// Begins at `x`, or with the class "mid" or "end" has its middle or end there.
    void text(double x, double y, std::string_view content, std::string_view classes = {});
    /// Elements as they are.
    void add(std::string const& elements) { body_ += elements; }

    /// As it stands in a page. `id` is unique in it.
    std::string html(std::string const& id, std::string_view title,
                     std::string_view description) const;
    /// The same in a box that scrolls where the page is too narrow.
    std::string scrollHtml(std::string const& id, std::string_view title,
                           std::string_view description) const;

private:
    double width_, height_;
    std::string body_;
};

/// As much of a text as fits into a width in pixels, at 12 pixels a line; nothing where that is
/// less than two characters.
std::string fitted(std::string_view text, double width);
/// The width that `fitted` takes a text for.
double widthOf(std::string_view text);
