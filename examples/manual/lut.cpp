// Shown by docs/lut.md. Its argument is a .cube or .mga file.
#include <korvane/colour/lut_t.h>

#include <iostream>

int main(int, char** arguments)
{
    cc::lut_t lut;
    int const code = lut.read(arguments[1], 0); // 0: the first table of the file
    if (code != cc::kSuccess)
        return 1;

    // Entry (r, g, b) of a cube: red, green and blue begin at this place.
    int const r = lut.size - 1, g = 0, b = 0;
    int const place = 3 * ((b * lut.size + g) * lut.size + r);
    unsigned short const red = lut.table[place]; // 0 to 65535, lut.domainMin to lut.domainMax
    std::cout << lut.title << ": " << red << '\n';
    return lut.kind == cc::lut_t::k3D && red > 32768 ? 0 : 1;
}
