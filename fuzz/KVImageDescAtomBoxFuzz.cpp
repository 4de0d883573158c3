// Any bytes as an `stsd` payload: read, every question asked, changed, and written twice.

#include <korvane/media/KVImageDescAtomBox.h>

extern "C" int LLVMFuzzerTestOneInput(std::uint8_t const* data, std::size_t size)
{
    KVImageDescAtomBox descriptions(data, size);
    for (int i = -1; i < 3; ++i) {
        int a = 0, b = 0, c = 0;
        descriptions.getImageDescColorInfo(i, &a, &b, &c);
        descriptions.getImageDescFieldInfo(i, &a, &b);
        descriptions.getImageDescPixelAspectInfo(i, &a, &b);
        descriptions.copyImageDescHDRInfo(i);
        auto const spherical = descriptions.copyImageDescGoogleV2Info(i);
        descriptions.copyImageDescData(i, KVAtomType("sv3d"));
        descriptions.setImageDescGoogleV2Info(i, spherical);
        descriptions.setImageDescColorInfo(i, 1, 2, 3);
        descriptions.removeImageDescData(i, KVAtomType("pasp"));
    }
    if (auto const written = descriptions.copyFullImageDescToData(true)) {
        KVImageDescAtomBox again(written);
        // What was written reads as what was meant.
        if (again.getImageDescCount() != descriptions.getImageDescCount() && size < 0x10000)
            again.copyFullImageDescToData(false);
    }
    return 0;
}
