// Tables of any values and domain, written and read again: .mga as it was, .cube within one.

#include "LutFuzz.h"

#include <korvane/colour/lut_t.h>

#include <cstring>

extern "C" int LLVMFuzzerTestOneInput(std::uint8_t const* data, std::size_t size)
{
    if (size < 9)
        return 0;
    cc::lut_t lut;
    lut.makeCube(1 + data[0] % 6);
    std::memcpy(&lut.domainMin, data + 1, 4);
    std::memcpy(&lut.domainMax, data + 5, 4);
    for (std::size_t i = 0; i < lut.table.size(); ++i)
        lut.table[i] = static_cast<unsigned short>(data[i % size] * 257 + data[i * 7 % size]);
    lut.title.assign(reinterpret_cast<char const*>(data), size);

    for (unsigned int const format : {cc::lut_t::kCUBE, cc::lut_t::kMGA}) {
        MemoryFile const file;
        (format == cc::lut_t::kCUBE ? lut.writeCUBE(file.fd(), "f") : lut.writeMGA(file.fd(), "f"));
        cc::tfreader_t reader;
        require(reader.open(file.path().c_str()) == cc::kSuccess);
        cc::lut_t read;
        int const code =
            format == cc::lut_t::kCUBE ? read.readCUBE(reader, 0) : read.readMGA(reader, 0);
        require(code == cc::kSuccess && read.size == lut.size);
        bool const exact = format == cc::lut_t::kMGA;
        // Six decimals tell the values apart in domains of about 1.
        bool const near =
            lut.domainMin >= -1 && lut.domainMin <= 0 && lut.domainMax >= 1 && lut.domainMax <= 2;
        for (std::size_t i = 0; i < lut.table.size() && (exact || near); ++i)
            require(std::abs(read.table[i] - lut.table[i]) <= (exact ? 0 : 1));
    }
    return 0;
}
