// Armoured text, opened and read to its end.

#include <korvane/korvane.h>

#include <vector>

extern "C" int LLVMFuzzerTestOneInput(std::uint8_t const* data, std::size_t size)
{
    KVAsciiStream stream;
    if (!stream.open(reinterpret_cast<char const*>(data), size))
        return 0;
    std::vector<char> bytes(size + 1);
    auto const count = stream.read(bytes.data(), bytes.size());
    // Four characters hold three bytes: no header makes more of them.
    if (count < 0 || static_cast<std::size_t>(count) > size)
        __builtin_trap();
    return 0;
}
