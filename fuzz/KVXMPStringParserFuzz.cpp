// Any bytes as an XMP packet.

#include <korvane/media/KVXMPStringParser.h>

extern "C" int LLVMFuzzerTestOneInput(std::uint8_t const* data, std::size_t size)
{
    KVXMPStringParser parser;
    __CFData const packet(data, size);
    // Well-formed is what leaves no error behind.
    if (parser.parseXMPData(&packet) != parser.parseErrorString().isNull())
        __builtin_trap();
    parser.parsedData()->description();
    return 0;
}
