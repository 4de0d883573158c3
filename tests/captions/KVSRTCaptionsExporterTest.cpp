#include "Captions.h"

#include <gtest/gtest.h>

#include <support/TemporaryFolder.h>

#include <cerrno>
#include <limits>

namespace {

CMTime const milliseconds = CMTimeMake(1, 1000);

KVNSRef<KVCaption*> captionOf(KVString const& text, CMTimeRange const& range = rangeOf(1, 2))
{
    return KVMakeRef<KVCaption>(KVMakeRef<NSAttributedString>(text), range);
}

std::string exported(KVCaptionArray const& captions, bool tags = false, CMTime frame = milliseconds,
                     CMTime offset = kCMTimeZero)
{
    std::string text;
    EXPECT_FALSE(
        KVSRTCaptionsExporter::exportCaptionsToString(text, captions, frame, offset, tags));
    return text;
}

// --- Blocks ---

TEST(SRTExport, WritesNumberedBlocksOfWhatHasTextAndCutsOneNewline)
{
    std::string const one = "1\n00:00:01,000 --> 00:00:02,000\nA\n";
    std::string const two = "\n2\n00:00:03,000 --> 00:00:04,000\nnaïve 😀\n";
    struct Row {
        KVCaptionArray captions;
        std::string text;
    } const rows[] = {
        {{}, ""},
        {{captionOf("A"), captionOf("naïve 😀", rangeOf(3, 4))}, one + two},
        {{captionOf(""), captionOf("A")}, one},
        {{captionOf("\n"), captionOf("A"), nullptr, captionOf("\u2028")}, one},
        {{KVMakeRef<KVCaption>(nullptr, rangeOf(0, 1)), captionOf("A\n")}, one},
        {{captionOf("A\u0085")}, one},
        {{captionOf("A\n\n")}, "1\n00:00:01,000 --> 00:00:02,000\nA\n\n"},
        {{captionOf("A\r\n")}, "1\n00:00:01,000 --> 00:00:02,000\nA\r\n"},
    };
    for (Row const& row : rows) {
        EXPECT_EQ(exported(row.captions, false), row.text);
        EXPECT_EQ(exported(row.captions, true), row.text);
    }
}

TEST(SRTExport, TimesAreMovedAndRaisedToFrames)
{
    CMTime const ntsc = CMTimeMake(1001, 24000);
    struct Row {
        CMTimeRange range;
        CMTime frame;
        long long offset; // in seconds
        char const* times;
    } const rows[] = {
        {rangeOf(3600, 3601), CMTimeMake(1, 25), -3600, "00:00:00,000 --> 00:00:01,000"},
        {{milliseconds, CMTimeMake(1, 1)}, CMTimeMake(1, 25), 0, "00:00:00,040 --> 00:00:01,040"},
        {{ntsc, ntsc}, ntsc, 0, "00:00:00,041 --> 00:00:00,083"},
        {rangeOf(1, 2), milliseconds, -5, "00:00:00,000 --> 00:00:00,000"},
        {kCMTimeRangeInvalid, milliseconds, 0, "00:00:00,000 --> 00:00:00,000"},
        // Without a grid times stay as they are.
        {rangeOf(1, 2), kCMTimeInvalid, 0, "00:00:01,000 --> 00:00:02,000"},
    };
    for (Row const& row : rows)
        EXPECT_EQ(
            exported({captionOf("A", row.range)}, false, row.frame, CMTimeMake(row.offset, 1)),
            "1\n" + std::string(row.times) + "\nA\n");
}

TEST(KVTimecodeString, HasTwoDigitsOrMoreAndCutsMilliseconds)
{
    struct Row {
        double seconds;
        char const* text;
    } const rows[] = {
        {0, "00:00:00,000"},
        {3725.5, "01:02:05,500"},
        {4.35, "00:00:04,350"}, // 4.35 - 4 is a little less than .35
        {59.9999999999, "00:00:59,999"},
        {360000, "100:00:00,000"},
        {-1, "00:00:00,000"},
        {std::numeric_limits<double>::quiet_NaN(), "00:00:00,000"},
        {1e300, "2562047788015215:30:07,000"}, // as far as 64 bits count
        {std::numeric_limits<double>::infinity(), "2562047788015215:30:07,000"},
    };
    for (Row const& row : rows)
        EXPECT_EQ(KVTimecodeStringFromTimeInSeconds(row.seconds).toUTF8(), row.text) << row.seconds;
}

// --- Tags ---

/// Text in which "*" switches bold, "/" italic, "_" underlined and "0" to "9" the colour (0: none).
KVNSRef<NSAttributedString*> marked(std::u16string_view marks)
{
    std::u16string text;
    std::vector<NSAttributedString::Run> runs;
    bool bold = false, italic = false, underlined = false;
    double red = 0;
    for (char16_t unit : marks) {
        if (unit == u'*') {
            bold = !bold;
        } else if (unit == u'/') {
            italic = !italic;
        } else if (unit == u'_') {
            underlined = !underlined;
        } else if (unit >= u'0' && unit <= u'9') {
            red = unit - u'0';
        } else {
            text += unit;
            NSAttributes::Values values;
            values[NSFontAttributeName] = NSFont::systemFont(bold, italic);
            if (underlined)
                values[NSUnderlineStyleAttributeName] = KVMakeRef<NSNumber>(1);
            if (red > 0)
                values[NSForegroundColorAttributeName] = KVMakeRef<NSColor>(red / 255, 0, 0, 1);
            runs.push_back({text.size(), KVMakeRef<NSAttributes>(values)});
        }
    }
    return KVMakeRef<NSAttributedString>(KVString::fromUTF16(text), runs);
}

TEST(SRTTaggedText, TagsOpenAndCloseWithTheirAttributes)
{
    struct Row {
        std::u16string_view marks;
        char const* text;
    } const rows[] = {
        {u"", ""},
        {u"a*b*c", "a<b>b</b>c"},
        {u"*/_ab", "<b><i><u>ab</u></i></b>"},
        // In the order of the attributes, not of nesting.
        {u"*a/b*c/d", "<b>a<i>b</b>c</i>d"},
        {u"*a1b*c", "<b>a<font color=\"#010000\">b</b>c</font>"},
        {u"1a2b", "<font color=\"#010000\">a</font><font color=\"#020000\">b</font>"},
        {u"*1a", "<b><font color=\"#010000\">a</b></font>"},
        // The first unit of a cluster decides: none is torn.
        {u"e*\u0301x*y", "e\u0301<b>x</b>y"},
        {u"a\xD83D*\xDE00*b", "a😀b"},
        {u"👨\u200D*👩*x", "👨\u200D👩x"},
        {u"🇬*🇧*🇫*🇷*", "🇬🇧🇫🇷"},
        {u"\u1100*\u1161*x", "\u1100\u1161x"},
    };
    for (Row const& row : rows) {
        EXPECT_EQ(KVSRTCaptionsExporter::_taggedTextFromCaptionString(marked(row.marks)).toUTF8(),
                  row.text);
    }
    EXPECT_TRUE(KVSRTCaptionsExporter::_taggedTextFromCaptionString(nullptr).empty());
}

TEST(SRTTaggedText, WithoutAFontTraitsStayAsTheyAre)
{
    auto const string = KVMakeRef<NSMutableAttributedString>(KVString("abc"));
    string->addAttribute(NSFontAttributeName, NSFont::systemFont(true), {0, 1});
    string->addAttribute(NSFontAttributeName, NSFont::systemFont(), {2, 1});
    EXPECT_EQ(KVSRTCaptionsExporter::_taggedTextFromCaptionString(string).toUTF8(), "<b>ab</b>c");
}

TEST(SRTTaggedText, ComponentsAreRoundedAndClamped)
{
    constexpr double notANumber = std::numeric_limits<double>::quiet_NaN();
    for (auto const& [red, green, text] :
         {std::tuple(0.5, 1.0 / 255, "#8001"), std::tuple(-3.0, 7.0, "#00ff"),
          std::tuple(notANumber, 0.0, "#0000")}) {
        auto const string = KVMakeRef<NSMutableAttributedString>(KVString("a"));
        string->addAttribute(NSForegroundColorAttributeName, KVMakeRef<NSColor>(red, green, 0, 1),
                             {0, 1});
        EXPECT_EQ(KVSRTCaptionsExporter::_taggedTextFromCaptionString(string).toUTF8(),
                  "<font color=\"" + std::string(text) + "00\">a</font>");
    }
}

// --- Failures and files ---

TEST(SRTExport, HalfASurrogatePairIsNotWritten)
{
    TemporaryFolder const folder;
    std::string const path = folder.path("out.srt");
    for (std::u16string_view text : {u"a\xD83D", u"\xDE00 b", u"\xDE00\xD83D"}) {
        auto const error = KVSRTCaptionsExporter::exportCaptionsToURL(
            KVURL(path.c_str()), {captionOf("fine"), captionOf(KVString::fromUTF16(text))},
            milliseconds, kCMTimeZero, true);
        ASSERT_TRUE(error);
        EXPECT_EQ(error->domain().toUTF8(), "QFSRTCaptionsExporterError");
        EXPECT_EQ(error->code(), 0);
        for (char const* key : {NSLocalizedDescriptionKey, NSLocalizedFailureReasonErrorKey})
            EXPECT_TRUE(error->userInfo(key)) << key;
        EXPECT_FALSE(std::filesystem::exists(path));
    }
}

TEST(SRTExport, TheSystemsErrorIsAnswered)
{
    struct Row {
        char const* path;
        int code;
    } const rows[] = {{"/none/such.srt", ENOENT}, {"/", EISDIR}, {"/dev/full", ENOSPC}};
    for (Row const& row : rows) {
        auto const error = KVSRTCaptionsExporter::exportCaptionsToURL(
            KVURL(row.path), {captionOf("A")}, milliseconds, kCMTimeZero, false);
        ASSERT_TRUE(error) << row.path;
        EXPECT_EQ(error->domain().toUTF8(), "NSPOSIXErrorDomain");
        EXPECT_EQ(error->code(), row.code);
    }
}

TEST(SRTExport, AnImportOfAnExportIsTheSame)
{
    // Overlapping tags, a second script, a line break, several lines.
    auto const importer = KVMakeRef<KVSRTCaptionsImporter>();
    KVCaptionArray captions;
    for (char const* text : {"plain", "<b>b<i>bi</b>i</i>", "<u>Ελλάδα</u> 😀\nsecond line", "a > b",
                             "<font color=\"#12ab34\">green</font>"}) {
        auto const second = static_cast<long long>(captions.size());
        captions.push_back(KVMakeRef<KVCaptionSRT>(importer->_parseTagsInString(text),
                                                   rangeOf(second, second + 1)));
    }
    TemporaryFolder const folder;
    KVURL const url(folder.path("a.srt").c_str());
    CMTime const frame = CMTimeMake(1, 25);
    ASSERT_FALSE(
        KVSRTCaptionsExporter::exportCaptionsToURL(url, captions, frame, kCMTimeZero, true));
    std::vector<KVCaptionArray> back;
    ASSERT_FALSE(
        KVMakeRef<KVSRTCaptionsImporter>()->importCaptionsFromURL(url, back, frame, kCMTimeZero));
    ASSERT_EQ(back.size(), captions.size());
    for (std::size_t i = 0; i < back.size(); ++i)
        EXPECT_TRUE(back[i][0]->isEqual(captions[i])) << captions[i]->text().toUTF8();

    // What does not come back: a bracket in the text takes the tag behind it for its own end.
    auto const open = importer->_parseTagsInString("a < b");
    auto const again =
        importer->_parseTagsInString(KVSRTCaptionsExporter::_taggedTextFromCaptionString(open));
    EXPECT_EQ(again->string().toUTF8(), "a ");
}

} // namespace
