// The Pandora 3D LUT file. A whole file with a cube of two points along each edge:
//
//     #HEADER
//     #filename: swap
//     #type: Pandora 3D LUT file
//     #format: 1.00
//     #created: n/a
//     #owner: n/a
//     #title: Swap of red and blue
//     #END
//
//     channel 3d
//     in 8
//     out 65536
//
//     format lut
//
//     values	red	green	blue
//     0	0	0	0
//     12	65535	0	0
//     6	0	65535	0
//     18	65535	65535	0
//     3	0	0	65535
//     15	65535	0	65535
//     9	0	65535	65535
//     21	65535	65535	65535
//
// "in" is the number of entries and "values" names the columns behind the first, which holds the
// place of the row. Places count values, as here, or entries, as "0, 1, 2 ..." does: the
// first place that is no multiple of 3 tells. An empty line ends the data.

#include <korvane/colour/lut_t.h>

#include <korvane/colour/lut_text_p.h>

#include <algorithm>
#include <cmath>
#include <cstdint>

namespace cc {

namespace {

/// Which of a row's three columns are stored first, second and third.
constexpr std::size_t orders[6][3] = {{0, 1, 2}, {0, 2, 1}, {2, 0, 1},
                                      {2, 1, 0}, {1, 0, 2}, {1, 2, 0}};
constexpr int orderOfEntries = 3;
constexpr long long mostEntries = 16777216; // a cube of 256

/// The order that the words of a "values" line stand for; `order` if the first is no colour.
int orderOf(std::string_view const (&words)[3], int order)
{
    if (words[0] == "red")
        return words[1] == "green" && words[2] == "blue" ? 0 : 1;
    if (words[0] == "blue")
        return words[1] == "red" ? 2 : 3;
    if (words[0] == "green")
        return words[1] == "red" ? 4 : 5;
    return order;
}

/// The largest edge whose cube is at most `count`, which is not negative.
int cubeRoot(long long count)
{
    auto edge = static_cast<long long>(std::cbrt(static_cast<double>(count)));
    while (edge * edge * edge > count)
        --edge;
    while ((edge + 1) * (edge + 1) * (edge + 1) <= count)
        ++edge;
    return static_cast<int>(edge);
}

} // namespace

int lut_t::readMGA(tfreader_t& reader, unsigned long)
{
    kind = k3D;
    bool inHeader = false;
    int order = 0;
    long long count = 0;

    std::string_view line;
    std::string_view value;
    for (bool inData = false; !inData && reader.readView(line);) {
        std::string_view words[3];
        if (line.starts_with("#HEADER")) {
            inHeader = true;
        } else if (line.starts_with("#END")) {
            inHeader = false;
        } else if (inHeader) {
            if (tok(line, "#title:", value))
                title = value;
        } else if (tok(line, "in", value)) {
            count = leadingInteger(value);
            if (count < 0 || count > mostEntries)
                return kBadData;
            size = cubeRoot(count);
            table.clear();
            table.resize(3 * rowsThatFit(static_cast<std::size_t>(count), reader.fileSize()));
        } else if (tok(line, "values", value)) {
            if (findWords(value, words))
                order = orderOf(words, order);
            inData = true;
        }
    }

    long long rows = 0;
    bool placesCountEntries = false;
    while (reader.readView(line) && !line.empty()) {
        char const* at = line.data();
        char const* const end = at + line.size();
        std::uint64_t place = qdcstr2unsigned(at, end);
        std::uint64_t const columns[3] = {qdcstr2unsigned(at, end), qdcstr2unsigned(at, end),
                                          qdcstr2unsigned(at, end)};
        if (place % 3 != 0 && !placesCountEntries) {
            placesCountEntries = true;
            order = orderOfEntries;
        }
        if (placesCountEntries && __builtin_mul_overflow(place, std::uint64_t(3), &place))
            return kBadData;
        if (place >= table.size())
            return kBadData;
        for (std::size_t i = 0; i < 3; ++i)
            table[place + i] = static_cast<unsigned short>(columns[orders[order][i]]);
        ++rows;
    }
    return rows == count ? kSuccess : kBadData;
}

int lut_t::writeMGA(int fd, char const* fileName, int* error) const
{
    lut_output_t out(fd);
    std::size_t const edge = static_cast<std::size_t>(std::clamp(size, 0, 1 << 20));
    out << "#HEADER\n"
        << "#filename: " << fileName << "\n"
        << "#type: Pandora 3D LUT file\n"
        << "#format: 1.00\n"
        << "#created: n/a\n"
        << "#owner: n/a\n"
        << "#title: " << titleFor(fileName) << "\n"
        << "#END\n"
        << "\n"
        << "channel 3d\n"
        << "in " << std::uint64_t(edge * edge * edge) << "\n"
        << "out 65536\n"
        << "\n"
        << "format lut\n"
        << "\n"
        << "values\tred\tgreen\tblue\n";
    // Blue varies fastest here. The table of another kind of lookup ends before the cube does.
    bool inTable = true;
    for (std::size_t x = 0; x < edge && inTable; ++x)
        for (std::size_t y = 0; y < edge && inTable; ++y)
            for (std::size_t z = 0; z < edge && inTable; ++z) {
                std::size_t const k = 3 * ((edge * z + y) * edge + x);
                inTable = k + 2 < table.size();
                if (inTable)
                    out << std::uint64_t(k) << '\t' << std::uint64_t(table[k]) << '\t'
                        << std::uint64_t(table[k + 1]) << '\t' << std::uint64_t(table[k + 2])
                        << '\n';
            }
    int const failure = out.finish();
    if (error)
        *error = failure;
    return kSuccess;
}

} // namespace cc
