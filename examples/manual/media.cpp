// Shown by docs/media.md. Its arguments are a movie and the copy to write.
#include <korvane/foundation/KVNSRef.h>
#include <korvane/foundation/KVURL.h>
#include <korvane/media/KVAtomMetadataHandler.h>

int main(int, char** arguments)
{
    KVURL const source(arguments[1]), copy(arguments[2]);
    KVAtomMetadataHandler movie;
    if (movie.openInputFile(source.cf_url()) != 0 || movie.readMetadata() != 0)
        return 1;

    auto pose = KVMakeRef<__CFDictionary>();
    pose->setValue("stereo_mode", KVString("1").cf_str());
    pose->setValue("pose_yaw_degrees", KVString("10").cf_str());
    auto metadata = KVMakeRef<__CFDictionary>();
    metadata->setValue(kKVGoogleV2Metadata, pose);
    movie.setMetadata(metadata);

    if (movie.openOutputFile(copy.cf_url()) != 0)
        return 1;
    return movie.writeMetadataWithUpdates(); // 0, 2 when cancelled, or a negative code
}
