#include <korvane/foundation/KVVersion.h>

unsigned int KVVersion() noexcept
{
    return KV_VERSION_HEX;
}
