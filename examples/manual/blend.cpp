// Shown by docs/blend.md.
#include <korvane/compositing/KVBlend.h>

#include <iostream>

int main()
{
    int place = 0;
    for (KVBlendMode const mode : KVBlend::getElementBlendModes()) {
        if (mode == KV_BLEND_SEPARATOR)
            std::cout << "---\n";
        else
            std::cout << place << ' ' << mode << '\n'; // 0 KV_BLEND_NORMAL
        ++place;
    }

    // What the person chose; a compositor may fold layers of an associative mode into one.
    KVBlendMode const chosen = KVBlend::indexToElementBlendMode(4);
    std::cout << chosen << (KVBlend::isAssociative(chosen) ? " may be grouped\n" : " may not\n");
    return place == 33 ? 0 : 1;
}
