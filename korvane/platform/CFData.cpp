#include <korvane/platform/CFData.h>

#include <algorithm>
#include <functional>
#include <string_view>

__CFData::__CFData(void const* bytes, std::size_t length)
{
    append(bytes, length);
}

void __CFData::append(void const* bytes, std::size_t length)
{
    if (length == 0)
        return;
    auto const* first = static_cast<std::uint8_t const*>(bytes);
    bytes_.insert(bytes_.end(), first, first + length);
}

bool __CFData::isEqual(NSObject const* other) const
{
    auto const* data = dynamic_cast<__CFData const*>(other);
    return data && data->bytes_ == bytes_;
}

std::size_t __CFData::hash() const
{
    return std::hash<std::string_view>()(
        {reinterpret_cast<char const*>(bytes_.data()), bytes_.size()});
}

CFDataRef CFDataCreate(CFAllocatorRef, void const* bytes, CFIndex length)
{
    return new __CFData(bytes, static_cast<std::size_t>(std::max<CFIndex>(length, 0)));
}

CFDataRef CFDataCreateCopy(CFAllocatorRef, CFDataRef data)
{
    return data ? new __CFData(data->bytes(), data->length()) : nullptr;
}

CFMutableDataRef CFDataCreateMutable(CFAllocatorRef, CFIndex)
{
    return new __CFData();
}

CFIndex CFDataGetLength(CFDataRef data) noexcept
{
    return data ? static_cast<CFIndex>(data->length()) : 0;
}

UInt8 const* CFDataGetBytePtr(CFDataRef data) noexcept
{
    return data ? data->bytes() : nullptr;
}

UInt8* CFDataGetMutableBytePtr(CFMutableDataRef data) noexcept
{
    return data ? data->mutableBytes() : nullptr;
}

void CFDataSetLength(CFMutableDataRef data, CFIndex length)
{
    data->setLength(static_cast<std::size_t>(std::max<CFIndex>(length, 0)));
}

void CFDataAppendBytes(CFMutableDataRef data, void const* bytes, CFIndex length)
{
    data->append(bytes, static_cast<std::size_t>(std::max<CFIndex>(length, 0)));
}
