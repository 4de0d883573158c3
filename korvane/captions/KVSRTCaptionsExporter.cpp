#include <korvane/captions/KVSRTCaptionsExporter.h>

#include <korvane/captions/KVCaptionText_p.h>

#include <korvane/platform/NSStringFile.h>

#include <korvane/time/KVTime.h>
#include <korvane/time/KVTimeRange.h>

#include <algorithm>
#include <charconv>
#include <cmath>
#include <limits>

namespace {

// --- Text for the file ---

/// The number in decimal, filled up with zeros on the left.
void appendNumber(std::string& out, long long number, std::size_t digits)
{
    char buffer[24];
    char* const end = std::to_chars(buffer, buffer + sizeof buffer, number).ptr;
    auto const count = static_cast<std::size_t>(end - buffer);
    out.append(digits > count ? digits - count : 0, '0');
    out.append(buffer, count);
}

void appendTimecode(std::string& out, double seconds)
{
    if (!(seconds > 0))
        seconds = 0;
    // 2^63 is the first number that is too large.
    double const whole = std::floor(seconds);
    long long const count =
        whole < 0x1p63 ? static_cast<long long>(whole) : std::numeric_limits<long long>::max();
    // 4.35 - 4 is 0.34999999999999964: the tiny summand keeps the milliseconds that were meant.
    double const rest = whole < 0x1p63 ? (seconds - whole) * 1000 + 1e-6 : 0;
    appendNumber(out, count / 3600, 2);
    out += ':';
    appendNumber(out, count / 60 % 60, 2);
    out += ':';
    appendNumber(out, count % 60, 2);
    out += ',';
    appendNumber(out, std::min(static_cast<int>(rest), 999), 3);
}

void appendUTF8(std::string& out, std::u16string_view units)
{
    std::size_t const filled = out.size();
    out.resize(filled + CFStringGetMaximumUTF8Length(units.size()));
    out.resize(filled + CFStringEncodeUTF8(units, out.data() + filled));
}

void append(std::string& out, std::string_view text)
{
    out += text;
}

void append(std::u16string& out, std::string_view ascii)
{
    out.append(ascii.begin(), ascii.end());
}

void appendUnits(std::string& out, std::u16string_view units)
{
    appendUTF8(out, units);
}

void appendUnits(std::u16string& out, std::u16string_view units)
{
    out += units;
}

// --- Tags ---

/// A colour component as two hexadecimal digits.
void appendHexadecimal(std::string& out, double component)
{
    // NaN is 0.
    double const clamped = component > 0 ? std::min(component, 1.0) : 0;
    auto const value = static_cast<unsigned int>(std::lround(clamped * 255));
    constexpr char digits[] = "0123456789abcdef";
    out += digits[value >> 4];
    out += digits[value & 0xF];
}

std::string fontTag(NSColor const& color)
{
    KVNSRef<NSColor const*> const converted = color.usingColorSpace(NSColor::sRGBColorSpaceName());
    // A colour that does not convert is written by its own components.
    NSColor const& written = converted ? *converted.get() : color;
    std::string tag = "<font color=\"#";
    appendHexadecimal(tag, written.redComponent());
    appendHexadecimal(tag, written.greenComponent());
    appendHexadecimal(tag, written.blueComponent());
    return tag += "\">";
}

/// Writes the tags between two pieces of text; it knows which are open.
template <class Text>
class TagWriter {
public:
    explicit TagWriter(Text& out) : out_(out) {}

    void change(NSAttributes const* attributes)
    {
        auto const value = [&](NSAttributeName name) {
            return attributes ? attributes->value(name) : nullptr;
        };
        if (auto const* font = dynamic_cast<NSFont const*>(value(NSFontAttributeName))) {
            change(bold_, font->isBold(), "<b>", "</b>");
            change(italic_, font->isItalic(), "<i>", "</i>");
        }
        change(underline_, value(NSUnderlineStyleAttributeName) != nullptr, "<u>", "</u>");
        setColor(dynamic_cast<NSColor const*>(value(NSForegroundColorAttributeName)));
    }

    void closeAll()
    {
        change(underline_, false, "<u>", "</u>");
        change(italic_, false, "<i>", "</i>");
        change(bold_, false, "<b>", "</b>");
        setColor(nullptr);
    }

private:
    void change(bool& isOpen, bool open, std::string_view opening, std::string_view closing)
    {
        if (isOpen != open)
            append(out_, open ? opening : closing);
        isOpen = open;
    }

