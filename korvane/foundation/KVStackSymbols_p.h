#pragma once

#include <korvane/foundation/KVCFRef.h>
#include <korvane/platform/CFArray.h>

#include <string>

namespace kv {

/// The calling thread's stack, innermost frame first, a string for each frame.
KVCFRef<CFArrayRef> copyCallStackSymbols();
/// The same joined by newlines.
std::string callStackText();

} // namespace kv
