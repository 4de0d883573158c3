// Adobe Cube LUT Specification 1.0. A whole file with a cube of two points along each edge:
//
//     # warm to cold
//     TITLE "Swap of red and blue"
//     LUT_3D_SIZE 2
//     DOMAIN_MIN 0.0 0.0 0.0
//     DOMAIN_MAX 1.0 1.0 1.0
//
//     0.0 0.0 0.0
//     0.0 0.0 1.0
//     0.0 1.0 0.0
//     0.0 1.0 1.0
//     1.0 0.0 0.0
//     1.0 0.0 1.0
//     1.0 1.0 0.0
//     1.0 1.0 1.0
//
// Red varies fastest. LUT_1D_SIZE announces a curve, of which the first column is read.
// LUT_1D_INPUT_RANGE and LUT_3D_INPUT_RANGE, with two numbers, are an older form of the domain.
// Lines that begin with "#" are comments; an empty line ends the data. A file may hold several
// tables: all their sizes stand in the one header, and the blocks of data are apart by one empty
// line each.

#include <korvane/colour/lut_t.h>

#include <korvane/colour/lut_text_p.h>

#include <algorithm>
#include <string>

namespace cc {

namespace {

constexpr int curveSize = 1024;
constexpr long long longestCurve = 65536; // the format's own limit

/// Where the rows of the table go that is read.
struct rows_t {
    unsigned short* target = nullptr;
    std::size_t columns = 0;
    std::size_t expected = 0;
    /// As many of them as there is room for.
    std::size_t room = 0;
    std::size_t read = 0;
    rgb_t minimum{0.0f, 0.0f, 0.0f};
    rgb_t maximum{1.0f, 1.0f, 1.0f};

    bool add(std::string_view line)
    {
        if (!target || read == room)
            return false;
        char const* at = line.data();
        char const* const end = at + line.size();
        for (std::size_t i = 0; i < columns; ++i) {
            float v = qdcstr2float(at, end);
            if (minimum[i] != 0.0f || maximum[i] != 1.0f) // 0 to 1 would leave it as it is
                v = (v - minimum[i]) / (maximum[i] - minimum[i]);
            float const clamped = !(v > 0.0f) ? 0.0f : v >= 1.0f ? 1.0f : v;
            *target++ = static_cast<unsigned short>(clamped * 65535.0f);
        }
        ++read;
        return true;
    }
};

/// A curve of any length as 1024 values, each that of the row at or before its place.
void resample(vec_t<unsigned short> const& rows, vec_t<unsigned short>& table)
{
    double const step = static_cast<double>(rows.size() - 1) / 1023.0;
    for (std::size_t i = 0; i < table.size(); ++i)
        table[i] = rows[static_cast<std::size_t>(static_cast<double>(i) * step)];
}

} // namespace

int lut_t::readCUBE(tfreader_t& reader, unsigned long index)
{
    rows_t rows;
    vec_t<unsigned short> curve;
    bool skipping = false;
    bool inData = false;
    unsigned long counter = 0;

    std::string_view line;
    std::string_view value;
    while (reader.readView(line)) {
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
        } else if (skipping) {
            continue;
        } else if (inData) {
            if (!rows.add(line))
                return kBadData;
        } else if (tok(line, "TITLE", value)) {
            continue;
        } else if (tok(line, "LUT_1D_SIZE", value)) {
            if (counter++ != index)
                continue;
            long long const length = leadingInteger(value);
            if (length < 1 || length > longestCurve)
                return kBadData;
            rows.expected = rows.room = static_cast<std::size_t>(length);
            kind = k1D;
            size = curveSize;
            table.clear();
            table.resize(curveSize);
            curve.clear();
            curve.resize(rows.expected);
            rows.target = curve.data();
            rows.columns = 1;
        } else if (tok(line, "LUT_3D_SIZE", value)) {
            if (counter++ != index)
                continue;
            long long const edge = leadingInteger(value);
            if (edge < 1 || edge > kLongestEdge)
                return kBadData;
            kind = k3D;
            size = static_cast<int>(edge);
            rows.expected = static_cast<std::size_t>(edge * edge * edge);
            rows.room = rowsThatFit(rows.expected, reader.fileSize());
            table.clear();
            table.resize(3 * rows.room);
            rows.target = table.data();
            rows.columns = 3;
        } else if (tok(line, "DOMAIN_MIN", value)) {
            if (findNumbers(value, 3, rows.minimum.data()))
                domainMin = *std::min_element(rows.minimum.begin(), rows.minimum.end());
        } else if (tok(line, "DOMAIN_MAX", value)) {
            if (findNumbers(value, 3, rows.maximum.data()))
                domainMax = *std::max_element(rows.maximum.begin(), rows.maximum.end());
        } else if (tok(line, "LUT_1D_INPUT_RANGE", value) ||
                   tok(line, "LUT_3D_INPUT_RANGE", value)) {
            float range[2];
            if (findNumbers(value, 2, range)) {
                domainMin = range[0];
                domainMax = range[1];
                rows.minimum.fill(domainMin);
                rows.maximum.fill(domainMax);
            }
        } else {
            // The first row of data, of the first table.
            counter = 1;
            skipping = index != 0;
            inData = !skipping;
            if (inData && !rows.add(line))
                return kBadData;
        }
    }
    if (kind == k1D && !curve.empty())
        resample(curve, table);
    return rows.read == rows.expected ? kSuccess : kBadData;
}

int lut_t::writeCUBE(int fd, char const* fileName, int* error) const
{
    lut_output_t out(fd);
    out << "# Generated by Brovo\n"
        << "TITLE \"" << titleFor(fileName) << "\"\n"
        << "LUT_3D_SIZE " << std::to_string(size) << "\n";
    (out << "DOMAIN_MIN ").row({domainMin, domainMin, domainMin});
    (out << "DOMAIN_MAX ").row({domainMax, domainMax, domainMax});
    out << '\n';
    auto const step =
        static_cast<float>(static_cast<double>(domainMax - domainMin) * 1.5259021896696422e-5);
    auto const scaled = [&](std::size_t i) {
        float const product = static_cast<float>(table[i]) * step;
        return product + domainMin;
    };
    std::size_t const edge = static_cast<std::size_t>(std::clamp(size, 0, 1 << 20));
    std::size_t const rows = std::min(edge * edge * edge, table.size() / 3);
    for (std::size_t k = 0; k < 3 * rows; k += 3)
        out.row({scaled(k), scaled(k + 1), scaled(k + 2)});
    int const failure = out.finish();
    if (error)
        *error = failure;
    return kSuccess;
}

} // namespace cc
