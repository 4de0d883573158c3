#include <korvane/platform/CFBundle.h>

CFBundleRef CFBundleGetBundleWithIdentifier(CFStringRef) noexcept
{
    return nullptr;
}

CFStringRef CFBundleCopyLocalizedString(CFBundleRef, CFStringRef key, CFStringRef value,
                                        CFStringRef) noexcept
{
    return CFRetain(value ? value : key);
}
