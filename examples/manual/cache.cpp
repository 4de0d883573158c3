// Shown by docs/cache.md.
#include <korvane/cache/KVCache.h>
#include <korvane/cache/KVCachedFunctionImpl.h>

#include <string>

int main()
{
    KVCache<std::string, std::string> thumbnails(500); // at most 500 entries
    thumbnails->setMaxCost(64 << 20);                  // and 64 MiB in all
    thumbnails->addValue("a001.tif", "pixels", 6);

    bool found = false;
    std::string const again = thumbnails->findValue("a001.tif", found); // a copy, now the newest

    int computed = 0;
    KVCachedFunctionImpl<int, std::string> length(
        [&computed](std::string text) { return ++computed, static_cast<int>(text.size()); }, 100);
    length("a001.tif"); // computed
    length("a001.tif"); // remembered, from any thread
    return found && again == "pixels" && computed == 1 ? 0 : 1;
}
