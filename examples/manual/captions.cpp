// Shown by docs/captions.md. Its arguments are a file to read and one to write.
#include <korvane/captions/KVCaptionGroups.h>
#include <korvane/captions/KVSRTCaptionsExporter.h>
#include <korvane/captions/KVSRTCaptionsImporter.h>

#include <iostream>

int main(int, char** arguments)
{
    CMTime const frame = CMTimeMake(1001, 24000); // 23.976 frames a second
    CMTime const noOffset = kCMTimeZero;

    std::vector<KVCaptionArray> captions; // an array of its own for each caption
    auto const importer = KVMakeRef<KVSRTCaptionsImporter>(); // a new one for each file
    auto error = importer->importCaptionsFromURL(KVURL(arguments[1]), captions, frame, noOffset);
    if (error) // what was read before the fault stays in `captions`
        return static_cast<int>(error->code());

    KVCaptionArray all;
    for (KVCaptionArray const& one : captions)
        all.push_back(one[0]);
    std::cout << all.size() << " captions in " << KVGroupOverlappingCaptions(all, false).size()
              << " groups\n";

    error = KVSRTCaptionsExporter::exportCaptionsToURL(KVURL(arguments[2]), all, frame, noOffset,
                                                       true); // with styles as tags
    return error ? 1 : 0;
}
