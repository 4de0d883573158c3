#pragma once

#include <korvane/platform/CMTime.h>

#include <string_view>

namespace kv {

/// A short text on the stack, long enough for any time.
class TimeText {
public:
    std::string_view view() const noexcept { return {text_, length_}; }
    char const* c_str() const noexcept { return text_; }

    TimeText& operator<<(std::string_view text) noexcept;
    TimeText& operator<<(std::int64_t number) noexcept;
    /// With six places, as "%lf" has it in the C locale.
    TimeText& operator<<(double number) noexcept;

private:
    char text_[160] = {};
    std::size_t length_ = 0;
};

/// What the name of a time that has no seconds to print is: "inval", "indef"; empty for all others.
std::string_view nameOfNoNumber(CMTime const& time) noexcept;

TimeText secondsText(CMTime const& time) noexcept;
TimeText fractionText(CMTime const& time) noexcept;

} // namespace kv
