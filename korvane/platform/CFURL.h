#pragma once

#include <korvane/platform/CFString.h>

#include <string>
#include <string_view>

/// An immutable URL, kept as its absolute, percent-encoded text (RFC 3986). Hosts use KVURL.
struct KV_EXPORT __CFURL final : NSObject {
    /// Retains `absolute`.
    explicit __CFURL(CFStringRef absolute) noexcept : absolute_(CFRetain(absolute)) {}
    ~__CFURL() override { CFRelease(absolute_); }
    __CFURL(__CFURL const&) = delete;
    __CFURL& operator=(__CFURL const&) = delete;

    /// Unowned; percent-encoded.
    CFStringRef absoluteString() const noexcept { return absolute_; }
    /// Whether the path ends in "/".
    bool hasDirectoryPath() const noexcept;

    /// By the text, unit by unit.
    bool isEqual(NSObject const* other) const override;
    std::size_t hash() const override;
    KVString description() const override;

private:
    CFStringRef absolute_;
};

using CFURLRef = __CFURL const*;

/// From a POSIX path in UTF-8. A relative path is made absolute with the working directory of the
/// moment; a directory's URL ends in "/". Null for an empty path or one that is not UTF-8.
KV_EXPORT CFURLRef CFURLCreateFromFileSystemRepresentation(CFAllocatorRef, void const* path,
                                                           CFIndex length, bool isDirectory);
/// From URL text, taken as it stands; null for null or empty text. `base` is not used: the text is
/// absolute.
KV_EXPORT CFURLRef CFURLCreateWithString(CFAllocatorRef, CFStringRef text, CFURLRef base);
/// Unowned; null for null.
KV_EXPORT CFStringRef CFURLGetString(CFURLRef) noexcept;
/// The decoded POSIX path in UTF-8, without the "/" that marks a directory unless it is the root;
/// empty for null.
KV_EXPORT std::string CFURLGetFileSystemPath(CFURLRef);

/// Percent-encodes the UTF-8 bytes of a path: letters, digits and -._~!$&'()*+,;=:@/ stay.
KV_EXPORT std::string CFURLEncodePath(std::string_view path);
/// Replaces each %XX by its byte; a % without two hexadecimal digits stays.
KV_EXPORT std::string CFURLDecodePath(std::string_view path);
