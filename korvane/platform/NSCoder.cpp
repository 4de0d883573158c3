#include <korvane/platform/NSCoder.h>

// The coder makes these kinds itself, so their descriptors have no function.
NSCodingClass const NSStringCodingClass{"NSString", nullptr};
NSCodingClass const NSNumberCodingClass{"NSNumber", nullptr};
NSCodingClass const NSDataCodingClass{"NSData", nullptr};
NSCodingClass const NSArrayCodingClass{"NSArray", nullptr};
NSCodingClass const NSNullCodingClass{"NSNull", nullptr};

NSCoding::~NSCoding() = default;

NSCoder::~NSCoder() = default;

void NSCoder::encodeString(KVString const& value, std::string_view key)
{
    if (!value.isNull())
        encodeObject(value.cf_str(), key);
}

KVString NSCoder::decodeString(std::string_view key)
{
    return decodeObjectOfClass<NSString>(NSStringCodingClass, key).get();
}
