// Any text as a path or a URL, with every question that a URL answers.

#include <korvane/foundation/KVURL.h>

#include <cstddef>
#include <cstdint>
#include <memory>
#include <string_view>

extern "C" int LLVMFuzzerTestOneInput(std::uint8_t const* data, std::size_t size)
{
    KVURL const url(
        KVString::fromUTF8(std::string_view(reinterpret_cast<char const*>(data), size)));
    for (auto question :
         {&KVURL::getHostnameAndPrefixString, &KVURL::getAbsoluteString, &KVURL::getAsURLString,
          &KVURL::getAsFileSystemString, &KVURL::getPathAsFileSystemString,
          &KVURL::getContainingFolder, &KVURL::getContainingFolderAsURLString, &KVURL::getFilename,
          &KVURL::getShortFilename, &KVURL::getExtension})
        (url.*question)();
    unsigned int length = 0;
    std::unique_ptr<char[]> const bytes(url.getString(&length));
    url.isSequence();
    url.getSequenceLength();
    url.getSequenceURL();
    for (unsigned int index : {0u, 4u, 0x7FFFFFFFu, 0xFFFFFFFFu})
        std::unique_ptr<KVURL> const frame(url.getURLforIndex(index));
    return 0;
}
