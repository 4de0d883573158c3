// The .mga reader.

#include "LutFuzz.h"

#include <korvane/colour/lut_t.h>

extern "C" int LLVMFuzzerTestOneInput(std::uint8_t const* data, std::size_t size)
{
    MemoryFile const file(data, size);
    cc::tfreader_t reader;
    require(reader.open(file.path().c_str()) == cc::kSuccess);
    cc::lut_t lut;
    int const code = lut.readMGA(reader, 0);
    require(code == cc::kSuccess || code == cc::kBadData);
    require(lut.table.size() <= 2 * size + 3);
    useTable(lut);
    return 0;
}
