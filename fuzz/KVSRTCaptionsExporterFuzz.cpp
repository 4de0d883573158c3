// In, out with tags, and in again: what goes out is UTF-8 and begins as a file does.

#include <korvane/korvane.h>

#include <cstdlib>

extern "C" int LLVMFuzzerTestOneInput(std::uint8_t const* data, std::size_t size)
{
    CMTime const frame = CMTimeMake(1, 25);
    std::string_view const bytes(reinterpret_cast<char const*>(data), size);
    std::vector<KVCaptionArray> arrays;
    KVMakeRef<KVSRTCaptionsImporter>()->importCaptionsFromString(NSStringWithBytes(bytes), arrays,
                                                                 frame, kCMTimeZero);
    KVCaptionArray captions;
    for (KVCaptionArray const& one : arrays)
        captions.push_back(one.at(0));
    std::string out;
    if (KVSRTCaptionsExporter::exportCaptionsToString(out, captions, frame, kCMTimeZero, true))
        return 0;
    KVString const text = KVString::fromUTF8(out);
    if (text.isNull() || (!out.empty() && !out.starts_with("1\n")))
        std::abort();
    KVMakeRef<KVSRTCaptionsImporter>()->importCaptionsFromString(text, arrays, frame, kCMTimeZero);
    KVGroupOverlappingCaptions(captions, true);
    return 0;
}
