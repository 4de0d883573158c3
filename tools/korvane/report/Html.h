#pragma once

#include <cstdint>
#include <string>
#include <string_view>
#include <vector>

// What the sections of a report are written with. Text that a function takes is escaped by it;
// names that end in `Html` hold markup that is put in as it is.

/// The most rows that a table of a report shows.
inline constexpr std::size_t mostRows = 400;
/// The most characters of a text from a file that a report shows in one place.
inline constexpr std::size_t mostText = 160;

/// A text from a file as it is shown: cut, escaped, and kept from turning the direction of what
/// stands around it.
std::string shownText(std::string_view text, std::size_t most = mostText);

/// "13 138", with spaces that do not break.
std::string grouped(std::uint64_t number);
/// "1 caption", "2 captions": the word takes an "s".
std::string counted(std::uint64_t number, std::string const& word);
/// "13 138 bytes"
std::string bytesText(std::uint64_t number);

/// A table in a box of its own, that scrolls where the page is too narrow.
class Table {
public:
    struct Column {
        std::string name;
        bool isNumber = false;
    };

    Table(std::string caption, std::vector<Column> columns);

    /// Beyond `mostRows` a row is counted only. The cells are markup.
    void row(std::vector<std::string> const& cellsHtml, std::string_view rowClass = {});
    bool isFull() const noexcept { return count_ >= mostRows; }
    /// Counts rows that are not made at all.
    void skip(std::uint64_t count) { count_ += count; }
    /// With what is left out told in a last row, in those words ("captions").
    std::string html(std::string const& things) const;

private:
    std::string caption_;
    std::vector<Column> columns_;
    std::string rows_;
    std::uint64_t count_ = 0;
};

/// A list of terms and what they are.
class Facts {
public:
    Facts& add(std::string const& term, std::string_view text);
    Facts& addHtml(std::string const& term, std::string const& html);
    std::string html() const;

private:
    std::string items_;
};

/// Coloured patches and what they mean; each has the class of what it explains.
struct LegendEntry {
    std::string patchClass;
    std::string text;
};
std::string legend(std::vector<LegendEntry> const& entries);

/// A picture, what it shows, and what else stands below that.
std::string figure(std::string const& pictureHtml, std::string_view caption,
                   std::string const& moreHtml = {});

/// "<p class="note">…</p>"
std::string note(std::string_view text);
