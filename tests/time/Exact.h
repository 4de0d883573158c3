#pragma once

#include <algorithm>
#include <array>
#include <compare>
#include <cstdint>
#include <utility>

namespace timetest {

/// An integer of up to 640 bits, plain: what the fast arithmetic is measured against.
class Exact {
public:
    Exact(std::int64_t x) : negative_(x < 0)
    {
        auto const bits = static_cast<std::uint64_t>(x);
        std::uint64_t const magnitude = negative_ ? 0 - bits : bits;
        limbs_[0] = static_cast<std::uint32_t>(magnitude);
        limbs_[1] = static_cast<std::uint32_t>(magnitude >> 32);
        trim(2);
    }

    bool isZero() const { return size_ == 0; }
    bool isNegative() const { return negative_ && !isZero(); }
    bool isEven() const { return limbs_[0] % 2 == 0; }
    /// The low 64 bits.
    std::int64_t value() const
    {
        std::uint64_t const bits = std::uint64_t{limbs_[1]} << 32 | limbs_[0];
        return static_cast<std::int64_t>(isNegative() ? 0 - bits : bits);
    }

    Exact abs() const { return isNegative() ? -*this : *this; }
    Exact operator-() const
    {
        Exact result = *this;
        result.negative_ = !negative_;
        return result;
    }

    friend Exact operator+(Exact const& a, Exact const& b)
    {
        if (a.isNegative() != b.isNegative())
            return compareMagnitudes(a, b) < 0 ? difference(b, a) : difference(a, b);
        Exact result = a;
        result.negative_ = a.isNegative();
        std::uint64_t carry = 0;
        std::size_t i = 0;
        for (; i < std::max(a.size_, b.size_) || carry; ++i) {
            carry += std::uint64_t{a.limbs_[i]} + b.limbs_[i];
            result.limbs_[i] = static_cast<std::uint32_t>(carry);
            carry >>= 32;
        }
        result.trim(i);
        return result;
    }
    friend Exact operator-(Exact const& a, Exact const& b) { return a + -b; }

    friend Exact operator*(Exact const& a, Exact const& b)
    {
        Exact result = 0;
        result.negative_ = a.isNegative() != b.isNegative();
        for (std::size_t i = 0; i < a.size_; ++i) {
            std::uint64_t carry = 0;
            for (std::size_t j = 0; j < b.size_ || carry; ++j) {
                carry += result.limbs_[i + j] + std::uint64_t{a.limbs_[i]} * b.limbs_[j];
                result.limbs_[i + j] = static_cast<std::uint32_t>(carry);
                carry >>= 32;
            }
        }
        result.trim(a.size_ + b.size_);
        return result;
    }

    /// Toward zero, with a remainder of the sign of `a`.
    static std::pair<Exact, Exact> divide(Exact const& a, Exact const& b)
    {
        Exact quotient = 0, remainder = a.abs(), shifted = b.abs();
        Exact power = 1;
        while (shifted <= remainder) {
            shifted = shifted + shifted;
            power = power + power;
        }
        for (; !power.isZero(); shifted = shifted.half(), power = power.half())
            if (shifted <= remainder) {
                remainder = remainder - shifted;
                quotient = quotient + power;
            }
        quotient.negative_ = a.isNegative() != b.isNegative();
        remainder.negative_ = a.isNegative();
        return {quotient, remainder};
    }
    friend Exact operator/(Exact const& a, Exact const& b) { return divide(a, b).first; }
    friend Exact operator%(Exact const& a, Exact const& b) { return divide(a, b).second; }

    /// Toward zero.
    Exact half() const
    {
        Exact result = *this;
        for (std::size_t i = 0; i < size_; ++i)
            result.limbs_[i] = limbs_[i] >> 1 | (i + 1 < size_ ? limbs_[i + 1] << 31 : 0);
        result.trim(size_);
        return result;
    }

    friend std::strong_ordering operator<=>(Exact const& a, Exact const& b)
    {
        if (a.isNegative() != b.isNegative())
            return a.isNegative() ? std::strong_ordering::less : std::strong_ordering::greater;
        int const order = compareMagnitudes(a, b);
        return (a.isNegative() ? -order : order) <=> 0;
    }
    friend bool operator==(Exact const& a, Exact const& b) { return (a <=> b) == 0; }

private:
    void trim(std::size_t size)
    {
        for (size_ = size; size_ > 0 && limbs_[size_ - 1] == 0;)
            --size_;
    }

    static int compareMagnitudes(Exact const& a, Exact const& b)
    {
        for (std::size_t i = std::max(a.size_, b.size_); i-- > 0;)
            if (a.limbs_[i] != b.limbs_[i])
                return a.limbs_[i] < b.limbs_[i] ? -1 : 1;
        return 0;
    }

    /// |a| - |b| with the sign of `a`, whose magnitude is not the smaller.
    static Exact difference(Exact const& a, Exact const& b)
    {
        Exact result = a;
        std::int64_t borrow = 0;
        for (std::size_t i = 0; i < a.size_; ++i) {
            std::int64_t const d = std::int64_t{a.limbs_[i]} - b.limbs_[i] + borrow;
            result.limbs_[i] = static_cast<std::uint32_t>(d);
            borrow = d < 0 ? -1 : 0;
        }
        result.trim(a.size_);
        return result;
    }

    bool negative_;
    std::size_t size_ = 0;
    std::array<std::uint32_t, 20> limbs_{}; // least significant first, zero from size_ on
};

} // namespace timetest
