#include <korvane/korvane.h>

#include <gtest/gtest.h>

#include <cmath>

TEST(CFDictionary, KeepsTheOrderOfFirstInsertion)
{
    auto const dictionary =
        KVCFRef<CFMutableDictionaryRef>::adopt(CFDictionaryCreateMutable(nullptr, 0));
    auto number = [](int value) { return KVMakeRef<NSNumber>(value); };
    dictionary->setValue("b", number(1));
    dictionary->setValue("a", number(2));
    dictionary->setValue("b", number(3));
    EXPECT_EQ(dictionary->description().toUTF8(), "{\n    b = 3;\n    a = 2;\n}");
    auto const copy = KVCFRef<CFDictionaryRef>::adopt(CFDictionaryCreateCopy(nullptr, dictionary));
    CFDictionarySetValue(dictionary, KVString("b").cf_str(), nullptr);
    EXPECT_EQ(CFDictionaryGetCount(dictionary), 1);
    EXPECT_FALSE(CFDictionaryContainsKey(dictionary, KVString("b").cf_str()));
    EXPECT_EQ(CFDictionaryGetCount(copy), 2);
    EXPECT_FALSE(CFEqual(copy, dictionary));
    dictionary->setValue("b", number(3));
    EXPECT_TRUE(CFEqual(copy, dictionary)); // whatever the order
}

TEST(CFDictionary, ReplacingAValueByItselfKeepsIt)
{
    auto const dictionary = KVMakeRef<__CFDictionary>();
    dictionary->setValue("k", KVMakeRef<NSNumber>(7));
    dictionary->setValue("k", dictionary->value("k"));
    EXPECT_EQ(dictionary->value("k")->description(), "7");
}

TEST(CFData, CopiesAreTheirOwn)
{
    auto const data = KVCFRef<CFMutableDataRef>::adopt(CFDataCreateMutable(nullptr, 0));
    CFDataAppendBytes(data, "abc", 3);
    auto const copy = KVCFRef<CFDataRef>::adopt(CFDataCreateCopy(nullptr, data));
    CFDataSetLength(data, 5);
    EXPECT_EQ(CFDataGetMutableBytePtr(data)[4], 0);
    EXPECT_EQ(CFDataGetLength(copy), 3);
    EXPECT_EQ(data->description().toUTF8(), "<61626300 00>");
    EXPECT_EQ(CFDataCreateCopy(nullptr, nullptr), nullptr);
    EXPECT_EQ(CFDataGetLength(nullptr), 0);
}

TEST(CMTime, SecondsOfWhatIsNoNumber)
{
    auto flagged = [](std::uint32_t flags) { return CMTimeGetSeconds(CMTime{3, 2, flags, 0}); };
    EXPECT_EQ(flagged(1), 1.5);
    EXPECT_EQ(flagged(3), 1.5);
    EXPECT_EQ(flagged(1 | 4), HUGE_VAL);
    EXPECT_EQ(flagged(1 | 8), -HUGE_VAL);
    for (std::uint32_t flags : {0u, 2u, 1u | 16u, 4u}) {
        EXPECT_TRUE(std::isnan(flagged(flags)));
        EXPECT_FALSE(std::signbit(flagged(flags)));
    }
}
