#include <korvane/korvane.h>

#include <gtest/gtest.h>

#include <memory>
#include <unistd.h>

TEST(KVURL, NullAnswersWithEmptyTexts)
{
    KVURL const url("");
    EXPECT_TRUE(url.isNull());
    for (KVString const& text :
         {url.getHostnameAndPrefixString(), url.getAbsoluteString(), url.getAsURLString(),
          url.getAsFileSystemString(), url.getPathAsFileSystemString(), url.getContainingFolder(),
          url.getContainingFolderAsURLString(), url.getFilename(), url.getShortFilename(),
          url.getExtension()})
        EXPECT_TRUE(text.empty());
    EXPECT_EQ(url.getString(nullptr), nullptr);
    EXPECT_EQ(url.getURLforIndex(0), nullptr);
    EXPECT_FALSE(url.isSequence());
    EXPECT_FALSE(url.getFSRef(nullptr));
    EXPECT_TRUE(KVURL(static_cast<char const*>(nullptr)).isNull());
    EXPECT_TRUE(KVURL("/bad\xFF").isNull());
    EXPECT_EQ(url, KVURL());
}

TEST(KVURL, PathsAndStrings)
{
    struct Row {
        char const* text;
        bool isDirectory;
        char const* url;
        char const* path;
        char const* folder;
        char const* name;
        char const* shortName;
        char const* extension;
    } const rows[] = {
        {"/a/b.tif", false, "file:///a/b.tif", "/a/b.tif", "/a", "b.tif", "b", "tif"},
        {"/a b/%c.\u00E9", false, "file:///a%20b/%25c.%C3%A9", "/a b/%c.\u00E9", "/a b",
         "%c.\u00E9", "%c", "\u00E9"},
        {"/a/b", true, "file:///a/b/", "/a/b", "/a", "b", "b", ""},
        {"/", true, "file:///", "/", "/", "", "", ""},
        {"/a/.hidden", false, "file:///a/.hidden", "/a/.hidden", "/a", ".hidden", ".hidden", ""},
        {"/a/dot.", false, "file:///a/dot.", "/a/dot.", "/a", "dot.", "dot.", ""},
        {"/a[#]@:1?;", false, "file:///a%5B%23%5D@:1%3F;", "/a[#]@:1?;", "/", "a[#]@:1?;",
         "a[#]@:1?;", ""},
        {"file://host/a%20b/c%2", false, "file://host/a%20b/c%2", "/a b/c%2", "/a b", "c%2", "c%2",
         ""},
    };
    for (Row const& row : rows) {
        KVURL const url(KVString(row.text), row.isDirectory);
        EXPECT_EQ(url.getAsURLString().toUTF8(), row.url);
        EXPECT_EQ(url.getAsFileSystemString().toUTF8(), row.path);
        EXPECT_EQ(url.getPathAsFileSystemString().toUTF8(), row.folder);
        EXPECT_EQ(url.getFilename().toUTF8(), row.name);
        EXPECT_EQ(url.getShortFilename().toUTF8(), row.shortName);
        EXPECT_EQ(url.getExtension().toUTF8(), row.extension);
    }
    std::unique_ptr<char, decltype(&std::free)> const directory(getcwd(nullptr, 0), &std::free);
    EXPECT_EQ(KVURL("clip.mov").getAsFileSystemString().toUTF8(),
              std::string(directory.get()) + "/clip.mov");
    EXPECT_EQ(KVURL("/a b/c").getContainingFolderAsURLString().toUTF8(), "file:///a%20b/");
    EXPECT_EQ(KVURL(KVString("file://host/a")).getHostnameAndPrefixString().toUTF8(),
              "file://host");
    EXPECT_EQ(KVURL("/a").getHostnameAndPrefixString().toUTF8(), "file://");
}

TEST(KVURL, LossyBytesHaveAQuestionMarkForEachUnit)
{
    unsigned int length = 0;
    std::unique_ptr<char[]> const text(KVURL("/\u00E9\U0001F600x").getString(&length));
    EXPECT_STREQ(text.get(), "/???x");
    EXPECT_EQ(length, 5u);
}

