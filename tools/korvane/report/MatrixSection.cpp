#include "Html.h"
#include "Sections.h"
#include "Svg.h"

#include "../Markup.h"
#include "../MatrixText.h"
#include "../Numbers.h"

#include <algorithm>
#include <array>
#include <cmath>
#include <numbers>
#include <optional>
#include <vector>

namespace {

struct Point {
    double x, y;
};

/// The corners (0,0), (1,0), (1,1) and (0,1) of the unit square in the plane z = 0.
using Square = std::array<Point, 4>;

constexpr Square unitSquare = {{{0, 0}, {1, 0}, {1, 1}, {0, 1}}};

/// Where the corners come to lie, seen along z; none if one of them is not in front of w = 0, or
/// too far away for a number.
std::optional<Square> squareOf(Matrix const& matrix)
{
    Square square = unitSquare;
    for (Point& corner : square) {
        double const w = matrix(3, 0) * corner.x + matrix(3, 1) * corner.y + matrix(3, 3);
        double const x = matrix(0, 0) * corner.x + matrix(0, 1) * corner.y + matrix(0, 3);
        double const y = matrix(1, 0) * corner.x + matrix(1, 1) * corner.y + matrix(1, 3);
        corner = {x / w, y / w};
        if (!(w > 0) || !(std::abs(corner.x) < 1e150) || !(std::abs(corner.y) < 1e150))
            return std::nullopt;
    }
    return square;
}

/// Four digits, for the eye.
std::string rounded(double value)
{
    double const size = std::abs(value);
    if (size != 0 && (size < 1e-3 || size >= 1e6)) {
        double const unit = std::pow(10, std::floor(std::log10(size)) - 3);
        return shortest(std::round(value / unit) * unit);
    }
    return decimal(value, size < 10 ? 3 : 1);
}

/// A window on the plane, y upwards, that holds the unit square and the other one.
class View {
public:
    View(Square const& square, double side, double margin)
    {
        double left = 0, right = 1, bottom = 0, top = 1;
        for (Point const& corner : square) {
            left = std::min(left, corner.x);
            right = std::max(right, corner.x);
            bottom = std::min(bottom, corner.y);
            top = std::max(top, corner.y);
        }
        scale_ = (side - 2 * margin) / std::max(right - left, top - bottom);
        x_ = side / 2 - scale_ * (left / 2 + right / 2);
        y_ = side / 2 + scale_ * (bottom / 2 + top / 2);
    }

