#include <korvane/korvane.h>

#include <gtest/gtest.h>

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

TEST(CFDictionary, LargeOnesFindTheirKeysAfterEveryChange)
{
    auto key = [](int i) { return "key " + std::to_string(i); };
    auto const dictionary = KVMakeRef<__CFDictionary>();
    for (int i = 0; i < 40; ++i)
        dictionary->setValue(key(i), KVMakeRef<NSNumber>(i));
    auto const copy = KVMakeRef<__CFDictionary>(*dictionary);
    // Down past the size at which they no longer keep an index, and up again.
    for (int removed = 0; removed < 35; ++removed) {
        dictionary->setValue(key(removed), nullptr);
        for (int i = 0; i < 40; ++i)
            ASSERT_EQ(dictionary->value(KVString(key(i)).cf_str()) != nullptr, i > removed);
    }
    for (int i = 0; i < 40; ++i)
        dictionary->setValue(key(i), KVMakeRef<NSNumber>(i));
    EXPECT_EQ(dictionary->count(), 40u);
    EXPECT_EQ(dictionary->keyAtIndex(0)->description().toUTF8(), key(35));
    EXPECT_TRUE(CFEqual(copy, dictionary));
    dictionary->removeAllValues();
    EXPECT_FALSE(dictionary->value(KVString(key(1)).cf_str()));
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
