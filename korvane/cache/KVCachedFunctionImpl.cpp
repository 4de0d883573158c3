#include <korvane/cache/KVCachedFunctionImpl.h>

#include <korvane/foundation/KVException.h>

void _KVCachedFunctionReentered()
{
    throw KVAssertionException("a cached function called itself through its own cache", __FILE__,
                               __LINE__);
}
