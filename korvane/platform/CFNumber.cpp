#include <korvane/platform/CFNumber.h>

#include <korvane/platform/KVSaturatingCast_p.h>

#include <functional>

double __CFNumber::doubleValue() const noexcept
{
    return isFloat_ ? real_ : static_cast<double>(integer_);
}

std::int64_t __CFNumber::int64Value() const noexcept
{
    return isFloat_ ? kvSaturatingCast<std::int64_t>(real_) : integer_;
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
