#pragma once

#include <korvane/colour/lut_t.h>

#include <gtest/gtest.h>
#include <support/Allocations.h>
#include <support/TemporaryFolder.h>

#include <initializer_list>
#include <string>
#include <string_view>
#include <vector>

/// What came out of reading one file.
struct ReadLut {
    int code = 0;
    cc::lut_t lut;
};

inline ReadLut readLut(std::string_view text, unsigned long index = 0,
                       std::string const& name = "look.cube")
{
    TemporaryFolder const folder;
    ReadLut result;
    result.code = result.lut.read(folder.write(name, text).c_str(), index);
    return result;
}

/// A code, the table's kind and size, and its first values: "0 6 2: 1 2 3 4 5 6 of 24".
inline std::string outcomeOf(ReadLut const& read)
{
    auto const& [code, lut] = read;
    std::string result = std::to_string(code) + ' ' + std::to_string(lut.kind) + ' ' +
                         std::to_string(lut.size) + ':';
    for (std::size_t i = 0; i < lut.table.size() && i < 6; ++i)
        result += ' ' + std::to_string(lut.table[i]);
    return lut.table.size() > 6 ? result + " of " + std::to_string(lut.table.size()) : result;
}

struct Reading {
    std::string text;
    char const* outcome;
    unsigned long index = 0;
};

/// Reads each text, within little memory.
inline void expectReadings(std::string const& head, std::vector<Reading> const& readings)
{
    for (Reading const& reading : readings) {
        std::string const text = head + reading.text;
        allocations::startPeak();
        EXPECT_EQ(outcomeOf(readLut(text, reading.index)), reading.outcome) << text.substr(0, 200);
        EXPECT_LT(allocations::peak(), 1 << 18) << text.substr(0, 200);
    }
}

/// The parts of a text between its bars.
inline std::vector<std::string> split(std::string const& text)
{
    std::vector<std::string> parts;
    std::istringstream stream(text);
    for (std::string part; std::getline(stream, part, '|');)
        parts.push_back(part);
    return parts;
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
