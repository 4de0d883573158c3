#pragma once

#include <korvane/foundation/KVURL.h>
#include <korvane/platform/NSError.h>

#include <string_view>

/// How the bytes of a text file were read.
enum NSStringEncoding : std::uint32_t {
    NSUTF8StringEncoding = 4,
    NSWindowsCP1252StringEncoding = 12,
    NSUTF16BigEndianStringEncoding = 0x90000100,
    NSUTF16LittleEndianStringEncoding = 0x94000100,
    NSUTF32BigEndianStringEncoding = 0x98000100,
    NSUTF32LittleEndianStringEncoding = 0x9C000100,
};

/// The text in bytes of an unknown encoding. A byte-order mark of UTF-32, UTF-8 or UTF-16 decides
/// and is not part of the text; bytes that do not fit it give the null string. Without a mark the
/// text is UTF-8 if the bytes are well-formed UTF-8, else Windows-1252 (its five unassigned bytes
/// stand for U+0081, U+008D, U+008F, U+0090 and U+009D).
///
/// A surrogate that stands alone in UTF-16 is kept. `*used`, if asked for, becomes the encoding.
KV_EXPORT KVString NSStringWithBytes(std::string_view bytes, NSStringEncoding* used = nullptr);

/// The largest file that is read as text, in bytes.
inline constexpr std::size_t NSStringFileLimit = std::size_t(1) << 30;

/// A file's text, by the rules of `NSStringWithBytes`. The null string for a file that cannot be
/// read, is larger than NSStringFileLimit or does not fit its byte-order mark; `*error`, if asked
/// for, then tells why (NSPOSIXErrorDomain and an errno).
KV_EXPORT KVString NSStringWithContentsOfURL(KVURL const& url, NSStringEncoding* used = nullptr,
                                             KVNSRef<NSError*>* error = nullptr);

/// Replaces a file's content, in place. Null for success, else NSPOSIXErrorDomain and an errno; the
/// file may then hold a part of the bytes.
KV_EXPORT KVNSRef<NSError*> NSStringWriteToURL(std::string_view bytes, KVURL const& url);
