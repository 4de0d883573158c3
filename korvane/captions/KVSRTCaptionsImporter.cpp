#include <korvane/captions/KVSRTCaptionsImporter.h>

#include <korvane/captions/KVCaptionSRT.h>
#include <korvane/captions/KVCaptionText_p.h>
#include <korvane/captions/KVSubRipText_p.h>

#include <korvane/platform/CFNumber.h>
#include <korvane/platform/NSStringFile.h>

#include <korvane/time/KVTime.h>
#include <korvane/time/KVTimeRange.h>

#include <algorithm>
#include <array>
#include <iterator>
#include <unordered_map>

// --- Shared styles ---

/// Colours and sets of attributes, each made once and shared by all runs that have it: a file has
/// many runs in few styles.
class KVSRTCaptionsImporter::Styles {
public:
    /// The colour that a font tag's text stands for.
    KVNSRef<NSColor const*> color(std::u16string_view text, KVString const& colorSpaceName)
    {
        std::u16string name = KVSubRip::withoutQuotes(text);
        auto const found = colors_.find(name);
        if (found != colors_.end())
            return found->second;
        // A file with more colours than any real one must not fill the memory with them.
        if (colors_.size() >= 4096)
            forget();
        auto color = KVColorFromStringInColorSpace(KVString::fromUTF16(name), colorSpaceName);
        colors_.emplace(std::move(name), color);
        return color;
    }

    KVNSRef<NSAttributes const*> const& attributes(NSColor const* color, bool bold, bool italic,
                                                   bool underline, Background background)
    {
        if (!color)
            color = white_;
        if (!palette_ || palette_->color != color) {
            if (palettes_.size() >= 4096)
                palettes_.clear();
            palette_ = &palettes_[color];
            palette_->color = color;
        }
        bool const onBlack = background == Background::black;
        KVNSRef<NSAttributes const*>& set =
            palette_->sets[8 * onBlack + 4 * bold + 2 * italic + underline];
        if (!set) {
            NSAttributes::Values values;
            values[NSFontAttributeName] = NSFont::systemFont(bold, italic);
            values[NSForegroundColorAttributeName] = color;
            if (onBlack)
                values[NSBackgroundColorAttributeName] = KVBlackForTextColor(color);
            if (underline)
                values[NSUnderlineStyleAttributeName] = underline_;
            set = KVMakeRef<NSAttributes>(std::move(values));
        }
        return set;
    }

    void forget()
    {
        colors_.clear();
        palettes_.clear();
        palette_ = nullptr;
    }

    // Room that parsing uses again and again.
    std::u16string plain;
    std::vector<NSAttributedString::Run> runs;

private:
    /// The sets with one text colour, by traits and background.
    struct Palette {
        KVNSRef<NSColor const*> color;
        std::array<KVNSRef<NSAttributes const*>, 16> sets;
    };

    KVNSRef<NSColor const*> white_ = NSColor::whiteColor();
    KVNSRef<NSNumber const*> underline_ = KVMakeRef<NSNumber>(NSUnderlineStyleSingle);
    std::unordered_map<std::u16string, KVNSRef<NSColor const*>> colors_;
    std::unordered_map<NSColor const*, Palette> palettes_;
    Palette* palette_ = nullptr;
};

KVSRTCaptionsImporter::KVSRTCaptionsImporter()
    : tagBeginningCharacters_("<{"),
      tagEndingCharacters_(">}"),
      taggedFontColorSpace_(NSColor::sRGBColorSpaceName()),
      styles_(std::make_unique<Styles>())
{}

KVSRTCaptionsImporter::~KVSRTCaptionsImporter() = default;

void KVSRTCaptionsImporter::setTaggedFontColorSpace(KVString const& name)
{
    taggedFontColorSpace_ = name;
    styles_->forget();
}

KVNSRef<NSColor const*> KVColorFromStringInColorSpace(KVString const& text,
                                                      KVString const& colorSpaceName)
{
    std::u16string_view const units = text.view();
    KVNSRef<NSColor const*> color;
    if (units.size() >= 7 && units[0] == u'#') {
        unsigned int value = 0;
        bool areDigits = true;
        for (char16_t unit : units.substr(1, 6)) {
            char16_t const lower = unit | 0x20;
            bool const isDecimal = unit >= u'0' && unit <= u'9';
            areDigits = areDigits && (isDecimal || (lower >= u'a' && lower <= u'f'));
            value = value << 4 | (isDecimal ? unit - u'0' : (lower - u'a' + 10) & 0xF);
        }
        if (areDigits) {
            color = KVMakeRef<NSColor>((value >> 16) / 255.0, (value >> 8 & 0xFF) / 255.0,
                                       (value & 0xFF) / 255.0, 1.0);
        }
    }
    if (!color)
        color = NSColor::named(text);
    if (!color)
        color = NSColor::whiteColor();
    KVNSRef<NSColor const*> const converted = color->usingColorSpace(colorSpaceName);
    return converted ? converted : color;
}