    double x(double value) const { return x_ + scale_ * value; }
    double y(double value) const { return y_ - scale_ * value; }
    std::string at(Point const& point) const
    {
        return decimal(x(point.x)) + " " + decimal(y(point.y));
    }
    std::string outline(Square const& square) const
    {
        return "M" + at(square[0]) + "L" + at(square[1]) + "L" + at(square[2]) + "L" +
               at(square[3]) + "z";
    }

private:
    double scale_, x_, y_;
};

std::string pictureHtml(Square const& square, double side, bool isLarge, std::string const& id,
                        std::string const& title)
{
    View const view(square, side, isLarge ? 64 : 22);
    Svg svg(side, side);
    svg.rect(0.5, 0.5, side - 1, side - 1, "frame");
    // The axes of the plane.
    svg.line(1, view.y(0), side - 1, view.y(0), "line");
    svg.line(view.x(0), 1, view.x(0), side - 1, "line");
    svg.path(view.outline(unitSquare), "unit");
    if (isLarge) {
        svg.text(view.x(0) - 5, view.y(0) + 13, "0", "end soft");
        svg.text(view.x(1), view.y(0) + 13, "1", "mid soft");
        svg.text(view.x(0) - 5, view.y(1) + 4, "1", "end soft");
        svg.text(side - 8, view.y(0) - 6, "x", "end soft");
        svg.text(view.x(0) + 7, 15, "y", "soft");
    }
    svg.path(view.outline(square), "c0");
    svg.path("M" + view.at(square[0]) + "L" + view.at(square[1]), "xaxis");
    svg.path("M" + view.at(square[0]) + "L" + view.at(square[3]), "yaxis");
    std::string corners;
    char const* const names[] = {"(0, 0)", "(1, 0)", "(1, 1)", "(0, 1)"};
    double const middle = (view.y(square[0].y) + view.y(square[2].y)) / 2;
    std::vector<Point> labels;
    for (std::size_t i = 0; i < 4; ++i) {
        std::string const place = "(" + rounded(square[i].x) + ", " + rounded(square[i].y) + ")";
        corners += std::string(i ? "; " : "") + names[i] + " goes to " + place;
        if (!isLarge)
            continue;
        double const x = view.x(square[i].x), y = view.y(square[i].y);
        double const half = widthOf(place) / 2 + 6;
        double const outwards = y > middle ? 1 : -1;
        Point label{std::clamp(x, half, side - half), y + (y > middle ? 18 : -9)};
        for (Point const& other : labels)
            if (std::abs(other.x - label.x) < 2 * half && std::abs(other.y - label.y) < 14)
                label.y = other.y + 14 * outwards;
        labels.push_back(label);
        svg.path("M" + decimal(x - 3) + " " + decimal(y) + "a3 3 0 1 0 6 0a3 3 0 1 0 -6 0z",
                 "point");
        svg.text(label.x, label.y, place, "mid");
    }
    return svg.html(id, title, corners + ".");
}

std::string numbersHtml(Matrix const& matrix)
{
    std::string html = "<div class=\"scroll\" tabindex=\"0\" role=\"region\" "
                       "aria-label=\"Matrix\"><table class=\"matrix\"><caption>Matrix</caption>\n";
    for (int row = 0; row < 4; ++row) {
        html += "<tr>";
        for (int column = 0; column < 4; ++column)
            html += "<td>" + shortest(matrix(row, column));
        html += "\n";
    }
    return html + "</table></div>\n";
}

std::string triple(KVVector3<double> const& v, double factor = 1, char const* unit = "")
{
    return rounded(v.x * factor) + unit + ", " + rounded(v.y * factor) + unit + ", " +
           rounded(v.z * factor) + unit;
}

/// The factors in the order in which they act, each with the square that the factors up to it make.
std::string factorsHtml(KVMatrix44Parameters<double> const& whole, std::string const& id)
{
    KVMatrix44Parameters<double> so;
    so.rotOrder = whole.rotOrder;
    std::string html;
    auto const add = [&](char const* name, std::string const& caption) {
        Matrix matrix;
        matrix.setTransformation(so);
        if (auto const square = squareOf(matrix))
            html += figure(pictureHtml(*square, 160, false, id + "-" + name,
                                       std::string("The square after ") + name),
                           caption);
    };
    so.rotation = whole.rotation;
    add("rotation", "1. rotate");
    so.scale = whole.scale;
    so.shear = whole.shear;
    add("scale", "2. shear and scale");
    so.translation = whole.translation;
    add("translation", "3. translate");
    return html;
}

} // namespace

std::string matrixHtml(ReopenableFile const& file, std::string const& id)
{
    Matrix const matrix = readMatrix(file.shown(), readFile(file.path()));
    KVMatrix44Parameters<double> factors;
    factors.rotOrder = rotationOrder;
    bool const isRegular = matrix.getTransformation(factors);

    Facts facts;
    facts.add("Determinant", rounded(matrix.determinant()));
    if (isRegular)
        facts.add("Translation x, y, z", triple(factors.translation))
            .add("Rotation about x, y, z",
                 triple(factors.rotation, 180 / std::numbers::pi, "\u00B0"))
            .add("Scale x, y, z", triple(factors.scale))
            .add("Shear x, y", rounded(factors.shear.x) + ", " + rounded(factors.shear.y));
    std::string html = facts.html();
    if (!isRegular)
        html += note("The matrix is singular: it has no factors.");

    std::string panels;
    if (auto const square = squareOf(matrix))
        panels = figure(pictureHtml(*square, 420, true, id + "-square",
                                    "What the matrix makes of the unit square"),
                        "The unit square, dashed, and what becomes of it in the plane z = 0, seen "
                        "along z");
    else
        html += note("A corner of the unit square goes to infinity or behind it: there is no "
                     "picture.");
    std::string aside = numbersHtml(matrix);
    if (isRegular)
        aside = "<div class=\"panels\">" + factorsHtml(factors, id) + "</div>\n" +
                legend({{"xaxis", "the side along x"}, {"yaxis", "the side along y"}}) + aside;
    return html + "<h3>The unit square</h3>\n<div class=\"panels\">" + panels +
           "<div class=\"aside\">" + aside + "</div></div>\n";
}
