#pragma once

#include <korvane/foundation/KVString.h>
#include <korvane/foundation/KVUUID.h>
#include <korvane/platform/CMTime.h>

#include <variant>

/// A value of any kind that the binary form stores: the content of an element, or an attribute.
///
///     KVBinaryXMLField const field(600ULL);
///     int number;
///     field.getAsInt32(&number);        // 600
///
/// The getters convert. Those for numbers:
///
/// - from an integer: the low bits for a narrower type, the nearest value for a floating one;
/// - from a `float` or `double` to an integer: cut toward zero; NaN gives 0, what is out of range
///   the nearest end;
/// - from a string: what `strtol`, `strtoul` (base 10), `strtof` or `strtod` read at its start, so
///   0 where there is no number; false for a result out of range, with the output set to the
///   nearest one;
/// - from a time or a UUID: true, with the output left as it was.
class KV_EXPORT KVBinaryXMLField {
public:
    enum Kind : unsigned int {
        kSignedInteger = 0,
        kUnsignedInteger = 1,
        kFloat = 2,
        kDouble = 3,
        kTime = 4,
        kString = 5,
        kUUID = 6,
    };

    /// An empty string (the null one, as for an element of the text form without text).
    KVBinaryXMLField() noexcept : value_(KVString()) {}
    explicit KVBinaryXMLField(long long value) noexcept;
    explicit KVBinaryXMLField(long value) noexcept;
    explicit KVBinaryXMLField(unsigned long long value) noexcept;
    explicit KVBinaryXMLField(unsigned long value) noexcept;
    explicit KVBinaryXMLField(float value) noexcept;
    explicit KVBinaryXMLField(double value) noexcept;
    explicit KVBinaryXMLField(CMTime const& value) noexcept;
    explicit KVBinaryXMLField(KVString const& value) noexcept;
    explicit KVBinaryXMLField(KVUUID const& value) noexcept;

    Kind kind() const noexcept { return static_cast<Kind>(value_.index()); }

    /// True. Numbers print as "%lld", "%llu", "%.10g" and "%.16lg", a time as "%lld %d %x %lld", a
    /// UUID as 32 hexadecimal digits. (The text form of a document prints a `double` with one digit
    /// more.)
    bool getAsString(KVString* value) const;
    bool getAsInt32(int* value) const;
    bool getAsUInt32(unsigned int* value) const;
    bool getAsInt64(long long* value) const;
    bool getAsUInt64(unsigned long long* value) const;
    bool getAsFloat(float* value) const;
    bool getAsDouble(double* value) const;
    /// Whether the number is not zero. A string out of range counts as a number that is not.
    bool getAsBool(bool* value) const;
    /// From a UUID, or a string that `KVStreamElement::atoUUID` reads: a new one, which the caller
    /// deletes. Otherwise null.
    KVUUID* getAsUUID() const;
    /// From a time, or a string that `KVStreamElement::aToVexTime` reads. Otherwise false.
    bool getAsVexTime(CMTime* value) const;

private:
    template <class T>
    bool getInteger(T* value) const;
    template <class T>
    bool getFloat(T* value) const;

    // In the order of Kind.
    std::variant<long long, unsigned long long, float, double, CMTime, KVString, KVUUID> value_;
};
