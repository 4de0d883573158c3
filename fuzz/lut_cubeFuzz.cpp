// The .cube reader: the first four tables of a file.

#include "LutFuzz.h"

#include <korvane/colour/lut_t.h>

extern "C" int LLVMFuzzerTestOneInput(std::uint8_t const* data, std::size_t size)
{
    MemoryFile const file(data, size);
    for (unsigned long index = 0; index < 4; ++index) {
        cc::tfreader_t reader;
        require(reader.open(file.path().c_str()) == cc::kSuccess);
        cc::lut_t lut;
        int const code = lut.readCUBE(reader, index);
        require(code == cc::kSuccess || code == cc::kBadData);
        auto const edge = static_cast<std::size_t>(lut.size);
        std::size_t const whole = lut.kind == cc::lut_t::k3D ? 3 * edge * edge * edge : edge;
        require(lut.table.size() == whole || (code != cc::kSuccess && lut.table.size() < whole));
        require(lut.table.size() <= 2 * size + 1024);
        useTable(lut);
    }
    return 0;
}
