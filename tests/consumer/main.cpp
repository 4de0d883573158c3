// What the smallest host does: it brings every public header, calls the library,
// and catches what it throws.

#include <korvane/korvane.h>

#include <iostream>
#include <string>

int main()
{
    if (KVVersion() != KV_VERSION_HEX) {
        std::cerr << "built against another version\n";
        return 1;
    }
    KVString title("Réel");
    title.append(" 01");
    if (title.size() != 7)
        return 1;
    try {
        throw KVBadIndexException();
    } catch (KVException const& exception) {
        std::cout << std::string(title) << ": " << exception.getInfo() << '\n';
    }
    return 0;
}
