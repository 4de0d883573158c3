#include "LutFile.h"

#include "LutDiagnosis.h"
#include "ToolError.h"

#include <korvane/colour/multilut_t.h>

#include <algorithm>

namespace {

ToolError refusal(ReopenableFile const& file, int code, unsigned int format, unsigned long index)
{
    if (code == cc::kCannotOpen)
        return inputOutput(file.shown(), "it cannot be opened or read twice");
    LutFault const fault = diagnoseLut(file.path(), format, index);
    return fault.line ? badInput(file.shown(), fault.line, fault.text)
                      : badInput(file.shown(), fault.text);
}

/// The number of a descriptor is no title.
cc::lut_t withoutBorrowedName(ReopenableFile const& file, cc::lut_t lut)
{
    if (file.isRenamed()) {
        if (lut.title == lut.name)
            lut.title.clear();
        lut.name.clear();
    }
    return lut;
}

} // namespace

cc::lut_t readLut(ReopenableFile const& file, unsigned long index)
{
    cc::lut_t lut;
    if (int const code = lut.read(file.path().c_str(), index))
        throw refusal(file, code, lut.format(), index);
    if (lut.table.empty())
        throw badInput(file.shown(), "it has no table " + std::to_string(index));
    return withoutBorrowedName(file, std::move(lut));
}

std::vector<cc::lut_t> readLuts(ReopenableFile const& file)
{
    cc::multilut_t luts;
    int const code = luts.read(file.path().c_str(), false);
    unsigned long const index = luts.tables.size();
    if (code != cc::kSuccess || index == 0) {
        cc::lut_t lut; // which format it is decides what is wrong with it
        unsigned int const format =
            index == 0 ? (lut.read(file.path().c_str(), 0), lut.format()) : luts.tables[0].format();
        if (code == cc::kSuccess)
            throw badInput(file.shown(), "it has no table");
        throw refusal(file, code, format, index);
    }
    for (cc::lut_t& lut : luts.tables)
        lut = withoutBorrowedName(file, std::move(lut));
    return std::move(luts.tables);
}

bool looksLikeLut(ReopenableFile const& file)
{
    QuietLibrary const quiet;
    cc::lut_t lut;
    lut.read(file.path().c_str(), 0);
    return lut.format() != 0;
}

char const* formatName(unsigned int format)
{
    return format == cc::lut_t::kMGA ? "Pandora 3D LUT (.mga)" : "Adobe Cube LUT (.cube)";
}

std::string sizeText(cc::lut_t const& lut)
{
    std::string const size = std::to_string(lut.size);
    return lut.kind == cc::lut_t::k3D ? "3D, " + size + " x " + size + " x " + size
                                      : "1D, " + size + " values";
}

std::vector<char const*> channelNames(cc::lut_t const& lut)
{
    if (lut.kind == cc::lut_t::k3D)
        return {"red", "green", "blue"};
    return {"all channels"};
}

std::pair<float, float> rangeOf(cc::lut_t const& lut, std::size_t channel)
{
    std::size_t const channels = channelNames(lut).size();
    unsigned short least = 65535;
    unsigned short greatest = 0;
    for (std::size_t i = channel; i < lut.table.size(); i += channels) {
        least = std::min(least, lut.table[i]);
        greatest = std::max(greatest, lut.table[i]);
    }
    auto const scaled = [&](unsigned short value) {
        return static_cast<float>(value) / 65535.0f * (lut.domainMax - lut.domainMin) +
               lut.domainMin;
    };
    return {scaled(least), scaled(greatest)};
}
