#include <korvane/colour/multilut_t.h>

#include <utility>

namespace cc {

int multilut_t::read(char const* path, bool append)
{
    if (!append)
        tables.clear();
    lut_t first;
    if (int const code = first.read(path, 0))
        return code;
    if (first.kind == lut_t::kNone)
        return kSuccess;
    tables.push_back(first);
    for (unsigned long index = 1; first.format_ == lut_t::kCUBE && index < kMostTables; ++index) {
        // The header has been read: its format, title and name are those of all tables.
        lut_t lut;
        lut.format_ = first.format_;
        lut.title = first.title;
        lut.name = first.name;
        tfreader_t reader(tfreader_t::kUTF8, lut_t::kLongestLine);
        if (int const code = reader.open(path))
            return code;
        if (int const code = lut.readCUBE(reader, index))
            return code;
        if (lut.kind == lut_t::kNone)
            break;
        tables.push_back(std::move(lut));
    }
    return kSuccess;
}

} // namespace cc
