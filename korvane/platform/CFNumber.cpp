#include <korvane/platform/CFNumber.h>

#include <functional>
#include <limits>

double __CFNumber::doubleValue() const noexcept
{
    return isFloat_ ? real_ : static_cast<double>(integer_);
}

std::int64_t __CFNumber::int64Value() const noexcept
{
    if (!isFloat_)
        return integer_;
    if (real_ != real_)
        return 0;
    // 2^63 is the first double above the range, -2^63 the last one within it.
    if (real_ >= 0x1p63)
        return std::numeric_limits<std::int64_t>::max();
    if (real_ < -0x1p63)
        return std::numeric_limits<std::int64_t>::min();
    return static_cast<std::int64_t>(real_);
}

std::int32_t __CFNumber::intValue() const noexcept
{
    return static_cast<std::int32_t>(int64Value());
}

bool __CFNumber::boolValue() const noexcept
{
    return isFloat_ ? real_ != 0 : integer_ != 0;
}

bool __CFNumber::isEqual(NSObject const* other) const
{
    auto const* number = dynamic_cast<__CFNumber const*>(other);
    if (!number)
        return false;
    if (!isFloat_ && !number->isFloat_)
        return integer_ == number->integer_;
    // A large integer and its rounding to double are two numbers.
    if (isFloat_ != number->isFloat_ && int64Value() != number->int64Value())
        return false;
    return doubleValue() == number->doubleValue();
}

std::size_t __CFNumber::hash() const
{
    return std::hash<double>()(doubleValue());
}
