#include <korvane/serialization/KVMD5.h>

#include <korvane/foundation/KVPrint.h>
#include <korvane/platform/CFNumber.h>
#include <korvane/serialization/KVMD5Blocks_p.h>

#include <algorithm>
#include <bit>
#include <cstdarg>
#include <cstring>

KVMD5::KVMD5() noexcept
{
    std::copy(std::begin(kv::md5InitialWords), std::end(kv::md5InitialWords), state_.words);
}

void KVMD5::writeBytes(void const* bytes, unsigned long length)
{
    if (finished_) {
        _KVHandleLogAssertion(1, 0, __FILE__, __LINE__, "Bytes written to a finished MD5 digest.");
        return;
    }
    auto const* data = static_cast<unsigned char const*>(bytes);
    length_ += length;
    while (length > 0) {
        if (buffered_ == 0 && length >= gatherSize) {
            // Whole gatherings are taken from where they lie: the state is the same.
            auto const whole = length / gatherSize * gatherSize;
            kv::md5Blocks(state_.words, data, whole / 64);
            data += whole;
            length -= whole;
            continue;
        }
        auto const taken = std::min<std::size_t>(length, gatherSize - buffered_);
        std::memcpy(buffer_ + buffered_, data, taken);
        buffered_ += taken;
        data += taken;
        length -= taken;
        if (buffered_ == gatherSize) {
            flushBlocks(gatherSize / 64);
            buffered_ = 0;
        }
    }
}

void KVMD5::flushBlocks(unsigned long blockCount) const noexcept
{
    kv::md5Blocks(state_.words, buffer_, std::min<std::size_t>(blockCount, sizeof buffer_ / 64));
}

void KVMD5::finish() const noexcept
{
    if (finished_)
        return;
    std::size_t const padded = (buffered_ + 8) / 64 * 64 + 64;
    std::memset(buffer_ + buffered_, 0, padded - buffered_);
    buffer_[buffered_] = 0x80;
    for (unsigned i = 0; i < 8; ++i)
        buffer_[padded - 8 + i] = static_cast<unsigned char>(length_ * 8 >> 8 * i);
    flushBlocks(padded / 64);
    finished_ = true;
}

KVHash128 KVMD5::getHash() const noexcept
{
    finish();
    return state_;
}

KVHash128State KVMD5HashWithBytes(void const* bytes, std::size_t length)
{
    KVMD5 md5;
    md5.writeBytes(bytes, length);
    return md5.getHash();
}

KVHash128State KVMD5HashWithCFString(CFStringRef string)
{
    return string ? KVMD5HashWithBytes(string->units(), 2 * string->length())
                  : KVMD5HashWithBytes(nullptr, 0);
}

KVHash128State KVMD5HashWithNSString(NSString* string)
{
    return KVMD5HashWithCFString(string);
}

KVHash128State KVMD5HashWithObject(NSObject const* object)
{
    if (auto const* string = dynamic_cast<CFStringRef>(object))
        return KVMD5HashWithCFString(string);
    if (dynamic_cast<__CFNumber const*>(object))
        _KVHandleLogAssertion(1, 0, __FILE__, __LINE__,
                              "Cannot archive of type NSValue, rather consider using one of the "
                              "supported KVMD5HashWith<Type> equivalents.");
    else
        _KVHandleLogAssertion(1, 0, __FILE__, __LINE__,
                              "Cannot archive an object to hash it: only strings are supported.");
    return {};
}

KVHash128State KVMD5HashWithPointer(void const* pointer)
{
    return KVMD5HashWithBytes(&pointer, sizeof pointer);
}

namespace {

template <class T>
KVHash128State hashArguments(unsigned int count, std::va_list arguments) noexcept
{
    KVMD5 md5;
    for (; count > 0; --count) {
        T const value = va_arg(arguments, T);
        md5.writeBytes(&value, sizeof value);
    }
    return md5.getHash();
}

} // namespace

KVHash128State KVMD5HashWithInt32(unsigned int count, ...)
{
    std::va_list arguments;
    va_start(arguments, count);
    auto const hash = hashArguments<std::int32_t>(count, arguments);
    va_end(arguments);
    return hash;
}

KVHash128State KVMD5HashWithInt64(unsigned int count, ...)
{
    std::va_list arguments;
    va_start(arguments, count);
    auto const hash = hashArguments<std::int64_t>(count, arguments);
    va_end(arguments);
    return hash;
}

KVHash128State KVMD5HashWithFloat64(unsigned int count, ...)
{
    std::va_list arguments;
    va_start(arguments, count);
    auto const hash = hashArguments<double>(count, arguments);
    va_end(arguments);
    return hash;
}

KVHash128State KVMD5HashFromCFString(CFStringRef string)
{
    return KVHash128(KVString(string));
}

KVHash128State KVMD5HashFromNSString(NSString* string)
{
    return KVMD5HashFromCFString(string);
}

KVString KVMD5HashToString(KVHash128State hash)
{
    return KVHash128(hash).getString();
}

CFStringRef KVCreateStringFromMD5Hash(KVHash128State hash)
{
    return CFRetain(KVMD5HashToString(hash).cf_str());
}
