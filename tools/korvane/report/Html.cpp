#include "Html.h"

#include "../Markup.h"

#include <utility>

std::string shownText(std::string_view text, std::size_t most)
{
    return "<bdi>" + escaped(clipped(text, most)) + "</bdi>";
}

std::string grouped(std::uint64_t number)
{
    std::string digits = std::to_string(number);
    for (std::size_t place = digits.size(); place > 3; place -= 3)
        digits.insert(place - 3, "\u202F");
    return digits;
}

std::string counted(std::uint64_t number, std::string const& word)
{
    return grouped(number) + " " + word + (number == 1 ? "" : "s");
}

std::string bytesText(std::uint64_t number)
{
    return counted(number, "byte");
}

Table::Table(std::string caption, std::vector<Column> columns)
    : caption_(std::move(caption)), columns_(std::move(columns))
{}

void Table::row(std::vector<std::string> const& cellsHtml, std::string_view rowClass)
{
    if (count_++ >= mostRows)
        return;
    rows_ += "<tr";
    if (!rowClass.empty())
        rows_.append(" class=\"").append(rowClass).append("\"");
    rows_ += ">";
    for (std::size_t i = 0; i < cellsHtml.size(); ++i)
        rows_.append(columns_[i].isNumber ? "<td class=\"n\">" : "<td>").append(cellsHtml[i]);
    rows_ += "\n";
}

std::string Table::html(std::string const& things) const
{
    std::string head;
    for (Column const& column : columns_)
        head += std::string("<th scope=\"col\"") + (column.isNumber ? " class=\"n\">" : ">") +
                escaped(column.name);
    std::string rest;
    if (count_ > mostRows)
        rest = "<tfoot><tr><td colspan=\"" + std::to_string(columns_.size()) + "\">and " +
               grouped(count_ - mostRows) + " more " + escaped(things) + "</tfoot>";
    return "<div class=\"scroll rows\" tabindex=\"0\" role=\"region\" aria-label=\"" +
           escaped(caption_) + "\"><table>\n<caption>" + escaped(caption_) +
           "</caption>\n<thead><tr>" + head + "</thead>\n<tbody>\n" + rows_ + "</tbody>" + rest +
           "</table></div>\n";
}

Facts& Facts::add(std::string const& term, std::string_view text)
{
    return addHtml(term, shownText(text));
}

Facts& Facts::addHtml(std::string const& term, std::string const& html)
{
    items_ += "<div><dt>" + escaped(term) + "</dt><dd>" + html + "</dd></div>\n";
    return *this;
}

std::string Facts::html() const
{
    return "<dl class=\"facts\">\n" + items_ + "</dl>\n";
}

std::string legend(std::vector<LegendEntry> const& entries)
{
    std::string items;
    for (LegendEntry const& entry : entries)
        items += "<li><svg class=\"patch\" width=\"16\" height=\"12\" aria-hidden=\"true\"><rect "
                 "class=\"" +
                 entry.patchClass +
                 "\" x=\"1\" y=\"1\" width=\"14\" height=\"10\" rx=\"2\"/></svg>" +
                 shownText(entry.text, 60) + "</li>";
    return "<ul class=\"legend\">" + items + "</ul>\n";
}

std::string figure(std::string const& pictureHtml, std::string_view caption,
                   std::string const& moreHtml)
{
    return "<figure>" + pictureHtml + "<figcaption>" + shownText(caption) + "</figcaption>" +
           moreHtml + "</figure>\n";
}

std::string note(std::string_view text)
{
    return "<p class=\"note\">" + shownText(text, 600) + "</p>\n";
}
