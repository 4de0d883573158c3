#pragma once

#include <korvane/foundation/KVCFRef.h>
#include <korvane/platform/CFDictionary.h>

namespace kv {

/// A new dictionary without entries.
inline KVCFRef<CFMutableDictionaryRef> makeDictionary()
{
    return KVCFRef<CFMutableDictionaryRef>::adopt(CFDictionaryCreateMutable(nullptr, 0));
}

} // namespace kv
