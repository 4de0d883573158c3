#pragma once

#include <korvane/platform/CFString.h>

/// A package of localised texts. No bundles are registered here, so looking one up answers
/// null, and a text comes back as its key; the names keep localised call sites portable.
struct KV_EXPORT __CFBundle final : NSObject {};

using CFBundleRef = __CFBundle*;

/// Unowned; always null.
KV_EXPORT CFBundleRef CFBundleGetBundleWithIdentifier(CFStringRef identifier) noexcept;
/// `value` if it is not null, else the key, retained: the caller owns the result. Null when both
/// are.
KV_EXPORT CFStringRef CFBundleCopyLocalizedString(CFBundleRef, CFStringRef key, CFStringRef value,
                                                  CFStringRef table) noexcept;
