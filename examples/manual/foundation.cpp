// Shown by docs/foundation.md.
#include <korvane/foundation/KVArray.h>
#include <korvane/foundation/KVURL.h>

#include <iostream>
#include <memory>

int main()
{
    KVString const title = "Cafe\u0301"; // "e" and an accent: one character to a reader
    std::cout << title.toUpper() << ' ' << title.size() << ' ' << title.composedCharacterCount();

    KVURL const frames("/shots/a[###].tif", 1, 20);
    std::unique_ptr<KVURL> const fifth(frames.getURLforIndex(4)); // the caller deletes it
    std::cout << ' ' << fifth->getFilename() << '\n';             // CAFÉ 5 4 a005.tif

    try {
        KVArray<float> weights(3);
        weights[3] = 0.5f;
    } catch (KVBadIndexException const& error) {
        std::cout << error.what() << '\n'; // KVBadIndexException: KVArray index 3 out of range 2
    }
    return title.composedCharacterCount() == 4 && fifth->getFilename() == "a005.tif" ? 0 : 1;
}
