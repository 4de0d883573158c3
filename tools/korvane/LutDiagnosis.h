#pragma once

#include <string>

/// Where and why a LUT file is refused; line 0 where the file as a whole is at fault.
struct LutFault {
    unsigned long line = 0;
    std::string text;
};

/// Looks for what the library's readers refuse in table `index` of a file: they answer with a code,
/// this with the line. `format` is the one that they found, 0 for none.
LutFault diagnoseLut(std::string const& path, unsigned int format, unsigned long index);
