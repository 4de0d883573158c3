// Any bytes as a movie whose metadata is read, changed and written, and read again.

#include "MemoryFile.h"

#include <korvane/media/KVAtomMetadataHandler.h>

namespace {

void setAll(KVAtomMetadataHandler& handler)
{
    auto const metadata = KVCFRef<CFMutableDictionaryRef>::adopt(
        CFDictionaryCreateMutableCopy(nullptr, 0, handler.copyMetadata()));
    auto const values = KVCFRef<CFMutableDictionaryRef>::adopt(new __CFDictionary());
    for (char const* key : {"stereo_mode", "cube_layout", "white_point_x", "pixel_aspect_h",
                            "pixel_aspect_v", "GSpherical:SourceCount"})
        values->setValue(key, KVString("3").cf_str());
    for (char const* key :
         {kKVGoogleV1Metadata, kKVGoogleV2Metadata, kKVHDRMetadata, kKVStandardExtensionsMetadata})
        metadata->setValue(key, values);
    handler.setMetadata(metadata);
}

} // namespace

extern "C" int LLVMFuzzerTestOneInput(std::uint8_t const* data, std::size_t size)
{
    MemoryFile const input(data, size), output;
    KVAtomMetadataHandler handler;
    if (handler.openInputFile(input.url()) != 0 || handler.readMetadata() != 0)
        return 0;
    // As it came, then with more.
    for (int round = 0; round < 2; ++round) {
        if (handler.openOutputFile(output.url()) != 0 || handler.writeMetadataWithUpdates() != 0)
            return 0;
        setAll(handler);
    }
    KVAtomMetadataHandler again;
    if (again.openInputFile(output.url()) == 0)
        again.readMetadata();
    return 0;
}
