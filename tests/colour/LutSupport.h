#pragma once

#include <korvane/colour/lut_t.h>

#include <support/TemporaryFolder.h>

#include <initializer_list>
#include <string>
#include <string_view>
#include <vector>

/// What came out of reading one file.
struct ReadLut {
    int code;
    cc::lut_t lut;

    std::vector<int> values() const { return {lut.table.begin(), lut.table.end()}; }
};

inline ReadLut readLut(std::string_view text, unsigned long index = 0,
                       std::string const& name = "look.cube")
{
    TemporaryFolder const folder;
    ReadLut result;
    result.code = result.lut.read(folder.write(name, text).c_str(), index);
    return result;
}

/// The bytes that a writer hands over.
inline std::string written(cc::lut_t const& lut, unsigned int format,
                           std::string const& name = "written.out")
{
    TemporaryFolder const folder;
    lut.write(folder.path(name).c_str(), format);
    return folder.read(name);
}

/// A cube with these values in the order of storage.
inline cc::lut_t cubeOf(int edge, std::initializer_list<int> values)
{
    cc::lut_t lut;
    lut.makeCube(edge);
    std::size_t i = 0;
    for (int const value : values)
        lut.table[i++] = static_cast<unsigned short>(value);
    return lut;
}

/// Values that all differ, from the whole range.
inline cc::lut_t scatteredCube(int edge)
{
    cc::lut_t lut;
    lut.makeCube(edge);
    for (std::size_t i = 0; i < lut.table.size(); ++i)
        lut.table[i] = static_cast<unsigned short>(i * 40503u + 1);
    return lut;
}