// --- Tags ---

std::vector<KVString> KVSRTCaptionsImporter::_tokenizeString(KVString const& text,
                                                             KVString const& tokenStartSet,
                                                             KVString const& tokenEndSet) const
{
    std::vector<KVString> tokens;
    if (tokenStartSet.isNull() || tokenEndSet.isNull())
        return tokens;
    KVSubRip::tokenize(text.view(), KVSubRip::CharacterSet(tokenStartSet.view()),
                       KVSubRip::CharacterSet(tokenEndSet.view()), [&](std::u16string_view token) {
                           tokens.push_back(KVString::fromUTF16(token));
                       });
    return tokens;
}

void KVSRTCaptionsImporter::takeFontColor(std::u16string_view token)
{
    if (auto const text = KVSubRip::colorText(token.substr(1, token.size() - 2)))
        taggedFontColor_ = styles_->color(*text, taggedFontColorSpace_);
}

KVSRTCaptionsImporter::Tag KVSRTCaptionsImporter::_tagFromToken(KVString const& token)
{
    Tag const tag =
        KVSubRip::tagFromToken(token.view(), KVSubRip::CharacterSet(tagBeginningCharacters_.view()),
                               KVSubRip::CharacterSet(tagEndingCharacters_.view()));
    if (tag == font)
        takeFontColor(token.view());
    return tag;
}

KVNSRef<NSAttributedString*>
KVSRTCaptionsImporter::_attributedStringFromString(KVString const& text, bool bold, bool italic,
                                                   bool underline, NSColor const* color) const
{
    NSAttributes::Values values;
    values[NSFontAttributeName] = NSFont::systemFont(bold, italic);
    values[NSForegroundColorAttributeName] = color;
    if (underline)
        values[NSUnderlineStyleAttributeName] = KVMakeRef<NSNumber>(NSUnderlineStyleSingle);
    return KVMakeRef<NSAttributedString>(text, KVMakeRef<NSAttributes>(std::move(values)));
}

KVNSRef<NSAttributedString*> KVSRTCaptionsImporter::_parseTagsInString(KVString const& text)
{
    return parseTags(text.view(), Background::none);
}

KVNSRef<NSAttributedString*> KVSRTCaptionsImporter::parseTags(std::u16string_view text,
                                                              Background background)
{
    using namespace KVSubRip;
    std::u16string& plain = styles_->plain;
    std::vector<NSAttributedString::Run>& runs = styles_->runs;
    plain.clear();
    runs.clear();

    // A closing tag may come first: these go below zero.
    long long bold = 0;
    long long italic = 0;
    long long underline = 0;
    auto const append = [&](std::u16string_view piece) {
        plain += piece;
        auto const& attributes =
            styles_->attributes(taggedFontColor_, bold > 0, italic > 0, underline > 0, background);
        if (!runs.empty() && runs.back().attributes == attributes)
            runs.back().end = plain.size();
        else
            runs.push_back({plain.size(), attributes});
    };
    auto const takeToken = [&](std::u16string_view token, CharacterSet const& starts,
                               CharacterSet const& ends) {
        switch (tagFromToken(token, starts, ends)) {
        case notATag:
            append(token);
            break;
        case lineBreak:
            append(u"\n");
            break;
        case boldOn:
            ++bold;
            break;
        case boldOff:
            --bold;
            break;
        case italicOn:
            ++italic;
            break;
        case italicOff:
            --italic;
            break;
        case underlineOn:
            ++underline;
            break;
        case underlineOff:
            --underline;
            break;
        case font:
            takeFontColor(token);
            break;
        case unknownTag:
        case fontOff:
            break;
        }
    };
    if (!tagBeginningCharacters_.isNull() && !tagEndingCharacters_.isNull()) {
        CharacterSet const starts(tagBeginningCharacters_.view());
        CharacterSet const ends(tagEndingCharacters_.view());
        tokenize(text, starts, ends,
                 [&](std::u16string_view token) { takeToken(token, starts, ends); });
    }
    return KVMakeRef<NSAttributedString>(
        KVString::fromUTF16(plain),
        std::vector<NSAttributedString::Run>(std::make_move_iterator(runs.begin()),
                                             std::make_move_iterator(runs.end())));
}

// --- Files ---

