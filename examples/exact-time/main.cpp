// Cuts on a frame grid, without drift and without silent loss.

#include <korvane/korvane.h>

#include <iostream>

int main()
{
    CMTime const frame = CMTimeMake(1001, 24000);

    // A cut that was made at 3.52 seconds, on the frame that is on the screen then.
    CMTime const cut = KV_CMTimeFloorToSampleDuration(CMTimeMake(352, 100), frame);
    std::cout << KV_CMTimeToFractionString(cut) << '\n'; // 3.503500(84084/24000)

    // A shot of 100 frames from there, and what is left of it without a second in the middle.
    auto const shot = KVMakeRef<VexTimeRangeObj>(CMTimeRangeMake(cut, 100 * frame));
    auto const gap =
        KVMakeRef<VexTimeRangeObj>(CMTimeRangeMake(CMTimeMake(5, 1), CMTimeMake(1, 1)));
    for (VexTimeRangeObj const* piece : VexTimeRangeObjSubtractSortedRanges(shot, {gap}))
        std::cout << piece->description() << '\n'; // [3.503500, 5.000000) [6.000000, 7.674333)

    // What no time could hold is rounded, and says so.
    CMTime const sum = KV_CMTimeSaferAdd(CMTimeMake(1, 1000000007), CMTimeMake(1, 998244353));
    std::cout << (CMTimeIsRounded(sum) ? "rounded" : "exact") << '\n'; // rounded
}
