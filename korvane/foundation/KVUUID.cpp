#include <korvane/foundation/KVUUID.h>

#include <cstdlib>

char* KVUUID::toCStr() const
{
    // One byte for each nibble, four dashes, the terminator.
    auto* const text = static_cast<char*>(std::calloc(41, 1));
    if (!text)
        return nullptr;
    char* out = text;
    for (int nibble = 0; nibble < 32; ++nibble) {
        if (nibble == 8 || nibble == 12 || nibble == 16 || nibble == 20)
            *out++ = '-';
        *out++ = "0123456789ABCDEF"[words[nibble / 8] >> (28 - nibble % 8 * 4) & 15];
    }
    return text;
}
