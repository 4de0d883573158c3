#include "LutDiagnosis.h"

#include <korvane/colour/lut_t.h>

#include <cstdlib>
#include <string_view>

namespace {

constexpr std::size_t longestLine = 1 << 20;

/// A file's lines with their numbers.
class Lines {
public:
    explicit Lines(std::string const& path) : reader_(cc::tfreader_t::kUTF8, longestLine)
    {
        reader_.open(path.c_str());
    }
    bool next(std::string& line)
    {
        number_ += 1;
        return reader_.readln(line);
    }
    /// Of the line read last; the one behind the last line at the end.
    unsigned long number() const { return number_; }
    LutFault fault(std::string text) const { return {number_, std::move(text)}; }

private:
    cc::tfreader_t reader_;
    unsigned long number_ = 0;
};

bool isSpace(char c)
{
    return c == ' ' || (c >= '\t' && c <= '\r');
}

/// Whether a line is a keyword, white space and a value.
bool hasKey(std::string const& line, std::string_view key)
{
    return line.starts_with(key) && line.size() > key.size() && isSpace(line[key.size()]);
}

long long valueOf(std::string const& line, std::string_view key)
{
    return std::strtoll(line.c_str() + key.size(), nullptr, 10);
}

std::string rowsText(unsigned long long count)
{
    return std::to_string(count) + (count == 1 ? " row" : " rows");
}

/// The start of a line, for messages.
std::string shown(std::string const& line)
{
    return '"' + line.substr(0, 40) + '"';
}

char const* const headerKeys[] = {"TITLE", "LUT_1D_SIZE", "LUT_3D_SIZE", "LUT_1D_INPUT_RANGE",
                                  "LUT_3D_INPUT_RANGE"};

LutFault diagnoseCube(Lines& lines, unsigned long index)
{
    unsigned long counter = 0;
    unsigned long long expected = 0;
    unsigned long long rows = 0;
    unsigned long sizeLine = 0;
    bool skipping = false;
    bool inData = false;
    for (std::string line; lines.next(line);) {
        if (line.starts_with('#'))
            continue;
        if (line.empty()) {
            if (inData)
                break;
            if (skipping) {
                skipping = counter < index;
                inData = counter == index;
                ++counter;
            }
            continue;
        }
        if (skipping)
            continue;
        if (!inData) {
            bool const is1D = hasKey(line, "LUT_1D_SIZE");
            if (is1D || hasKey(line, "LUT_3D_SIZE")) {
                if (counter++ != index)
                    continue;
                std::string const key = is1D ? "LUT_1D_SIZE" : "LUT_3D_SIZE";
                long long const size = valueOf(line, key);
                long long const limit = is1D ? 65536 : 256;
                if (size < 1 || size > limit)
                    return lines.fault(key + " must be 1 to " + std::to_string(limit) + ": " +
                                       shown(line));
                expected = static_cast<unsigned long long>(is1D ? size : size * size * size);
                sizeLine = lines.number();
                continue;
            }
            if (hasKey(line, "TITLE") || hasKey(line, "DOMAIN_MIN") || hasKey(line, "DOMAIN_MAX") ||
                hasKey(line, "LUT_1D_INPUT_RANGE") || hasKey(line, "LUT_3D_INPUT_RANGE"))
                continue;
            counter = 1;
            skipping = index != 0;
            if (skipping)
                continue;
            inData = true;
        }
        if (expected == 0)
            return lines.fault("no size stands before this row of data: " + shown(line));
        if (rows == expected)
            return lines.fault("a row more than the " + rowsText(expected) + " that line " +
                               std::to_string(sizeLine) + " announces: " + shown(line));
        ++rows;
    }
    return lines.fault("the data end after " + rowsText(rows) + ", and line " +
                       std::to_string(sizeLine) + " announces " + std::to_string(expected));
}

LutFault diagnoseMGA(Lines& lines)
{
    bool inHeader = false;
    bool inData = false;
    long long count = 0;
    unsigned long countLine = 0;
    std::string line;
    while (!inData && lines.next(line)) {
        if (line.starts_with("#HEADER")) {
            inHeader = true;
        } else if (line.starts_with("#END")) {
            inHeader = false;
        } else if (!inHeader && hasKey(line, "in")) {
            count = valueOf(line, "in");
            countLine = lines.number();
            if (count < 0 || count > 16777216)
                return lines.fault("\"in\" must be 0 to 16777216: " + shown(line));
        } else if (!inHeader && hasKey(line, "values")) {
            inData = true;
        }
    }
    if (!inData)
        return lines.fault("the file ends without a line \"values\" and data behind it");

    auto const entries = static_cast<unsigned long long>(count);
    unsigned long long rows = 0;
    bool placesCountEntries = false;
    while (lines.next(line) && !line.empty()) {
        unsigned long long const place = std::strtoull(line.c_str(), nullptr, 10);
        placesCountEntries = placesCountEntries || place % 3 != 0;
        if (place >= (placesCountEntries ? entries : 3 * entries))
            return lines.fault((countLine ? "its place is beyond the " + std::to_string(count) +
                                                " entries that line " + std::to_string(countLine) +
                                                " announces: "
                                          : "no line \"in\" stands before this row: ") +
                               shown(line));
        ++rows;
    }
    return lines.fault("the data end after " + rowsText(rows) + ", and line " +
                       std::to_string(countLine) + " announces " + std::to_string(count));
}

/// Why a file is of neither format: the first line that was meant to say it, if there is one.
LutFault diagnoseHeader(Lines& lines)
{
    for (std::string line; lines.next(line);) {
        std::size_t start = 0;
        while (start < line.size() && isSpace(line[start]))
            ++start;
        for (char const* const key : headerKeys)
            if (std::string_view(line).substr(start).starts_with(key))
                return lines.fault(
                    std::string(key) +
                    " must begin its line and be followed by white space: " + shown(line));
        if (line.starts_with("#type:"))
            return lines.fault("the type is not \"Pandora 3D LUT file\": " + shown(line));
    }
    return {0, "neither a .cube file, with TITLE, LUT_1D_SIZE or LUT_3D_SIZE at the start of a "
               "line, nor a .mga file, with \"#type: Pandora 3D LUT file\""};
}

} // namespace

LutFault diagnoseLut(std::string const& path, unsigned int format, unsigned long index)
{
    Lines lines(path);
    switch (format) {
    case cc::lut_t::kMGA:
        return diagnoseMGA(lines);
    case cc::lut_t::kCUBE:
        return diagnoseCube(lines, index);
    default:
        return diagnoseHeader(lines);
    }
}
