#include "TimeExpression.h"

#include <korvane/time/KVTime.h>

#include <charconv>
#include <string>

namespace {

constexpr int greatestDepth = 100;
constexpr int greatestPlaces = 9; // a timescale has 31 bits

bool isDigit(char c)
{
    return c >= '0' && c <= '9';
}

class Parser {
public:
    explicit Parser(std::string_view text) : text_(text) {}

    CMTime expression()
    {
        CMTime const result = sum();
        end();
        return result;
    }

    CMTime literal()
    {
        skipBlanks();
        bool const negative = takeSign();
        CMTime const result = number();
        end();
        return negative ? negated(result) : result;
    }

private:
    CMTime sum()
    {
        if (++depth_ > greatestDepth)
            fail("is nested too deeply");
        CMTime result = product();
        for (;;) {
            if (take('+'))
                result = KV_CMTimeSaferAdd(result, product());
            else if (take('-'))
                result = KV_CMTimeSaferSubtract(result, product());
            else
                break;
        }
        --depth_;
        return result;
    }

    CMTime product()
    {
        CMTime result = factor();
        for (;;) {
            bool const times = take('*');
            if (!times && !take('/'))
                return result;
            CMTime const other = factor();
            // The operators look at the left side's bit alone.
            bool const rounded = CMTimeIsRounded(other);
            result = times ? result * other : result / other;
            if (rounded && CMTimeIsNumeric(result))
                result.flags |= kCMTimeFlags_HasBeenRounded;
        }
    }

    CMTime factor()
    {
        skipBlanks();
        bool const negative = takeSign();
        CMTime result;
        if (take('(')) {
            result = sum();
            if (!take(')'))
                fail("lacks a )");
        } else {
            result = number();
        }
        return negative ? negated(result) : result;
    }

    CMTime number()
    {
        struct Word {
            std::string_view text;
            CMTime time;
        } const words[] = {{"indef", kCMTimeIndefinite},
                           {"inval", kCMTimeInvalid},
                           {"inf", kCMTimePositiveInfinity}};
        for (Word const& word : words)
            if (text_.substr(at_).starts_with(word.text)) {
                at_ += word.text.size();
                return word.time;
            }

        std::size_t const start = at_;
        std::int64_t const whole = digits();
        if (peek() == '/' && at_ + 1 < text_.size() && isDigit(text_[at_ + 1])) {
            ++at_;
            std::size_t const scaleAt = at_;
            std::int64_t const timescale = digits();
            if (timescale < 1 || timescale > INT32_MAX)
                fail(scaleAt, "is not a timescale from 1 to 2147483647");
            return CMTimeMake(whole, static_cast<CMTimeScale>(timescale));
        }
        if (peek() != '.' || at_ + 1 >= text_.size() || !isDigit(text_[at_ + 1]))
            return CMTimeMake(whole, 1);
        ++at_;
        std::int64_t value = whole, timescale = 1;
        for (int places = 0; isDigit(peek()); ++places, ++at_) {
            if (places == greatestPlaces)
                fail(start, "has more than 9 decimal places");
            timescale *= 10;
            if (__builtin_mul_overflow(value, 10, &value) ||
                __builtin_add_overflow(value, peek() - '0', &value))
                fail(start, "does not fit 64 bits");
        }
        return CMTimeMake(value, static_cast<CMTimeScale>(timescale));
    }

    std::int64_t digits()
    {
        std::int64_t value = 0;
        char const *const first = text_.data() + at_, *const last = text_.data() + text_.size();
        if (!isDigit(peek()))
            fail("is not a time");
        auto const [next, error] = std::from_chars(first, last, value);
        if (error != std::errc())
            fail("does not fit 64 bits");
        at_ += static_cast<std::size_t>(next - first);
        return value;
    }

    static CMTime negated(CMTime const& time) { return CMTimeMultiply(time, -1); }

    char peek() const { return at_ < text_.size() ? text_[at_] : '\0'; }

    void skipBlanks()
    {
        while (peek() == ' ' || peek() == '\t')
            ++at_;
    }

    bool take(char c)
    {
        skipBlanks();
        bool const there = peek() == c;
        at_ += there;
        return there;
    }

    bool takeSign()
    {
        if (peek() == '+' || peek() == '-')
            return text_[at_++] == '-';
        return false;
    }

    void end()
    {
        skipBlanks();
        if (at_ != text_.size())
            fail("goes on where it should end");
    }

    [[noreturn]] void fail(std::size_t offset, char const* what) const
    {
        throw TimeSyntaxError(offset, "\"" + std::string(text_.substr(0, 60)) + "\" " + what);
    }
    [[noreturn]] void fail(char const* what) const { fail(at_, what); }

    std::string_view text_;
    std::size_t at_ = 0;
    int depth_ = 0;
};

} // namespace

TimeSyntaxError::TimeSyntaxError(std::size_t offset, std::string const& what)
    : std::runtime_error(what + " (character " + std::to_string(offset + 1) + ")")
{}

CMTime parseTime(std::string_view text)
{
    return Parser(text).literal();
}

CMTime evaluateTime(std::string_view expression)
{
    return Parser(expression).expression();
}