TEST(KVURL, KnowsSequences)
{
    struct Row {
        char const* path;
        bool isSequence;
        int start, end;
    } const rows[] = {
        {"/a/b[###].tif:1:20", true, 1, 20}, {"/a/b[@].tif", true, -1, -1},
        {"/a/b[].tif", true, -1, -1},        {"/a/b[#@#].tif:7", true, -1, 7},
        {"/a/[#]/b.tif", false, -1, -1}, // the pattern must be in the last component
        {"/a/b[#x].tif", false, -1, -1},     {"/a/b#].tif", false, -1, -1},
        {"/a/b[##", false, -1, -1},          {"/a:1/b:2", false, -1, 2},
        {"/a/b[#]:x:5", true, -1, 5},        {"/a/b[#]:1:99999999999", true, 1, -1},
        {"/a/b[#]: 1:\t+20 x", true, 1, 20}, {"/a/b[#]:-3:+-5", true, -3, -1},
    };
    for (Row const& row : rows) {
        KVURL const url(row.path);
        EXPECT_EQ(url.isSequence(), row.isSequence) << row.path;
        EXPECT_EQ(url.getSequenceStart(), row.start) << row.path;
        EXPECT_EQ(url.getSequenceEnd(), row.end) << row.path;
    }
    EXPECT_EQ(KVURL("/a/b[###].tif", 1, 20).getSequenceLength(), 20);
    EXPECT_EQ(KVURL("/a/b[###].tif").getSequenceLength(), 1);
}

TEST(KVURL, NamesTheFilesOfASequence)
{
    struct Row {
        char const* path;
        unsigned int index;
        char const* file;
    } const rows[] = {
        {"/a/b[###].tif:1:20", 4, "/a/b005.tif"},
        {"/a/b[@##].tif:1:20", 4, "/a/b5.tif"},
        {"/a/b[#].tif:8:12", 4, "/a/b12.tif"},
        {"/a/b[##].tif", 7, "/a/b07.tif"},
        {"/a/b[].tif:1:20", 4, "/a/b5.tif"},
        {"/[##]/b[##].tif:1:20", 0, "/[##]/b01.tif"},
        {"/a/b[##].tif:1:20", 20, nullptr},
        {"/a/b[##].tif:20:1", 0, nullptr},
        {"/a/b.tif:1:20", 0, nullptr},
    };
    for (Row const& row : rows) {
        std::unique_ptr<KVURL> const file(KVURL(row.path).getURLforIndex(row.index));
        ASSERT_EQ(file != nullptr, row.file != nullptr) << row.path;
        if (row.file) {
            EXPECT_EQ(file->getAsFileSystemString().toUTF8(), row.file);
        }
    }
    EXPECT_EQ(KVURL("/a/b[##].tif:1:20").getSequenceURL().getAsFileSystemString().toUTF8(),
              "/a/b[##].tif");
    // One colon is cut as well, and the scan does not pass a third.
    EXPECT_EQ(KVURL("/a/b[##]:5").getSequenceURL().getAsFileSystemString().toUTF8(), "/a/b[##]");
    EXPECT_EQ(KVURL("/a/b:1:2:3").getSequenceURL().getAsFileSystemString().toUTF8(), "/a/b:1");
    EXPECT_EQ(KVURL("/a/b12").getSequenceURL().getAsFileSystemString().toUTF8(), "/a/b12");
}

TEST(KVUUID, PrintsWithDashesInUpperCase)
{
    KVUUID const uuid{{0x01234567, 0x89abcdef, 0xfedcba98, 0x76543210}};
    std::unique_ptr<char, decltype(&std::free)> const text(uuid.toCStr(), &std::free);
    EXPECT_STREQ(text.get(), "01234567-89AB-CDEF-FEDC-BA9876543210");
}
