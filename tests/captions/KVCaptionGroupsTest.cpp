#include "Captions.h"

#include <gtest/gtest.h>

#include <chrono>
#include <sstream>

namespace {

/// "a0-2 b5-6": captions of a letter, from and to seconds.
KVCaptionArray captionsOf(std::string const& rows)
{
    KVCaptionArray captions;
    std::istringstream in(rows);
    for (std::string row; in >> row;) {
        std::size_t const dash = row.find('-');
        captions.push_back(KVMakeRef<KVCaption>(
            KVMakeRef<NSAttributedString>(row.substr(0, 1).c_str()),
            rangeOf(std::stoll(row.substr(1, dash - 1)), std::stoll(row.substr(dash + 1)))));
    }
    return captions;
}

/// The texts of the groups: "ab|c".
std::string groupsOf(std::string const& rows, bool includeTouching)
{
    std::string result;
    for (auto const& group : KVGroupOverlappingCaptions(captionsOf(rows), includeTouching)) {
        result += result.empty() ? "" : "|";
        for (KVCaption const* caption : group)
            result += caption->text().toUTF8();
    }
    return result;
}

TEST(KVGroupOverlappingCaptions, JoinsWhatStartsBeforeTheGroupsEnd)
{
    struct Row {
        char const* captions;
        char const* apart;
        char const* touching;
    } const rows[] = {
        {"", "", ""},
        {"a0-2 b2-3 c5-6", "a|b|c", "ab|c"},
        {"a0-10 b1-2 c3-4", "abc", "abc"},
        {"a0-2 b1-4 c3-5 d5-6", "abc|d", "abcd"},
        // One of no length begins a group all the same, and joins one that is open.
        {"a5-5 b6-7", "a|b", "a|b"},
        {"a0-9 b5-5", "ab", "ab"},
        // Equals join together...
        {"a0-2 a0-2 b1-3", "aab", "aab"},
        // ...or, where only one joins, leave together: these do not overlap themselves.
        {"a5-5 a5-5 b6-7", "a|b", "aa|b"},
        // An equal later in an unsorted row leaves as well.
        {"a0-2 b5-6 a0-2", "a|b", "a|b"},
    };
    for (Row const& row : rows) {
        EXPECT_EQ(groupsOf(row.captions, false), row.apart) << row.captions;
        EXPECT_EQ(groupsOf(row.captions, true), row.touching) << row.captions;
    }
    EXPECT_EQ(KVGroupOverlappingCaptions({nullptr, captionsOf("a0-1")[0], nullptr}, false).size(),
              1u);
}

TEST(KVGroupOverlappingCaptions, TakesTimeInProportionWhateverTheOverlaps)
{
    auto const text = KVMakeRef<NSAttributedString>("one text for all");
    // All apart, all in one group, all equal.
    for (int const kind : {0, 1, 2}) {
        KVCaptionArray captions;
        for (int i = 0; i < 50'000; ++i)
            captions.push_back(KVMakeRef<KVCaption>(
                text, kind == 2 ? rangeOf(5, 5) : rangeOf(i, kind == 1 ? 1'000'000 : i + 1)));
        auto const start = std::chrono::steady_clock::now();
        EXPECT_FALSE(KVGroupOverlappingCaptions(captions, false).empty());
        // A pass over the rest for each caption would take minutes.
        EXPECT_LT(std::chrono::steady_clock::now() - start, std::chrono::seconds(10));
    }
}

} // namespace
