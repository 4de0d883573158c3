// Every operation on times, with records and numbers as they come; and whole sets of ranges.

#include <korvane/korvane.h>

#include <cstdlib>
#include <cstring>

namespace {

/// Takes values off the front of the input, zeros once it is used up.
class Input {
public:
    Input(std::uint8_t const* data, std::size_t size) : data_(data), left_(size) {}

    template <class T>
    T next()
    {
        T value{};
        std::size_t const count = std::min(left_, sizeof value);
        if (count != 0)
            std::memcpy(&value, data_, count);
        data_ += count;
        left_ -= count;
        return value;
    }
    bool isEmpty() const { return left_ == 0; }

private:
    std::uint8_t const* data_;
    std::size_t left_;
};

void check(bool holds)
{
    if (!holds)
        std::abort();
}

/// Keeps a result from being optimised away.
volatile std::int64_t used;

void use(CMTime const& time)
{
    used = time.value;
}

void calculate(CMTime const& a, CMTime const& b, CMTime const& c, std::int64_t number, double real)
{
    CMTime const sum = KV_CMTimeSaferAdd(a, b);
    CMTime const back = KV_CMTimeSaferSubtract(sum, b);
    if (CMTimeIsNumeric(back) && !CMTimeIsRounded(back) && a.epoch == 0 && b.epoch == 0)
        check(CMTimeCompare(back, a) == 0);
    check(CMTimeCompare(a, b) == -CMTimeCompare(b, a));
    use(KV_CMTimeMultiply64Divide64(a, number, b.value));
    use(KV_CMTimeMultiply64Divide64(a, b.value, number));
    for (bool const exact : {false, true})
        use(KV_CMTimeRemap(a, b, c, exact));
    use(a * b);
    use(a / b);
    use(a * real);
    use(a / real);
    use(CMTimeConvertScale(a, b.timescale, static_cast<CMTimeRoundingMethod>(c.flags % 4)));
    use(KV_CMTimeRoundToSampleDuration(a, b));
    use(KV_CMTimeFromSampleNumberAndDuration(number, a));
    use(KV_CMTimeGetSampleTime(a, b));
    use(KV_CMTimeHalve(a));
    use(KV_CMTimeGetPreferredSampleDurationAlias(a));
    use(KV_CMTimeMakeWithSecondsRoundToNearest(real, a.timescale));
    use(KV_CMTimeMakeWithSecondsRoundToCeiling(real, a.timescale));
    used = KV_CMTimeToFractionString(a).size();
    used = VexTimeToFrameWithRate(a, real);
    check(KVMakeRef<VexTimeObj>(a)->hash() ==
          KVMakeRef<VexTimeObj>(CMTimeMakeFromDictionary(CMTimeCopyAsDictionary(a)))->hash());
    used = GetCMTimeHash(a);
    VexTimeRangeAdjustToBeWithinRangeWithMinimumDuration({a, b}, {b, c}, a);
}

} // namespace

extern "C" int LLVMFuzzerTestOneInput(std::uint8_t const* data, std::size_t size)
{
    KVSetLogSink([](char const*, std::size_t) {});
    Input input(data, std::min<std::size_t>(size, 4096));
    auto const a = input.next<CMTime>(), b = input.next<CMTime>(), c = input.next<CMTime>();
    auto const number = input.next<std::int64_t>();
    calculate(a, b, c, number, input.next<double>());

    VexTimeRangeArray sets[2];
    for (int i = 0; !input.isEmpty(); i = 1 - i)
        sets[i].push_back(KVMakeRef<VexTimeRangeObj>(input.next<CMTimeRange>()));
    VexTimeRangesAddUnsortedRanges(sets[0], sets[1]);
    VexTimeRangesSubtractUnsortedRanges(sets[0], sets[1]);
    VexTimeRangesANDMask(sets[0], sets[1]);
    VexTimeRangesMix(sets[0], sets[1]);
    return 0;
}
