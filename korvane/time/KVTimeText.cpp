#include <korvane/time/KVTime.h>
#include <korvane/time/TimeText_p.h>

#include <algorithm>
#include <charconv>
#include <ios>
#include <ostream>

namespace kv {

TimeText& TimeText::operator<<(std::string_view text) noexcept
{
    std::size_t const room = sizeof text_ - 1 - length_;
    length_ += text.copy(text_ + length_, room);
    return *this;
}

TimeText& TimeText::operator<<(std::int64_t number) noexcept
{
    char digits[24];
    auto const [end, error] = std::to_chars(digits, digits + sizeof digits, number);
    return *this << std::string_view(digits, static_cast<std::size_t>(end - digits));
}

TimeText& TimeText::operator<<(double number) noexcept
{
    // The greatest time is 2^63 seconds.
    char digits[40];
    auto const [end, error] =
        std::to_chars(digits, digits + sizeof digits, number, std::chars_format::fixed, 6);
    return *this << std::string_view(digits, static_cast<std::size_t>(end - digits));
}

namespace {

bool hasAll(CMTime const& time, std::uint32_t flags) noexcept
{
    return (time.flags & flags) == flags;
}

bool isIndefinite(CMTime const& time) noexcept
{
    return hasAll(time, kCMTimeFlags_Valid | kCMTimeFlags_Indefinite);
}

struct Marks {
    CMTime const& time;
    friend TimeText& operator<<(TimeText& text, Marks marks) noexcept
    {
        return text << (CMTimeIsRounded(marks.time) ? "+round" : "")
                    << (isIndefinite(marks.time) ? "+indef" : "");
    }
};

} // namespace

std::string_view nameOfNoNumber(CMTime const& time) noexcept
{
    if (CMTimeIsNumeric(time) || hasAll(time, kCMTimeFlags_Valid | kCMTimeFlags_PositiveInfinity) ||
        hasAll(time, kCMTimeFlags_Valid | kCMTimeFlags_NegativeInfinity))
        return {};
    return CMTimeIsValid(time) ? "indef" : "inval";
}

TimeText secondsText(CMTime const& time) noexcept
{
    TimeText text;
    if (std::string_view const name = nameOfNoNumber(time); !name.empty())
        return text << name;
    text << CMTimeGetSeconds(time);
    if (time.epoch != 0)
        text << "+epoch=" << time.epoch;
    return text << Marks{time};
}

TimeText fractionText(CMTime const& time) noexcept
{
    if (!CMTimeIsNumeric(time) && time.value == 0)
        return secondsText(time);
    TimeText text;
    text << CMTimeGetSeconds(time) << "(" << time.value << "/" << std::int64_t{time.timescale};
    if (time.epoch != 0)
        text << "+epoch=" << time.epoch;
    return text << Marks{time} << ")";
}

} // namespace kv

KVString KV_CMTimeToString(CMTime time)
{
    return KVString::fromUTF8(kv::secondsText(time).view());
}

KVString KV_CMTimeToFractionString(CMTime time)
{
    return KVString::fromUTF8(kv::fractionText(time).view());
}

KVString VexTimeToSampleString(CMTime time, CMTime sampleDuration)
{
    kv::TimeText text;
    return KVString::fromUTF8((text << KV_CMTimeGetSampleNumber(time, sampleDuration)).view());
}

KVString VexTimeCopySampleString(CMTime time, CMTime sampleDuration)
{
    return VexTimeToSampleString(time, sampleDuration);
}

int getPreferredTimeScaleIndex()
{
    static int const index = std::ios_base::xalloc();
    return index;
}

int getPreferredTimeScaleRoundingIndex()
{
    static int const index = std::ios_base::xalloc();
    return index;
}

std::ostream& operator<<(std::ostream& stream, KVVexTimePreferredTimeScale option)
{
    stream.iword(getPreferredTimeScaleIndex()) = option.timescale;
    stream.iword(getPreferredTimeScaleRoundingIndex()) = static_cast<long>(option.rounding);
    return stream;
}

std::ostream& operator<<(std::ostream& stream, CMTime const& time)
{
    if (std::string_view const name = kv::nameOfNoNumber(time); !name.empty())
        return stream << name;

    long const timescale = stream.iword(getPreferredTimeScaleIndex());
    if (timescale > 0 && CMTimeIsNumeric(time)) {
        auto const method =
            static_cast<CMTimeRoundingMethod>(stream.iword(getPreferredTimeScaleRoundingIndex()));
        CMTime const there = CMTimeConvertScale(time, static_cast<CMTimeScale>(timescale), method);
        if (CMTimeIsNumeric(there)) {
            stream << '[' << there.value << '/' << there.timescale;
            if (there.epoch != 0)
                stream << " +" << there.epoch;
            return stream << (CMTimeIsRounded(there) ? " +round]" : "]");
        }
    }

    stream << CMTimeGetSeconds(time);
    if (time.epoch != 0)
        stream << "+epoch=" << time.epoch;
    return stream << (CMTimeIsRounded(time) ? "+round" : "");
}
