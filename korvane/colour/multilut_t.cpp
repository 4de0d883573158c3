#include <korvane/colour/multilut_t.h>

#include <utility>

namespace cc {

int multilut_t::read(char const* path, bool append)
{
    if (!append)
        tables.clear();
    for (unsigned long index = 0; index < kMostTables; ++index) {
        lut_t lut;
        if (int const code = lut.read(path, index))
            return code;
        if (lut.kind == lut_t::kNone)
            break;
        bool const isLast = lut.format() == lut_t::kMGA;
        tables.push_back(std::move(lut));
        if (isLast)
            break;
    }
    return kSuccess;
}

} // namespace cc
