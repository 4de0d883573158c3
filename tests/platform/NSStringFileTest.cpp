#include <korvane/korvane.h>
#include <support/TemporaryFolder.h>

#include <gtest/gtest.h>

#include <cerrno>

namespace {

using namespace std::string_view_literals;

TEST(NSStringFile, AMarkDecidesThenStrictUTF8ThenWindows1252)
{
    struct Row {
        std::string_view bytes;
        std::u16string_view text;
        NSStringEncoding encoding;
    } const rows[] = {
        {"", u"", NSUTF8StringEncoding},
        {"caf\xC3\xA9", u"café", NSUTF8StringEncoding},
        {"\xEF\xBB\xBF"
         "A",
         u"A", NSUTF8StringEncoding},
        // Only the first mark is one.
        {"\xEF\xBB\xBF\xEF\xBB\xBF"
         "A",
         u"\uFEFFA", NSUTF8StringEncoding},
        {"\xFE\xFF\0A\x20\xAC"sv, u"A€", NSUTF16BigEndianStringEncoding},
        {"\xFF\xFE"
         "A\0\xAC\x20"sv,
         u"A€", NSUTF16LittleEndianStringEncoding},
        // Half a pair is kept as it stands.
        {"\xFE\xFF\xD8\x3D\0A"sv,
         u"\xD83D"
         u"A",
         NSUTF16BigEndianStringEncoding},
        {"\0\0\xFE\xFF\0\1\xF6\0"sv, u"😀", NSUTF32BigEndianStringEncoding},
        {"\xFF\xFE\0\0\0\xF6\1\0"sv, u"😀", NSUTF32LittleEndianStringEncoding},
        {"caf\xE9", u"café", NSWindowsCP1252StringEncoding},
        {"\x80\x81\x9F\xFF", u"\u20AC\u0081\u0178\u00FF", NSWindowsCP1252StringEncoding},
        // Overlong, a surrogate, beyond the last character, cut short: not UTF-8.
        {"\xC0\xAF", u"\u00C0\u00AF", NSWindowsCP1252StringEncoding},
        {"\xED\xA0\x80", u"\u00ED\u00A0\u20AC", NSWindowsCP1252StringEncoding},
        {"\xF4\x90\x80\x80", u"\u00F4\u0090\u20AC\u20AC", NSWindowsCP1252StringEncoding},
        {"a\xE2\x82", u"a\u00E2\u201A", NSWindowsCP1252StringEncoding},
    };
    for (Row const& row : rows) {
        NSStringEncoding used{};
        KVString const text = NSStringWithBytes(row.bytes, &used);
        EXPECT_FALSE(text.isNull());
        EXPECT_TRUE(text.view() == row.text) << text.toUTF8();
        EXPECT_EQ(used, row.encoding) << text.toUTF8();
    }
}

TEST(NSStringFile, BytesThatDoNotFitTheirMarkGiveNothing)
{
    for (std::string_view bytes : {
             "\xEF\xBB\xBF\xE9"sv,       // Latin 1 behind a mark of UTF-8
             "\xFE\xFF\0"sv,             // half a unit
             "\0\0\xFE\xFF\0\0"sv,       // half a character
             "\0\0\xFE\xFF\0\x11\0\0"sv, // beyond U+10FFFF
             "\xFF\xFE\0\0\0\xD8\0\0"sv, // a surrogate
         })
        EXPECT_TRUE(NSStringWithBytes(bytes).isNull());
}

TEST(NSStringFile, FilesComeAndGoAndTellWhyNot)
{
    TemporaryFolder const folder;
    std::string const path = folder.path("text");
    ASSERT_FALSE(NSStringWriteToURL("longer than the next", KVURL(path.c_str())));
    ASSERT_FALSE(NSStringWriteToURL("caf\xC3\xA9", KVURL(path.c_str())));
    KVNSRef<NSError*> error;
    EXPECT_EQ(NSStringWithContentsOfURL(KVURL(path.c_str()), nullptr, &error).toUTF8(), "café");
    EXPECT_FALSE(error);

    struct Row {
        KVURL url;
        int error;
    } const rows[] = {
        {KVURL((path + "/none").c_str()), ENOTDIR},
        {KVURL(folder.path("").c_str()), EISDIR},
        {KVURL(), ENOENT},
        {KVURL(KVString("file:///dev/null%00")), ENOENT},
        {KVURL(KVString("http://host/dev/null")), ENOENT},
    };
    for (Row const& row : rows) {
        EXPECT_TRUE(NSStringWithContentsOfURL(row.url, nullptr, &error).isNull());
        ASSERT_TRUE(error);
        EXPECT_EQ(error->domain().toUTF8(), "NSPOSIXErrorDomain");
        EXPECT_EQ(error->code(), row.error);
        auto const failed = NSStringWriteToURL("x", row.url);
        ASSERT_TRUE(failed);
        EXPECT_EQ(failed->code(), row.error);
    }
    EXPECT_EQ(NSStringWriteToURL("x", KVURL("/dev/full"))->code(), ENOSPC);
}

} // namespace