    void setColor(NSColor const* color)
    {
        if (CFEqual(color, color_))
            return;
        if (color_)
            append(out_, "</font>");
        if (color)
            append(out_, fontTag(*color));
        color_ = color;
    }

    Text& out_;
    bool bold_ = false;
    bool italic_ = false;
    bool underline_ = false;
    NSColor const* color_ = nullptr;
};

/// The first `length` units with tags. Attributes count where a grapheme cluster begins, so a run
/// that begins within one takes effect behind it, if it reaches that far.
template <class Text>
void appendTagged(Text& out, NSAttributedString const& string, std::size_t length)
{
    std::u16string_view const units = string.string().view().substr(0, length);
    TagWriter<Text> tags(out);
    std::size_t written = 0;
    std::size_t runStart = 0;
    for (NSAttributedString::Run const& run : string.runs()) {
        std::size_t const start =
            std::max(CFStringGetGraphemeBoundary(units, written, runStart), written);
        runStart = run.end;
        if (start >= std::min(run.end, length))
            continue;
        appendUnits(out, units.substr(written, start - written));
        tags.change(run.attributes);
        written = start;
    }
    appendUnits(out, units.substr(written));
    tags.closeAll();
}

// --- Captions ---

/// How much of a caption's text is written: all of it but one newline at its end. 0: the caption is
/// left out.
std::size_t writtenLength(KVCaption const* caption)
{
    if (!caption || !caption->attributedString())
        return 0;
    std::u16string_view const text = caption->attributedString()->string().view();
    return text.size() - (!text.empty() && CFCharacterIsNewline(text.back()));
}

double secondsOnGrid(CMTime const& time, CMTime const& frameDuration, CMTime const& offset)
{
    return CMTimeGetSeconds(
        KV_CMTimeCeilingToSampleDuration(CMTimeAdd(time, offset), frameDuration));
}

} // namespace

KVString KVTimecodeStringFromTimeInSeconds(double seconds)
{
    std::string text;
    appendTimecode(text, seconds);
    return text;
}

KVString KVSRTCaptionsExporter::_taggedTextFromCaptionString(NSAttributedString const* string)
{
    std::u16string text;
    if (string)
        appendTagged(text, *string, string->length());
    return KVString::fromUTF16(text);
}

KVNSRef<NSError*> KVSRTCaptionsExporter::exportCaptionsToString(std::string& utf8,
                                                                KVCaptionArray const& captions,
                                                                CMTime frameDuration,
                                                                CMTime startTimeOffset,
                                                                bool includeFormattingTags)
{
    std::string out;
    long long number = 0;
    for (KVCaption const* caption : captions) {
        std::size_t const length = writtenLength(caption);
        if (length == 0)
            continue;
        NSAttributedString const& string = *caption->attributedString();
        std::u16string_view const text = string.string().view().substr(0, length);
        if (!string.string().cf_str()->isASCII() && !CFStringIsWellFormed(text)) {
            auto const userInfo = KVMakeRef<NSMutableDictionary>();
            userInfo->setValue(NSLocalizedDescriptionKey,
                               KVString("The captions could not be exported.").cf_str());
            userInfo->setValue(
                NSLocalizedFailureReasonErrorKey,
                KVString("A caption's text cannot be represented in UTF-8.").cf_str());
            return KVMakeRef<NSError>("QFSRTCaptionsExporterError", notRepresentable, userInfo);
        }
        CMTimeRange const& range = caption->timeRange();
        if (number > 0)
            out += '\n';
        appendNumber(out, ++number, 1);
        out += '\n';
        appendTimecode(out, secondsOnGrid(range.start, frameDuration, startTimeOffset));
        out += " --> ";
        appendTimecode(out,
                       secondsOnGrid(KV_CMTimeRangeEnd(range), frameDuration, startTimeOffset));
        out += '\n';
        if (includeFormattingTags)
            appendTagged(out, string, length);
        else
            appendUTF8(out, text);
        out += '\n';
    }
    utf8 = std::move(out);
    return nullptr;
}

KVNSRef<NSError*> KVSRTCaptionsExporter::exportCaptionsToURL(KVURL const& url,
                                                             KVCaptionArray const& captions,
                                                             CMTime frameDuration,
                                                             CMTime startTimeOffset,
                                                             bool includeFormattingTags)
{
    std::string utf8;
    KVNSRef<NSError*> error = exportCaptionsToString(utf8, captions, frameDuration, startTimeOffset,
                                                     includeFormattingTags);
    return error ? error : NSStringWriteToURL(utf8, url);
}
