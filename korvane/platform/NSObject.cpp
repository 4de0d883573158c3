#include <korvane/platform/NSObject.h>

#include <functional>

NSObject::~NSObject() = default;

bool NSObject::isEqual(NSObject const* other) const
{
    return this == other;
}

std::size_t NSObject::hash() const
{
    return std::hash<void const*>()(this);
}

NSObject* NSObject::newCopy() const
{
    retain();
    return const_cast<NSObject*>(this);
}
