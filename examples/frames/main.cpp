// The files of a numbered image sequence.

#include <korvane/korvane.h>

#include <iostream>
#include <memory>

int main()
{
    KVURL const frames("/shots/a[###].tif", 1, 20);
    for (unsigned int i = 0; i < 20; ++i) {
        std::unique_ptr<KVURL> const frame(frames.getURLforIndex(i));
        std::cout << frame->getFilename() << '\n'; // a001.tif to a020.tif
    }
}
