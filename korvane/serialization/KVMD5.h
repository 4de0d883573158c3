#pragma once

#include <korvane/serialization/KVHash128.h>

#include <cstddef>

/// The MD5 digest (RFC 1321) of all bytes written, however they are cut into calls.
///
///     KVMD5 md5;
///     md5.writeBytes("abc", 3);
///     md5.getHash().words;              // 16 bytes in memory: 90 01 50 98 3c d2 4f b0 ...
///
/// The digest is handed out as the four words of the state. `getString` of it therefore prints each
/// word's bytes in the other order ("98500190b04fd23c...") than the usual text of a digest.
class KV_EXPORT KVMD5 {
public:
    KVMD5() noexcept;

    /// After `finish` nothing more is taken: the call is reported as a failed assertion.
    void writeBytes(void const* bytes, unsigned long length);
    /// Runs the compression function over the first `blockCount` blocks of 64 bytes that are
    /// gathered, at most the nine there is room for. Called by the class itself; a host has no need
    /// to.
    void flushBlocks(unsigned long blockCount) const noexcept;
    /// Appends the padding and the length. A second call does nothing.
    void finish() const noexcept;
    /// The digest; runs `finish` if it has not run.
    KVHash128 getHash() const noexcept;

private:
    static constexpr std::size_t gatherSize = 512;

    std::uint64_t length_ = 0;
    mutable KVHash128State state_;
    mutable bool finished_ = false;
    mutable unsigned char buffer_[gatherSize + 64];
    std::size_t buffered_ = 0;
};

KV_EXPORT KVHash128State KVMD5HashWithBytes(void const* bytes, std::size_t length);
/// The string's UTF-16 units in the machine's byte order, without a terminator; null counts as
/// empty.
KV_EXPORT KVHash128State KVMD5HashWithCFString(CFStringRef string);
KV_EXPORT KVHash128State KVMD5HashWithNSString(NSString* string);
/// A string gives the same as KVMD5HashWithNSString. Any other object, or null, is reported as a
/// failed assertion and gives all zero.
KV_EXPORT KVHash128State KVMD5HashWithObject(NSObject const* object);
/// The pointer's own bytes: good for this process only.
KV_EXPORT KVHash128State KVMD5HashWithPointer(void const* pointer);
/// `count` arguments of type `std::int32_t`, `std::int64_t` or `double`, as a packed array. A count
/// of 0 gives the digest of nothing.
KV_EXPORT KVHash128State KVMD5HashWithInt32(unsigned int count, ...);
KV_EXPORT KVHash128State KVMD5HashWithInt64(unsigned int count, ...);
KV_EXPORT KVHash128State KVMD5HashWithFloat64(unsigned int count, ...);

/// From the text of `KVHash128::getString`; all zero for any other text.
KV_EXPORT KVHash128State KVMD5HashFromCFString(CFStringRef string);
KV_EXPORT KVHash128State KVMD5HashFromNSString(NSString* string);
/// The text of `KVHash128::getString`.
KV_EXPORT KVString KVMD5HashToString(KVHash128State hash);
/// The same as a string that the caller owns.
KV_EXPORT CFStringRef KVCreateStringFromMD5Hash(KVHash128State hash);
