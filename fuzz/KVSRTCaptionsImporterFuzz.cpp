// Any bytes as a SubRip file: captions or an error with a known code.

#include <korvane/korvane.h>

#include <cstdlib>

extern "C" int LLVMFuzzerTestOneInput(std::uint8_t const* data, std::size_t size)
{
    std::string_view const bytes(reinterpret_cast<char const*>(data), size);
    std::vector<KVCaptionArray> captions;
    auto const importer = KVMakeRef<KVSRTCaptionsImporter>();
    auto const error = importer->importCaptionsFromString(NSStringWithBytes(bytes), captions,
                                                          CMTimeMake(1001, 24000), kCMTimeZero);
    if (error && (error->code() < 1 || error->code() > 3))
        std::abort();
    for (KVCaptionArray const& one : captions) {
        CMTime const duration = one.at(0)->timeRange().duration;
        if (CMTimeCompare(duration, kCMTimeZero) <= 0)
            std::abort();
    }
    return 0;
}
