// Any bytes as a movie: its tree to the tables and one level below everything, copied and written.

#include "MemoryFile.h"

#include <korvane/media/KVAtomBoxFile.h>

extern "C" int LLVMFuzzerTestOneInput(std::uint8_t const* data, std::size_t size)
{
    MemoryFile const input(data, size), output;
    KVAtomBoxFile file;
    if (file.openInputFile(input.url()) != 0)
        return 0;
    file.getFileType();
    file.readAllTrackMediaAtomBoxes();
    std::vector<KVAtomBox*> tracks;
    file.findTracks(tracks, KVAtomType("vide"), 1);
    KVAtomBoxFile const copy(file);
    if (KVAtomBox* const moov = file.findFirstChild(true, KVAtomType("moov"))) {
        auto* const grown = new KVAtomBox(KVAtomType("free"));
        grown->setParent(moov);
        moov->insertChild(grown, 0);
        grown->updateSize();
        grown->updateParentSizes();
    }
    for (int i = 0; i < file.getChildCount() && i < 100; ++i)
        if (file.getChild(i)->getChildCount() == 0)
            file.readChildAtomBoxHeaders(file.getChild(i));
    if (file.openOutputFile(output.url()) != 0 || file.writeAtomBoxFileWithUpdates() != 0)
        return 0;
    KVAtomBoxFile again;
    if (again.openInputFile(output.url()) == 0)
        again.readAllTrackMediaAtomBoxes();
    return 0;
}
