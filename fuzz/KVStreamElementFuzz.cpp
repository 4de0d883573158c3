// The two parsers of texts that elements share.

#include <korvane/korvane.h>

#include <memory>

extern "C" int LLVMFuzzerTestOneInput(std::uint8_t const* data, std::size_t size)
{
    std::string const text(reinterpret_cast<char const*>(data), size);
    char const* const begin = text.c_str();

    char const* cursor = begin;
    std::unique_ptr<KVUUID> const uuid(KVStreamElement::atoUUID(&cursor));
    if (cursor != begin + (uuid ? 32 : 0))
        __builtin_trap();

    cursor = begin;
    CMTime time = CMTimeMake(1, 2);
    bool const read = KVStreamElement::aToVexTime(&cursor, &time);
    if (cursor < begin || cursor > begin + text.size() || (!read && time.timescale != 2))
        __builtin_trap();
    return 0;
}
