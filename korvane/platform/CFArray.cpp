#include <korvane/platform/CFArray.h>

__CFArray::__CFArray(std::span<NSObject const* const> objects)
{
    objects_.reserve(objects.size());
    for (NSObject const* object : objects)
        objects_.push_back(CFRetain(object ? object : NSNull::null()));
}

__CFArray::~__CFArray()
{
    for (NSObject const* object : objects_)
        object->release();
}

NSObject const* __CFArray::objectAtIndex(std::size_t index) const noexcept
{
    return index < objects_.size() ? objects_[index] : nullptr;
}

bool __CFArray::isEqual(NSObject const* other) const
{
    auto const* array = dynamic_cast<__CFArray const*>(other);
    if (!array || array->count() != count())
        return false;
    for (std::size_t i = 0; i < count(); ++i)
        if (!CFEqual(objects_[i], array->objects_[i]))
            return false;
    return true;
}

std::size_t __CFArray::hash() const
{
    return objects_.size();
}

NSNull* NSNull::null() noexcept
{
    // Never destroyed: objects that outlive main may still refer to it.
    static auto* const instance = new NSNull;
    return instance;
}
