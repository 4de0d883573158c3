#include "Captions.h"

#include <gtest/gtest.h>

#include <support/TemporaryFolder.h>

namespace {

using namespace std::string_literals;
using Importer = KVSRTCaptionsImporter;

CMTime const milliseconds = CMTimeMake(1, 1000);

/// The text with "$" for times and their line's end.
std::string withTimes(std::string text)
{
    for (std::size_t at; (at = text.find('$')) != std::string::npos;)
        text.replace(at, 1, "00:00:01,000 --> 00:00:02,000\n");
    return text;
}

struct Result {
    std::vector<KVCaptionArray> captions;
    long long code; // 0: success
};

Result import(std::string const& text, CMTime frame = milliseconds, CMTime offset = kCMTimeZero)
{
    Result result{{}, 0};
    auto const importer = KVMakeRef<Importer>();
    auto const error = importer->importCaptionsFromString(NSStringWithBytes(withTimes(text)),
                                                          result.captions, frame, offset);
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

// --- Blocks ---

TEST(SRTImport, BlocksAndTheirErrors)
{
    std::string const nines(400, '9');
    struct Row {
        std::string file;
        int code;
        std::string texts; // of the captions before the error
    } const rows[] = {
        {"1\n$A", 0, "A"},
        {"1\n$A\nB\n\n2\n$C\n\n\n\n", 0, "A\nB|C"},
        {"1\r\n00:00:01,000 --> 00:00:02,000\r\nA\r\nB\r\n\r\n2\r\n$C", 0, "A\nB|C"},
        // A lone carriage return is text; so is one in front of a line end in two.
        {"1\n$A\rB\n", 0, "A\rB"},
        {"1\n$A\r\r\n", 0, "A\r"},
        // A line of blanks is not empty.
        {"1\n$A\n \nB\n", 0, "A\n \nB"},
        {"1\n$A\n\n \n", 1, "A"},
        // The first text line is taken even if it is empty: one more empty line ends the block.
        {"1\n$", 0, ""},
        {"1\n00:00:01,000 --> 00:00:02,000", 0, ""},
        {"1\n$\n\n2\n$B\n", 0, "|B"},
        {"1\n$\n2\n$B\n\n3\n$C", 1, withTimes("\n2\n$B")},
        // Numbers.
        {"", 1, ""},
        {"2\n$A\n", 1, ""},
        {"\n1\n$A\n", 1, ""},
        {" 1\n$A\n", 1, ""},
        {"\uFEFF1\n$A\n", 0, "A"},
        {"\uFEFF\uFEFF1\n$A\n", 1, ""},
        {"1 \n$A\n", 1, ""},
        {"10\n$A\n", 1, ""},
        {"1\n$A\n\n2\n$B\n\n4\n$D\n", 1, "A|B"},
        {"1\n$A\n\n02\n$B\n", 0, "A|B"},
        {"1\n$A\n\n-2\n$B\n", 1, "A"},
        {"1\n$A\n\n" + nines + "\n$B\n", 1, "A"},
        {"1\n$A\n\n\u0662\n$B\n", 1, "A"}, // an Arabic digit
        // Time lines.
        {"1", 1, ""},
        {"1\n\n$A\n", 1, ""},
        {"1\n00:00:01,000 -> 00:00:02,000\nA\n", 1, ""},
        {"1\n00:00:01,000 --> 00:00:02,000 --> 00:00:03,000\nA\n", 1, ""},
        {"1\n\t00:00:01,000-->00:00:02.000 \u00A0\nA\n", 0, "A"},
        {"1\n00:00:01 --> 00:00:02,000\nA\n", 2, ""},
        {"1\n00:00:01,000 --> 00:00:02,000 X1:40\nA\n", 2, ""},
        // Ranges.
        {"1\n00:00:01,000 --> 00:00:01,000\nA\n", 3, ""},
        {"1\n00:00:02,000 --> 00:00:01,000\nA\n", 3, ""},
        {"1\n-" + nines + ":" + nines + ":0,0 --> " + nines + ":0:0,0\nA\n", 3, ""},
    };
    for (Row const& row : rows) {
        Result const result = import(row.file);
        EXPECT_EQ(result.code, row.code) << row.file;
        EXPECT_EQ(textsOf(result.captions), row.texts) << row.file;
    }
}

TEST(SRTImport, EveryCaptionIsASubRipCaptionInAnArrayOfItsOwn)
{
    Result const result = import("1\n$A\n\n2\n$B\n");
    ASSERT_EQ(result.captions.size(), 2u);
    ASSERT_EQ(result.captions[1].size(), 1u);
    KVCaption const* const one = result.captions[1][0];
    EXPECT_EQ(one->format(), 3);
    EXPECT_TRUE(one->copyTextColorAtIndex(0)->isEqual(NSColor::whiteColor()));
    EXPECT_TRUE(one->copyBackgroundColorAtIndex(0)->isEqual(NSColor::blackColor()));
    EXPECT_EQ(one->attributedString()->attribute(NSFontAttributeName, 0), NSFont::systemFont());
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
    for (char const* path : {"/none/such.srt", "/"}) {
        auto const error =
            importer->importCaptionsFromURL(KVURL(path), captions, milliseconds, kCMTimeZero);
        ASSERT_TRUE(error);
        EXPECT_EQ(error->code(), 1);
        for (char const* key : {NSLocalizedDescriptionKey, NSLocalizedFailureReasonErrorKey})
            EXPECT_TRUE(CFEqual(error->userInfo(key), CFStringGetEmpty())) << key;
    }
}

TEST(SRTImport, FilesAreDecodedFirst)
{
    TemporaryFolder const folder;
    std::string const latin = withTimes("1\n$caf\xE9\n");
    std::string utf16 = "\xFF\xFE";
    for (char c : latin)
        utf16 += c, utf16 += '\0';
    for (std::string const& bytes : {latin, utf16}) {
        std::string const path = folder.write("a.srt", bytes);
        std::vector<KVCaptionArray> captions;
        EXPECT_FALSE(KVMakeRef<Importer>()->importCaptionsFromURL(KVURL(path.c_str()), captions,
                                                                  milliseconds, kCMTimeZero));
        EXPECT_EQ(textsOf(captions), "café");
    }
}

// --- Times ---

TEST(SRTImport, TimesAreFlooredToTicksMovedAndRaisedToFrames)
{
    struct Row {
        char const* times;
        CMTime frame;
        long long offset;     // in seconds
        long long start, end; // in ticks of the frame's timescale
    } const rows[] = {
        {"00:00:01,000 --> 00:00:02,000", CMTimeMake(1, 25), 0, 25, 50},
        {"00:00:01,500 --> 01:02:05,500", milliseconds, 0, 1500, 3725500},
        // 24000 ticks a second make 23.976 frames of 1001 ticks.
        {"00:00:00,001 --> 00:00:01,000", CMTimeMake(1001, 24000), 0, 1001, 24024},
        {"01:00:01,000 --> 01:00:02,000", CMTimeMake(1, 25), -3600, 25, 50},
        {"00:00:01,000 --> 00:00:02,000", CMTimeMake(1, 25), -2, -25, 0},
        // 30.99 ticks are floored to 30, where the frame begins: an exported frame 31 comes back
        // as 30.
        {"00:00:01,033 --> 00:00:02,000", CMTimeMake(1, 30), 0, 30, 60},
    };
    for (Row const& row : rows) {
        Result const result =
            import("1\n"s + row.times + "\nA\n", row.frame, CMTimeMake(row.offset, 1));
        ASSERT_EQ(result.code, 0) << row.times;
        CMTimeRange const range = result.captions[0][0]->timeRange();
        auto const ticks = [&](long long count) { return CMTimeMake(count, row.frame.timescale); };
        EXPECT_EQ(CMTimeCompare(range.start, ticks(row.start)), 0) << row.times;
        EXPECT_EQ(CMTimeCompare(KV_CMTimeRangeEnd(range), ticks(row.end)), 0) << row.times;
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
        {"00:00:01.500", 1.5},
        {"01:02:05,500", 3725.5},
        {"0:0:0,1", 0.001},
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
        std::vector<KVString> tokens;
    } const rows[] = {
        {"", {}},
        {"a<b>c</b>d", {"a", "<b>", "c", "</b>", "d"}},
        {"<b}{i>a < b", {"<b}", "{i>", "a ", "< b"}},
        {"a>b}c<><", {"a>b}c", "<>", "<"}},
    };
    auto const importer = KVMakeRef<Importer>();
    for (Row const& row : rows)
        EXPECT_EQ(importer->_tokenizeString(row.text, "<{", ">}"), row.tokens) << row.text;
    EXPECT_TRUE(importer->_tokenizeString("a<b>", KVString(), ">").empty());

    auto const styled =
        importer->_attributedStringFromString("ab", true, false, true, NSColor::named("red"));
    EXPECT_EQ(stylesOf(styled), "55");
    EXPECT_EQ(coloursOf(styled), "ff0000");
}

TEST(SRTTags, TokensHaveAKind)
{
    struct Row {
        int tag;
        std::vector<char const*> tokens;
    } const rows[] = {
        // Of three and four units, what is not known is text.
        {0, {"", "text", "<>", "<b", "b>", "(b)", "<x>", "<em>", "< b>"}},
        {1, {"<bold>", "<//b>", "<br />", "<FONT color=red>", "<fonts>", "</font>", "<span>"}},
        {2, {"<br>", "<BR>", "<br/>", "<Br/>"}},
        {3, {"<b>", "<B>", "{b}", "<b}"}},
        {4, {"</b>", "</B>"}},
        {5, {"<i>"}},
        {6, {"</i>"}},
        {7, {"<u>"}},
        {8, {"</U>"}},
        {9, {"<font>", "<font color=red>", "<font\tsize=3>", "{font color=red}"}},
    };
    auto const importer = KVMakeRef<Importer>();
    for (Row const& row : rows)
        for (char const* token : row.tokens)
            EXPECT_EQ(importer->_tagFromToken(token), row.tag) << token;
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
        {"<font color=red size=3>", "ffffff"},
        {"<font color=#12345g>", "ffffff"},
        {"<font color=#1234567>", "123456"},
        {"<font bgcolor=red>", "ff0000"},
        {"<font color=\">", "ffffff"}, // one character, which is then taken away
        {"<font color=>", "-"},
        {"<font color=\n color=red>", "ff0000"},
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
        {"{b}ab{/b}c", "abc", "110", "ffffff"},
        {"a<b>b<i>c</b>d</i>e", "abcde", "01320", "ffffff"},
        {"<u>a<b>b</u>c", "abc", "451", "ffffff"},
        // Each style counts its own tags.
        {"<b><b>a</b>b</b>c", "abc", "110", "ffffff"},
        {"<i><i>a</i>b</i></i><i>c", "abc", "220", "ffffff"},
        {"<u><u>a</u>b</u></u><u>c", "abc", "440", "ffffff"},
        // A stray closing tag takes the next opening one with it.
        {"a</b><b>b</b><b>c<b>d", "abcd", "0001", "ffffff"},
        {"a<br>b<i><BR/></i>c", "a\nb\nc", "00020", "ffffff"},
        {"a < b", "a < b", "00000", "ffffff"},
        {"a <span>b</span>", "a b", "000", "ffffff"},
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
    auto const result = import("1\n$<font color=red>A</font>\n\n2\n$B\n");
    ASSERT_EQ(result.captions.size(), 2u);
    EXPECT_EQ(coloursOf(result.captions[1][0]->attributedString()), "ff0000");
}

TEST(SRTTags, PropertiesTakePart)
{
    auto const importer = KVMakeRef<Importer>();
    EXPECT_EQ(importer->tagBeginningCharacters().toUTF8(), "<{");
    EXPECT_EQ(importer->tagEndingCharacters().toUTF8(), ">}");
    EXPECT_EQ(importer->taggedFontColorSpace().toUTF8(), "sRGB");
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
