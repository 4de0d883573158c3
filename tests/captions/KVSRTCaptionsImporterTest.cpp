#include "Captions.h"

#include <gtest/gtest.h>

#include <filesystem>
#include <fstream>

namespace {

using namespace std::string_literals;
using Importer = KVSRTCaptionsImporter;

CMTime const milliseconds = CMTimeMake(1, 1000);

struct Result {
    std::vector<KVCaptionArray> captions;
    long long code; // 0: success
};

Result import(std::string const& text, CMTime frame = milliseconds, CMTime offset = kCMTimeZero)
{
    Result result{{}, 0};
    auto const importer = KVMakeRef<Importer>();
    auto const error =
        importer->importCaptionsFromString(NSStringWithBytes(text), result.captions, frame, offset);
    if (error) {
        EXPECT_EQ(error->domain().toUTF8(), "KVSRTCaptionsImporterError");
        result.code = error->code();
    }
    return result;
}

/// The captions' texts, "|" between them.
std::string textsOf(std::vector<KVCaptionArray> const& captions)
{
    std::string texts;
    for (std::size_t i = 0; i < captions.size(); ++i)
        texts += (i ? "|" : "") + captions[i].at(0)->text().toUTF8();
    return texts;
}

std::string const time = "00:00:01,000 --> 00:00:02,000\n";

// --- Blocks ---

TEST(SRTImport, BlocksAndTheirErrors)
{
    struct Row {
        std::string file;
        int code;
        std::string texts; // of the captions before the error
    } const rows[] = {
        {"1\n" + time + "A\n", 0, "A"},
        {"1\n" + time + "A", 0, "A"},
        {"1\n" + time + "A\nB\n\n2\n" + time + "C\n\n\n\n", 0, "A\nB|C"},
        {"1\r\n00:00:01,000 --> 00:00:02,000\r\nA\r\nB\r\n\r\n2\r\n" + time + "C", 0, "A\nB|C"},
        // A lone carriage return is text; so is one in front of a line end in two.
        {"1\n" + time + "A\rB\n", 0, "A\rB"},
        {"1\n" + time + "A\r\r\n", 0, "A\r"},
        // A line of blanks is not empty.
        {"1\n" + time + "A\n \nB\n", 0, "A\n \nB"},
        {"1\n" + time + "A\n\n \n", 1, "A"},
        // The first text line is taken even if it is empty: one more empty line ends the block.
        {"1\n" + time, 0, ""},
        {"1\n00:00:01,000 --> 00:00:02,000", 0, ""},
        {"1\n" + time + "\n\n2\n" + time + "B\n", 0, "|B"},
        {"1\n" + time + "\n2\n" + time + "B\n\n3\n" + time + "C", 1, "\n2\n" + time + "B"},
        // Numbers.
        {"", 1, ""},
        {"2\n" + time + "A\n", 1, ""},
        {"\n1\n" + time + "A\n", 1, ""},
        {" 1\n" + time + "A\n", 1, ""},
        {"\xEF\xBB\xBF"
         "1\n" +
             time + "A\n",
         0, "A"},
        {"\xEF\xBB\xBF\xEF\xBB\xBF"
         "1\n" +
             time + "A\n",
         1, ""},
        {"1 \n" + time + "A\n", 1, ""},
        {"1.\n" + time + "A\n", 1, ""},
        {"10\n" + time + "A\n", 1, ""},
        {"1\n" + time + "A\n\n2\n" + time + "B\n\n4\n" + time + "D\n", 1, "A|B"},
        {"1\n" + time + "A\n\n02\n" + time + "B\n", 0, "A|B"},
        {"1\n" + time + "A\n\n-2\n" + time + "B\n", 1, "A"},
        {"1\n" + time + "A\n\n" + std::string(400, '9') + "\n" + time + "B\n", 1, "A"},
        {"1\n" + time + "A\n\n\u0662\n" + time + "B\n", 1, "A"}, // an Arabic digit
        // Time lines.
        {"1", 1, ""},
        {"1\n", 1, ""},
        {"1\n\n" + time + "A\n", 1, ""},
        {"1\n00:00:01,000 -> 00:00:02,000\nA\n", 1, ""},
        {"1\n00:00:01,000 --> 00:00:02,000 --> 00:00:03,000\nA\n", 1, ""},
        {"1\n\t00:00:01,000-->00:00:02.000 \u00A0\nA\n", 0, "A"},
        {"1\n00:00:01 --> 00:00:02,000\nA\n", 2, ""},
        {"1\n00:00:01,000 --> \nA\n", 2, ""},
        {"1\n00:00:01,000 --> 00:00:02,000 X1:40\nA\n", 2, ""},
        // Ranges.
        {"1\n00:00:01,000 --> 00:00:01,000\nA\n", 3, ""},
        {"1\n00:00:02,000 --> 00:00:01,000\nA\n", 3, ""},
        {"1\n00:00:01,000 --> " + std::string(400, '9') + ":00:00,000\nA\n", 3, ""},
        {"1\n-" + std::string(400, '9') + ":" + std::string(400, '9') + ":0,0 --> 0:0:0,0\nA\n", 3,
         ""},
    };
    for (Row const& row : rows) {
        Result const result = import(row.file);
        EXPECT_EQ(result.code, row.code) << row.file;
        EXPECT_EQ(textsOf(result.captions), row.texts) << row.file;
    }
}

TEST(SRTImport, EveryCaptionIsASubRipCaptionInAnArrayOfItsOwn)
{
    Result const result = import("1\n" + time + "A\n\n2\n" + time + "B\n");
    ASSERT_EQ(result.captions.size(), 2u);
    for (KVCaptionArray const& one : result.captions) {
        ASSERT_EQ(one.size(), 1u);
        EXPECT_EQ(one[0]->format(), 3);
        EXPECT_TRUE(one[0]->copyTextColorAtIndex(0)->isEqual(NSColor::whiteColor()));
        EXPECT_TRUE(one[0]->copyBackgroundColorAtIndex(0)->isEqual(NSColor::blackColor()));
        EXPECT_EQ(one[0]->attributedString()->attribute(NSFontAttributeName, 0),
                  NSFont::systemFont());
    }
}

TEST(SRTImport, AnyCutOfAFileIsReadOrRefused)
{
    std::string const file =
        "1\r\n00:00:01,000 --> 00:00:02,500\r\n<b>naïve</b> {i}😀{/i}\r\n\r\n"
        "2\r\n00:00:03,000 --> 00:00:04,000\r\n<font color=\"red\">A</font>\r\n";
    for (std::size_t length = 0; length <= file.size(); ++length) {
        Result const result = import(file.substr(0, length));
        EXPECT_LE(result.captions.size(), 2u);
        EXPECT_EQ(result.code == 0 && result.captions.empty(), false) << length;
    }
}

TEST(SRTImport, ErrorsHaveTwoEmptyTexts)
{
    std::vector<KVCaptionArray> captions;
    auto const importer = KVMakeRef<Importer>();
    for (std::string const& path :
         {"/none/such.srt"s, std::filesystem::temp_directory_path().string()}) {
        auto const error = importer->importCaptionsFromURL(KVURL(path.c_str()), captions,
                                                           milliseconds, kCMTimeZero);
        ASSERT_TRUE(error);
        EXPECT_EQ(error->code(), 1);
        for (char const* key : {NSLocalizedDescriptionKey, NSLocalizedFailureReasonErrorKey})
            EXPECT_TRUE(CFEqual(error->userInfo(key), CFStringGetEmpty())) << key;
    }
}

TEST(SRTImport, FilesAreDecodedFirst)
{
    std::string const path = std::filesystem::temp_directory_path() / "korvane-import-test.srt";
    std::string const latin = "1\n" + time + "caf\xE9\n";
    std::string utf16 = "\xFF\xFE";
    for (char c : "1\n" + time + "caf\xE9\n")
        utf16 += c, utf16 += '\0';
    for (std::string const& bytes : {latin, utf16}) {
        std::ofstream(path, std::ios::binary) << bytes;
        std::vector<KVCaptionArray> captions;
        EXPECT_FALSE(KVMakeRef<Importer>()->importCaptionsFromURL(KVURL(path.c_str()), captions,
                                                                  milliseconds, kCMTimeZero));
        EXPECT_EQ(textsOf(captions), "café");
    }
    std::filesystem::remove(path);
}

// --- Times ---

TEST(SRTImport, TimesAreFlooredToTicksMovedAndRaisedToFrames)
{
    struct Row {
        char const* times;
        CMTime frame;
        CMTime offset;
        CMTime start;
        CMTime end;
    } const rows[] = {
        {"00:00:01,000 --> 00:00:02,000",
         CMTimeMake(1, 25),
         kCMTimeZero,
         {25, 25, 1, 0},
         {50, 25, 1, 0}},
        {"00:00:01,500 --> 01:02:05,500",
         milliseconds,
         kCMTimeZero,
         {1500, 1000, 1, 0},
         {3725500, 1000, 1, 0}},
        // 24000 ticks a second make 23.976 frames of 1001 ticks.
        {"00:00:00,001 --> 00:00:01,000",
         CMTimeMake(1001, 24000),
         kCMTimeZero,
         {1001, 24000, 1, 0},
         {24024, 24000, 1, 0}},
        {"01:00:01,000 --> 01:00:02,000",
         CMTimeMake(1, 25),
         CMTimeMake(-3600, 1),
         {25, 25, 1, 0},
         {50, 25, 1, 0}},
        {"00:00:01,000 --> 00:00:02,000",
         CMTimeMake(1, 25),
         CMTimeMake(-2, 1),
         {-25, 25, 1, 0},
         {0, 25, 1, 0}},
        // 30.99 ticks are floored to 30, where the frame begins: an exported frame 31 comes back
        // as 30.
        {"00:00:01,033 --> 00:00:02,000",
         CMTimeMake(1, 30),
         kCMTimeZero,
         {30, 30, 1, 0},
         {60, 30, 1, 0}},
    };
    for (Row const& row : rows) {
        Result const result = import("1\n"s + row.times + "\nA\n", row.frame, row.offset);
        ASSERT_EQ(result.code, 0) << row.times;
        CMTimeRange const range = result.captions[0][0]->timeRange();
        EXPECT_EQ(CMTimeCompare(range.start, row.start), 0) << CMTimeGetSeconds(range.start);
        EXPECT_EQ(CMTimeCompare(KV_CMTimeRangeEnd(range), row.end), 0) << row.times;
        EXPECT_FALSE(CMTimeIsRounded(range.start));
    }
}

TEST(SRTImport, WhatHasNoLengthOnTheGridOrNoGridIsRefused)
{
    std::string const text = "1\n00:00:01,010 --> 00:00:01,030\nA\n";
    for (CMTime frame : {CMTimeMake(1, 25), kCMTimeInvalid, kCMTimePositiveInfinity,
                         CMTimeMake(1, 0), CMTimeMake(1, -25)})
        EXPECT_EQ(import(text, frame).code, 3);
    for (CMTime offset : {kCMTimeInvalid, kCMTimePositiveInfinity, kCMTimeNegativeInfinity})
        EXPECT_EQ(import(text, milliseconds, offset).code, 3);
    EXPECT_EQ(import(text, milliseconds).code, 0);
}

TEST(SRTImport, Timecodes)
{
    struct Row {
        char const* text;
        double seconds;
    } const rows[] = {
        {"00:00:01,500", 1.5},
        {"00:00:01.500", 1.5},
        {"01:02:05,500", 3725.5},
        {"0:0:0,1", 0.001},
        {"0:0:0,1000", 1},
        {"100:99:99,0", 100 * 3600 + 99 * 60 + 99},
        {"-1:00:00,000", -3600},
        {"0:0:0,-500", -0.5},
        // Fields are single-precision numbers: 2^24 + 1 is not one.
        {"0:0:16777217,0", 16777216},
    };
    auto const importer = KVMakeRef<Importer>();
    for (Row const& row : rows) {
        double seconds = -99;
        EXPECT_FALSE(importer->_parseTimecodeString(row.text, &seconds)) << row.text;
        EXPECT_EQ(seconds, row.seconds) << row.text;
    }
    for (char const* text :
         {"", "1", "00:01,500", "00:00:00:01,500", "00:00:01", "00:00:01;500", "00:00:01,500,0",
          "00:00:01,", "00:00:,500", ":00:01,500", "0::01,500", "00:00: 1,500", "00:00:+1,500",
          "00:00:1e1,500", "00:00:01,5.0", "a:b:c,d", "--1:00:00,0", "-:00:00,0"}) {
        double seconds = -99;
        auto const error = importer->_parseTimecodeString(text, &seconds);
        ASSERT_TRUE(error) << text;
        EXPECT_EQ(error->code(), 2);
        EXPECT_EQ(seconds, -99);
    }
}

// --- Tags ---

TEST(SRTTags, TokensAreTagsAndWhatStandsBetween)
{
    struct Row {
        char const* text;
        std::vector<std::string> tokens;
    } const rows[] = {
        {"", {}},
        {"plain", {"plain"}},
        {"a<b>c</b>d", {"a", "<b>", "c", "</b>", "d"}},
        {"<b}{i>x", {"<b}", "{i>", "x"}},
        {"a < b", {"a ", "< b"}},
        {"<a<b>c", {"<a<b>", "c"}},
        {"a>b}c", {"a>b}c"}},
        {"<><>", {"<>", "<>"}},
        {"<", {"<"}},
    };
    auto const importer = KVMakeRef<Importer>();
    for (Row const& row : rows) {
        std::vector<std::string> tokens;
        for (KVString const& token : importer->_tokenizeString(row.text, "<{", ">}"))
            tokens.push_back(token);
        EXPECT_EQ(tokens, row.tokens) << row.text;
    }
    EXPECT_TRUE(importer->_tokenizeString("a<b>", KVString(), ">").empty());
    EXPECT_TRUE(importer->_tokenizeString("a<b>", "<", KVString()).empty());
}

TEST(SRTTags, TokensHaveAKind)
{
    struct Row {
        char const* token;
        int tag;
    } const rows[] = {
        {"", 0},
        {"text", 0},
        {"<>", 0},
        {"<b", 0},
        {"b>", 0},
        {"(b)", 0},
        {"<b>", 3},
        {"<B>", 3},
        {"{b}", 3},
        {"<b}", 3},
        {"</b>", 4},
        {"</B>", 4},
        {"<i>", 5},
        {"</i>", 6},
        {"<u>", 7},
        {"</U>", 8},
        {"<br>", 2},
        {"<BR>", 2},
        {"<br/>", 2},
        {"<Br/>", 2},
        {"<br />", 1},
        // Of three and four units, what is not known is text.
        {"<x>", 0},
        {"<em>", 0},
        {"< b>", 0},
        {"<bold>", 1},
        {"<//b>", 1},
        {"<font>", 9},
        {"<font color=red>", 9},
        {"<font\tsize=3>", 9},
        {"{font color=red}", 9},
        {"<FONT color=red>", 1},
        {"<fonts>", 1},
        {"</font>", 1},
        {"<span>", 1},
    };
    auto const importer = KVMakeRef<Importer>();
    for (Row const& row : rows)
        EXPECT_EQ(importer->_tagFromToken(row.token), row.tag) << row.token;
}

TEST(SRTTags, AFontTagMaySetTheColour)
{
    struct Row {
        char const* tag;
        char const* colour; // "-": unchanged
    } const rows[] = {
        {"<font color=\"#ff0000\">", "ff0000"},
        {"<font color='#00FF00'>", "00ff00"},
        {"<font color=#0000ff size=3>", "0000ff"},
        {"<font COLOR=“navy“>", "000080"},
        {"<font color=‘gold‘>", "dabb20"},
        {"<font color=”gold”>", "ffffff"}, // closing curly quotes stay
        {"<font color=bogus>", "ffffff"},
        {"<font color=red size=3>", "ffffff"},
        {"<font color=#12345g>", "ffffff"},
        {"<font color=#1234567>", "123456"},
        {"<font color=x#123456>", "ffffff"},
        {"<font bgcolor=red>", "ff0000"},
        {"<font color=\">", "ffffff"}, // one character, which is then taken away
        {"<font color=>", "-"},
        {"<font color=\nred>", "-"},
        {"<font color=\n color=red>", "ff0000"},
        {"<font size=3>", "-"},
        {"<FONT color=red>", "-"},
    };
    for (Row const& row : rows) {
        auto const importer = KVMakeRef<Importer>();
        importer->_tagFromToken(row.tag);
        NSAttributes::Values values;
        values[NSForegroundColorAttributeName] = importer->taggedFontColor();
        NSAttributedString const text("x", KVMakeRef<NSAttributes>(values));
        EXPECT_EQ(coloursOf(&text), row.colour) << row.tag;
    }
}

TEST(SRTTags, ParsedTextHasItsStylesAndColours)
{
    // Styles: 1 bold, 2 italic, 4 underlined; a digit for each unit.
    struct Row {
        char const* text;
        char const* plain;
        char const* styles;
        char const* colours;
    } const rows[] = {
        {"", "", "", ""},
        {"ab", "ab", "00", "ffffff"},
        {"<B>ab</B>c", "abc", "110", "ffffff"},
        {"{b}ab{/b}c", "abc", "110", "ffffff"},
        {"a<b>b<i>c</b>d</i>e", "abcde", "01320", "ffffff"},
        {"<u>a<b>b</u>c", "abc", "451", "ffffff"},
        {"<b><b>a</b>b</b>c", "abc", "110", "ffffff"},
        // A stray closing tag takes the next opening one with it.
        {"a</b><b>b</b><b>c<b>d", "abcd", "0001", "ffffff"},
        {"a<br>b<i><BR/></i>c", "a\nb\nc", "00020", "ffffff"},
        {"a < b", "a < b", "00000", "ffffff"},
        {"a <span>b</span>", "a b", "000", "ffffff"},
        {"<x>a", "<x>a", "0000", "ffffff"},
        // The end of a font tag ends nothing.
        {"w<font color=\"#ff0000\">r</font> p", "wr p", "0000", "ffffff,ff0000"},
        {"<font color=blue>a<font size=3>b</font>", "ab", "00", "0000ff"},
    };
    for (Row const& row : rows) {
        auto const importer = KVMakeRef<Importer>();
        auto const text = importer->_parseTagsInString(row.text);
        EXPECT_EQ(text->string().toUTF8(), row.plain) << row.text;
        EXPECT_EQ(stylesOf(text), row.styles) << row.text;
        EXPECT_EQ(coloursOf(text), row.colours) << row.text;
    }
}

TEST(SRTTags, AColourStaysForTheCaptionsBehindIt)
{
    auto const result = import("1\n" + time + "<font color=red>A</font>\n\n2\n" + time + "B\n");
    ASSERT_EQ(result.captions.size(), 2u);
    EXPECT_EQ(coloursOf(result.captions[1][0]->attributedString()), "ff0000");
}

TEST(SRTTags, PropertiesTakePart)
{
    auto const importer = KVMakeRef<Importer>();
    EXPECT_EQ(importer->tagBeginningCharacters().toUTF8(), "<{");
    EXPECT_EQ(importer->tagEndingCharacters().toUTF8(), ">}");
    EXPECT_EQ(importer->taggedFontColorSpace().toUTF8(), "sRGB");
    EXPECT_FALSE(importer->taggedFontColor());
    importer->setTagBeginningCharacters("«[");
    importer->setTagEndingCharacters("»]");
    importer->setTaggedFontColor(NSColor::named("green"));
    auto const text = importer->_parseTagsInString("<b>«b»x[/b]");
    EXPECT_EQ(text->string().toUTF8(), "<b>x");
    EXPECT_EQ(stylesOf(text), "0001");
    EXPECT_EQ(coloursOf(text), "00ff00");
    importer->setTagEndingCharacters(KVString());
    EXPECT_EQ(importer->_parseTagsInString("text")->length(), 0u);
}

TEST(SRTTags, TextForOneRunIsStyledByItsArguments)
{
    auto const importer = KVMakeRef<Importer>();
    auto const text =
        importer->_attributedStringFromString("ab", true, false, true, NSColor::named("red"));
    EXPECT_EQ(stylesOf(text), "55");
    EXPECT_EQ(coloursOf(text), "ff0000");
    EXPECT_FALSE(text->attribute(NSBackgroundColorAttributeName, 0));
    EXPECT_TRUE(
        importer->_attributedStringFromString("", true, true, true, nullptr)->runs().empty());
}

TEST(SRTTags, AMillionTagsInALineAreQuick)
{
    std::string text;
    for (int i = 0; i < 500'000; ++i)
        text += i % 3 ? "<b>a</b>" : "<font color=\"#" + std::to_string(100'000 + i) + "\">";
    auto const importer = KVMakeRef<Importer>();
    auto const styled = importer->_parseTagsInString(text.c_str());
    EXPECT_EQ(styled->length(), 333'333u);
    KVCaption const caption(styled, rangeOf(0, 1));
    EXPECT_EQ(KVAttributedStringFromCaption(&caption)->length(), styled->length());
    EXPECT_GT(KVSRTCaptionsExporter::_taggedTextFromCaptionString(styled).size(), 1'000'000u);
}

TEST(KVColorFromString, TakesTheSpaceThatConverts)
{
    EXPECT_TRUE(KVColorFromStringInColorSpace("#0080FF", "sRGB")
                    ->isEqual(KVMakeRef<NSColor>(0, 128 / 255.0, 1, 1)));
    EXPECT_TRUE(KVColorFromStringInColorSpace("violet", "sRGB")->isEqual(NSColor::violetColor()));
    EXPECT_TRUE(KVColorFromStringInColorSpace("red", "P3")->isEqual(NSColor::named("red")))
        << "the colour stands where it does not convert";
}

} // namespace
