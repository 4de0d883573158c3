#pragma once

#include <korvane/foundation/KVNSRef.h>
#include <korvane/foundation/KVString.h>
#include <korvane/platform/CFBase.h>

#include <initializer_list>
#include <optional>
#include <span>
#include <string_view>

class NSCoder;

/// Names a class that can be archived and makes one of its objects from an archive. A class has one
/// descriptor, a constant: its address may be kept.
struct NSCodingClass {
    /// ASCII, not empty; what the archive calls the class.
    char const* name;
    /// Reads the keys that `encodeWithCoder` wrote; null when their values do not make an object.
    KVNSRef<NSObject*> (*initWithCoder)(NSCoder& coder);
};

/// What an object adds to be archived. Strings, numbers, data, arrays and NSNull are archived by
/// the coder itself.
///
///     class Note final : public NSObject, public NSCoding {
///     public:
///         static NSCodingClass const coding;    // { "Note", &Note::initWithCoder }
///         NSCodingClass const& codingClass() const override { return coding; }
///         void encodeWithCoder(NSCoder& coder) const override
///         {
///             coder.encodeString(text_, "text");
///         }
///         static KVNSRef<NSObject*> initWithCoder(NSCoder& coder)
///         {
///             KVString const text = coder.decodeString("text");
///             return text.isNull() ? KVNSRef<Note*>() : KVMakeRef<Note>(text);
///         }
///         ...
class KV_EXPORT NSCoding {
public:
    virtual ~NSCoding();
    virtual NSCodingClass const& codingClass() const = 0;
    virtual void encodeWithCoder(NSCoder& coder) const = 0;
};

/// Descriptors of the kinds that a coder archives by itself, for lists of allowed classes.
KV_EXPORT extern NSCodingClass const NSStringCodingClass;
KV_EXPORT extern NSCodingClass const NSNumberCodingClass;
KV_EXPORT extern NSCodingClass const NSDataCodingClass;
KV_EXPORT extern NSCodingClass const NSArrayCodingClass;
KV_EXPORT extern NSCodingClass const NSNullCodingClass;

/// Values under keys, written by one object and read back by another of the same class.
/// KVKeyedCoder is the one that there is.
///
/// Keys are ASCII; each object has keys of its own. A key that is missing or holds another kind of
/// value decodes to nothing: 0, false, an empty optional or null. A key that is written again takes
/// the new value.
class KV_EXPORT NSCoder {
public:
    using AllowedClasses = std::initializer_list<NSCodingClass const*>;

    virtual ~NSCoder();

    // --- Write ---

    /// Copies the block, which may be empty.
    virtual void encodeBytes(void const* bytes, std::size_t length, std::string_view key) = 0;
    virtual void encodeInt64(std::int64_t value, std::string_view key) = 0;
    virtual void encodeDouble(double value, std::string_view key) = 0;
    virtual void encodeBool(bool value, std::string_view key) = 0;
    /// A string, number, data, array, NSNull or an object that is also an NSCoding; null is not
    /// encoded. An object that is met twice is written once. Throws KVIllegalArgumentException for
    /// any other kind.
    virtual void encodeObject(NSObject const* object, std::string_view key) = 0;
    /// A null string is not encoded.
    void encodeString(KVString const& value, std::string_view key);

    // --- Read ---

    virtual bool containsValueForKey(std::string_view key) const = 0;
    /// The block as it was written, valid until its key is written again, at most as long as the
    /// coder.
    virtual std::optional<std::span<std::uint8_t const>>
    decodeBytes(std::string_view key) const = 0;
    virtual std::int64_t decodeInt64(std::string_view key) const = 0;
    virtual double decodeDouble(std::string_view key) const = 0;
    virtual bool decodeBool(std::string_view key) const = 0;
    /// Null unless the object, and all within it if it is an array, is of one of the allowed
    /// classes. An object that was written once is made once, however often it is decoded.
    virtual KVNSRef<NSObject*> decodeObject(std::string_view key, AllowedClasses allowed) = 0;

    /// The one object as a `T`; null when it is not one.
    template <class T>
    KVNSRef<T*> decodeObjectOfClass(NSCodingClass const& type, std::string_view key)
    {
        return dynamic_cast<T*>(decodeObject(key, {&type}).get());
    }
    /// Null when there is no string under the key.
    KVString decodeString(std::string_view key);
};
