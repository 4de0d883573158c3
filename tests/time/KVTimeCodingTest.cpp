#include "time/TimeTesting.h"

#include <korvane/platform/CFNumber.h>
#include <korvane/time/KVTimeCoding.h>
#include <korvane/time/VexTimeRangeObj.h>

using namespace timetest;

TEST(KVTimeCoding, BecomesADictionary)
{
    CMTimeRange const range = {T(lowest, INT32_MIN, 0xFFFFFFFF, highest), T(5, 3, rounded)};
    auto const dictionary = CMTimeRangeCopyAsDictionary(range);
    EXPECT_EQ(CMTimeRangeMakeFromDictionary(dictionary), range);
    auto const* start = dynamic_cast<CFDictionaryRef>(dictionary->value("start"));
    ASSERT_TRUE(start);
    for (char const* key : {"value", "timescale", "flags", "epoch"})
        EXPECT_TRUE(start->value(key)) << key;

    CMTimeRange const backward = {T(0, 1), T(-1, 1)};
    EXPECT_EQ(CMTimeRangeMakeFromDictionary(CMTimeRangeCopyAsDictionary(backward)).duration,
              kCMTimeZero);
    EXPECT_EQ(CMTimeRangeMakeFromDictionary(nullptr), kCMTimeRangeInvalid);
    EXPECT_EQ(CMTimeMakeFromDictionary(nullptr), kCMTimeInvalid);
}

TEST(KVTimeCoding, RefusesADictionaryOfNoTime)
{
    auto const time = CMTimeCopyAsDictionary(T(1, 2));
    struct Row {
        char const* key;
        KVNSRef<NSObject*> value;
    } const rows[] = {
        {"value", nullptr},
        {"epoch", KVMakeRef<VexTimeRangeObj>(R(0, 1))},
        {"timescale", KVMakeRef<NSNumber>(1ll << 31)},
        {"timescale", KVMakeRef<NSNumber>(-(1ll << 31) - 1)},
        {"flags", KVMakeRef<NSNumber>(1ll << 32)},
        {"flags", KVMakeRef<NSNumber>(-1)},
    };
    for (Row const& row : rows) {
        auto const changed =
            KVCFRef<CFMutableDictionaryRef>::adopt(CFDictionaryCreateMutableCopy(nullptr, 0, time));
        EXPECT_EQ(CMTimeMakeFromDictionary(changed), T(1, 2));
        changed->setValue(row.key, row.value);
        EXPECT_EQ(CMTimeMakeFromDictionary(changed), kCMTimeInvalid) << row.key;
    }
}