namespace {

KVNSRef<NSError*> makeError(KVSRTCaptionsImporter::ErrorCode code)
{
    auto const userInfo = KVMakeRef<NSMutableDictionary>();
    userInfo->setValue(NSLocalizedDescriptionKey, CFStringGetEmpty());
    userInfo->setValue(NSLocalizedFailureReasonErrorKey, CFStringGetEmpty());
    return KVMakeRef<NSError>("KVSRTCaptionsImporterError", code, userInfo);
}

/// "\r\n" as "\n"; a "\r" alone stays.
std::u16string withPlainLineEnds(std::u16string_view text)
{
    std::u16string result;
    result.reserve(text.size());
    for (std::size_t i = 0; i < text.size();) {
        std::size_t const lineEnd = std::min(text.find(u'\n', i), text.size());
        std::size_t const cut = lineEnd < text.size() && lineEnd > i && text[lineEnd - 1] == u'\r';
        result += text.substr(i, lineEnd - i - cut);
        if (lineEnd < text.size())
            result += u'\n';
        i = lineEnd + 1;
    }
    return result;
}

/// The lines of a text one by one: a text of n line ends has n + 1 of them.
class LineReader {
public:
    explicit LineReader(std::u16string_view text) : text_(text) {}

    bool isAtEnd() const noexcept { return next_ > text_.size(); }
    /// Where the next line begins.
    std::size_t position() const noexcept { return std::min(next_, text_.size()); }
    /// Empty behind the last line.
    std::u16string_view next() noexcept
    {
        if (isAtEnd())
            return {};
        std::size_t const start = next_;
        std::size_t const end = std::min(text_.find(u'\n', start), text_.size());
        next_ = end + 1;
        return text_.substr(start, end - start);
    }

private:
    std::u16string_view text_;
    std::size_t next_ = 0;
};

/// The time on the grid: `frameDuration` gives the ticks, then the offset, then whole frames.
CMTime timeOnGrid(double seconds, CMTime const& frameDuration, CMTime const& offset)
{
    CMTime const time = CMTimeMakeWithSeconds(seconds, frameDuration.timescale);
    return CMTimeIsValid(time)
               ? KV_CMTimeCeilingToSampleDuration(CMTimeAdd(time, offset), frameDuration)
               : time;
}

/// A range that a caption can be shown over.
bool isUsable(CMTimeRange const& range)
{
    return CMTimeIsNumeric(range.start) && CMTimeIsNumeric(range.duration) &&
           range.duration.epoch == 0 && range.duration.value >= 0 &&
           CMTimeCompare(range.duration, kCMTimeZero) > 0;
}

} // namespace

KVNSRef<NSError*> KVSRTCaptionsImporter::_parseTimecodeString(KVString const& text,
                                                              double* seconds) const
{
    std::optional<double> const value = KVSubRip::parseTimecode(text.view());
    if (!value)
        return makeError(badTimecode);
    if (seconds)
        *seconds = *value;
    return nullptr;
}

KVNSRef<NSError*>
KVSRTCaptionsImporter::importCaptionsFromURL(KVURL const& url,
                                             std::vector<KVCaptionArray>& captions,
                                             CMTime frameDuration, CMTime startTimeOffset)
{
    return importCaptionsFromString(NSStringWithContentsOfURL(url), captions, frameDuration,
                                    startTimeOffset);
}

KVNSRef<NSError*>
KVSRTCaptionsImporter::importCaptionsFromString(KVString const& text,
                                                std::vector<KVCaptionArray>& captions,
                                                CMTime frameDuration, CMTime startTimeOffset)
{
    if (!text.view().starts_with(u'1'))
        return makeError(badFile);
    if (!CMTimeIsNumeric(frameDuration))
        frameDuration = kCMTimeInvalid; // which no time can be made with

    std::u16string_view all = text.view();
    std::u16string plain;
    if (all.find(u"\r\n") != all.npos) {
        plain = withPlainLineEnds(all);
        all = plain;
    }
    LineReader reader(all);
    for (double expectedNumber = 1;; ++expectedNumber) {
        std::u16string_view line;
        while (line.empty() && !reader.isAtEnd())
            line = reader.next();
        if (line.empty())
            return nullptr;
        std::optional<double> const number = KVSubRip::parseNumber(line);
        if (!number || *number != expectedNumber)
            return makeError(badFile);

        auto const timeLine = KVSubRip::splitInTwo(reader.next(), u"-->");
        if (!timeLine)
            return makeError(badFile);
        std::array<CMTime, 2> times;
        for (std::size_t i = 0; i < 2; ++i) {
            auto const seconds = KVSubRip::parseTimecode(KVSubRip::trimmed((*timeLine)[i]));
            if (!seconds)
                return makeError(badTimecode);
            times[i] = timeOnGrid(*seconds, frameDuration, startTimeOffset);
        }
        CMTimeRange const range = CMTimeRangeFromTimeToTime(times[0], times[1]);
        if (!isUsable(range))
            return makeError(badTimeRange);

        std::size_t const textStart = reader.position();
        std::size_t textEnd = textStart + reader.next().size();
        while (!reader.isAtEnd()) {
            std::size_t const lineStart = reader.position();
            line = reader.next();
            if (line.empty())
                break;
            textEnd = lineStart + line.size();
        }
        auto const styled =
            parseTags(all.substr(textStart, textEnd - textStart), Background::black);
        captions.push_back({KVMakeRef<KVCaptionSRT>(styled, range)});
    }
}
