// The tool's forgiving reader: what it repairs, the library's strict one takes.

#include "../tools/korvane/SubRipChecker.h"

#include <korvane/korvane.h>

#include <cstdlib>

extern "C" int LLVMFuzzerTestOneInput(std::uint8_t const* data, std::size_t size)
{
    SubRipCheck const check = checkSubRip({reinterpret_cast<char const*>(data), size});
    if (check.captions.empty())
        return 0;
    std::vector<KVCaptionArray> captions;
    if (KVMakeRef<KVSRTCaptionsImporter>()->importCaptionsFromString(
            NSStringWithBytes(repairedSubRip(check.captions)), captions, CMTimeMake(1, 1'000'000),
            kCMTimeZero))
        std::abort();
    if (captions.size() != check.captions.size())
        std::abort();
    return 0;
}
