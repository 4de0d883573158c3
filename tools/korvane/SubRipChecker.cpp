#include "SubRipChecker.h"

#include "TimeForms.h"
#include "ToolError.h"

#include <korvane/korvane.h>

#include <algorithm>
#include <array>
#include <optional>

namespace {

// --- Text ---

bool isBlank(char c)
{
    return c == ' ' || c == '\t';
}

std::string_view trimmed(std::string_view text)
{
    while (!text.empty() && isBlank(text.front()))
        text.remove_prefix(1);
    while (!text.empty() && isBlank(text.back()))
        text.remove_suffix(1);
    return text;
}

bool isDigit(char c)
{
    return c >= '0' && c <= '9';
}

bool isUTF8(std::string_view text)
{
    return !KVString::fromUTF8(text).isNull();
}

/// A piece of the file between quotes, short enough for a message, and in one line.
std::string excerpt(std::string_view text)
{
    constexpr std::size_t most = 60;
    std::size_t length = std::min(text.size(), most);
    while (length < text.size() && length > 0 && (text[length] & 0xC0) == 0x80)
        --length;
    return '"' + inOneLine(text.substr(0, length)) + (length < text.size() ? "..." : "") + '"';
}

std::string timecode(long long milliseconds)
{
    return timecodeText(static_cast<double>(milliseconds) / 1000);
}

// --- Times, forgivingly ---

struct LooseTime {
    long long milliseconds;
    /// What is unusual about it; empty for "00:00:01,500".
    std::string complaint;
    bool isError;
};

/// A time in any of the ways that files write it. Nothing when there is no number in it, or
/// something else.
std::optional<LooseTime> looseTime(std::string_view text)
{
    text = trimmed(text);
    bool const isNegative = text.starts_with('-');
    if (isNegative)
        text.remove_prefix(1);

    std::vector<long long> fields;
    std::string separators;
    std::size_t lastDigits = 0;
    bool hasBlanks = false;
    bool isInField = false;
    for (char c : text) {
        if (isDigit(c)) {
            if (!isInField) {
                fields.push_back(0);
                lastDigits = 0;
            }
            // Nine digits hold every time there is, and cannot overflow.
            if (++lastDigits > 9)
                return std::nullopt;
            fields.back() = fields.back() * 10 + (c - '0');
            isInField = true;
        } else if (isBlank(c)) {
            hasBlanks = true;
        } else if (isInField && (c == ':' || c == ',' || c == '.' || c == ';')) {
            separators += c;
            isInField = false;
        } else {
            return std::nullopt;
        }
    }
    if (fields.empty() || separators.size() + 1 != fields.size() || fields.size() > 4)
        return std::nullopt;

    // The last field is a fraction behind anything but a colon, and where it is the fourth.
    bool const hasFraction =
        !separators.empty() && (separators.back() != ':' || fields.size() == 4);
    long long const fraction = hasFraction ? fields.back() : 0;
    if (hasFraction)
        fields.pop_back();
    if (fields.size() > 3)
        return std::nullopt;
    long long seconds = 0;
    for (long long field : fields)
        seconds = seconds * 60 + field;
    bool const isOutOfRange =
        (fields.size() > 1 && fields.back() > 59) || (fields.size() == 3 && fields[1] > 59);

    constexpr long long mostSeconds = 10'000 * 3600;
    LooseTime time{seconds * 1000 + fraction, "", true};
    if (time.milliseconds > mostSeconds * 1000)
        return std::nullopt;
    if (isNegative)
        time.milliseconds = -time.milliseconds;
    if (fields.size() < 3)
        time.complaint = "has no hours";
    else if (!hasFraction)
        time.complaint = "has no milliseconds";
    else if (separators.back() == ':' || separators.back() == ';' || separators[0] != ':' ||
             separators[1] != ':')
        time.complaint = "has other separators";
    else if (hasBlanks)
        time.complaint = "has blanks in it";
    else if (isNegative)
        time = {time.milliseconds, "lies before zero", false};
    else if (separators.back() == '.')
        time = {time.milliseconds, "has a full stop for the comma", false};
    else if (lastDigits != 3)
        time = {time.milliseconds, "has not three digits of milliseconds", false};
    else if (isOutOfRange)
        time = {time.milliseconds, "has more than 59 minutes or seconds", false};
    return time;
}

/// Where a time line's arrow stands, or what stands for it.
struct Arrow {
    std::size_t position;
    std::size_t length;
};

std::optional<Arrow> findArrow(std::string_view line)
{
    for (std::string_view arrow : {"-->", "-- >", "->", "=>", "\u2192", "\u2014>", "\u2013>"}) {
        std::size_t const position = line.find(arrow);
        if (position != line.npos)
            return Arrow{position, arrow.size()};
    }
    return std::nullopt;
}

/// A line with an arrow between two numbers with colons; one is enough beside a whole arrow.
bool isTimeLine(std::string_view line)
{
    auto const arrow = findArrow(line);
    if (!arrow)
        return false;
    auto const looksLikeATime = [](std::string_view text) {
        return text.find(':') != text.npos && std::any_of(text.begin(), text.end(), isDigit);
    };
    bool const left = looksLikeATime(line.substr(0, arrow->position));
    bool const right = looksLikeATime(line.substr(arrow->position + arrow->length));
    bool const isWhole = line.substr(arrow->position, arrow->length) == "-->";
    return isWhole ? left || right : left && right;
}

/// The number of a caption, as "7", " 7" or "7."; nothing for other lines.
std::optional<unsigned long long> looseNumber(std::string_view line)
{
    line = trimmed(line);
    if (line.ends_with('.') || line.ends_with(':'))
        line.remove_suffix(1);
    if (line.empty() || line.size() > 18 || !std::all_of(line.begin(), line.end(), isDigit))
        return std::nullopt;
    return std::stoull(std::string(line));
}

// --- The reader ---

class Checker {
public:
    explicit Checker(std::string_view bytes)
    {
        decode(bytes);
        readBlocks();
        checkOrder();
        std::stable_sort(check_.findings.begin(), check_.findings.end(),
                         [](auto const& a, auto const& b) { return a.line < b.line; });
    }

    SubRipCheck take() { return std::move(check_); }

private:
    enum Severity : bool { warning, error };

    void report(std::size_t line, Severity severity, std::string kind, std::string found,
                std::string expected, std::string repair = {})
    {
        // A line of a million tags is not worth a million messages.
        if (check_.findings.size() < 10'000) {
            check_.findings.push_back({line, severity == error, std::move(kind), std::move(found),
                                       std::move(expected), std::move(repair)});
        }
    }

    // --- Bytes to lines ---

    void decode(std::string_view bytes)
    {
        check_.encoding = "UTF-8";
        std::string converted;
        if (bytes.starts_with("\xEF\xBB\xBF")) {
            report(1, warning, "mark", "a byte-order mark of UTF-8", "none", "left out");
            bytes.remove_prefix(3);
        } else if (auto const wide = wideEncoding(bytes)) {
            check_.encoding = wide->name;
            converted = convertWide(*wide, bytes);
            bytes = converted;
        }
        while (bytes.starts_with("\xEF\xBB\xBF")) {
            report(1, error, "mark", "a second byte-order mark", "\"1\"", "left out");
            bytes.remove_prefix(3);
        }
        splitLines(bytes);
        recodeLines();
    }

    struct Wide {
        char const* name;
        std::size_t unit;
        std::string_view mark;
        bool isMarked;
    };

    static std::optional<Wide> wideEncoding(std::string_view bytes)
    {
        using namespace std::string_view_literals;
        static constexpr Wide kinds[] = {
            {"UTF-32, big-endian", 4, "\0\0\xFE\xFF"sv, true},
            {"UTF-32, little-endian", 4, "\xFF\xFE\0\0"sv, true},
            {"UTF-16, big-endian", 2, "\xFE\xFF"sv, true},
            {"UTF-16, little-endian", 2, "\xFF\xFE"sv, true},
        };
        for (Wide const& kind : kinds) {
            if (bytes.starts_with(kind.mark))
                return kind;
        }
        // Without a mark: a file begins with the digit 1 and a line end.
        for (Wide kind : {kinds[2], kinds[3]}) {
            std::size_t const zero = kind.mark[0] == '\xFE' ? 0 : 1;
            if (bytes.size() >= 4 && bytes[zero] == '\0' && bytes[zero + 2] == '\0' &&
                bytes[1 - zero] != '\0') {
                kind.isMarked = false;
                return kind;
            }
        }
        return std::nullopt;
    }

    std::string convertWide(Wide const& wide, std::string_view bytes)
    {
        if (wide.isMarked) {
            bytes.remove_prefix(wide.mark.size());
            report(0, warning, "encoding", wide.name, "UTF-8", "written as UTF-8");
        } else {
            report(0, error, "encoding", std::string(wide.name) + ", without a byte-order mark",
                   "UTF-8", "written as UTF-8");
        }
        if (bytes.size() % wide.unit != 0) {
            report(0, error, "encoding", "half a character at the end", "whole ones", "left out");
            bytes.remove_suffix(bytes.size() % wide.unit);
        }
        KVString const text = NSStringWithBytes(std::string(wide.mark).append(bytes));
        if (text.isNull())
            report(0, error, "encoding", "numbers that are no characters", "UTF-32");
        if (!CFStringIsWellFormed(text.view())) {
            report(0, error, "encoding", "half a surrogate pair", "pairs of surrogates",
                   "written as U+FFFD");
        }
        return text;
    }

    void splitLines(std::string_view bytes)
    {
        bool const hasNewlines = bytes.find('\n') != bytes.npos;
        if (!hasNewlines && bytes.find('\r') != bytes.npos) {
            report(1, error, "line end", "carriage returns alone",
                   "line feeds, with or without a carriage return", "replaced");
        }
        char const lineEnd = hasNewlines ? '\n' : '\r';
        for (std::size_t start = 0; start <= bytes.size();) {
            std::size_t const end = std::min(bytes.find(lineEnd, start), bytes.size());
            std::string_view line = bytes.substr(start, end - start);
            while (line.ends_with('\r'))
                line.remove_suffix(1);
            lines_.emplace_back(line);
            start = end + 1;
        }
    }

    /// Lines that are not UTF-8 are taken as Windows-1252, as a reader of the whole file would.
    void recodeLines()
    {
        std::size_t foreign = 0;
        std::size_t firstForeign = 0;
        bool hasUTF8 = false;
        for (std::size_t i = 0; i < lines_.size(); ++i) {
            std::string& line = lines_[i];
            auto const high =
                std::find_if(line.begin(), line.end(), [](char c) { return c & 0x80; });
            if (high == line.end())
                continue;
            if (isUTF8(line)) {
                hasUTF8 = true;
                if (line.find("\uFFFD") != line.npos) {
                    report(i + 1, warning, "encoding", "U+FFFD, which an earlier conversion left",
                           "the character that was lost");
                }
                continue;
            }
            if (++foreign == 1)
                firstForeign = i + 1;
            line = NSStringWithBytes(line).toUTF8();
        }
        if (foreign == 0)
            return;
        check_.encoding = hasUTF8 ? "UTF-8 and Windows-1252 mixed" : "Windows-1252";
        report(firstForeign, hasUTF8 ? error : warning, "encoding",
               std::to_string(foreign) + (foreign == 1 ? " line" : " lines") +
                   " not in UTF-8, this is the first" +
                   (hasUTF8 ? ", and others that are: a strict reader takes all for Windows-1252"
                            : ""),
               "UTF-8", "read as Windows-1252, written as UTF-8");
    }

    // --- Lines to captions ---

    std::string_view line(std::size_t i) const { return lines_[i]; }

    bool isNumberWithTimes(std::size_t i) const
    {
        if (!looseNumber(line(i)))
            return false;
        std::size_t next = i + 1;
        while (next < lines_.size() && trimmed(line(next)).empty())
            ++next;
        return next < lines_.size() && isTimeLine(line(next));
    }

    bool beginsBlock(std::size_t i) const { return isTimeLine(line(i)) || isNumberWithTimes(i); }

    void readBlocks()
    {
        std::size_t i = 0;
        while (i < lines_.size() && trimmed(line(i)).empty())
            ++i;
        if (i == lines_.size()) {
            report(0, error, "empty", "no text at all", "captions");
            return;
        }
        if (i > 0) {
            report(1, error, "blank start", "an empty first line", "\"1\" as the first character",
                   "left out");
        }
        while (i < lines_.size()) {
            if (trimmed(line(i)).empty()) {
                ++i;
            } else if (isTimeLine(line(i))) {
                report(i + 1, error, "number", "times without a number",
                       std::to_string(expectedNumber_), "numbered");
                ++expectedNumber_;
                i = readCaption(i);
            } else if (isNumberWithTimes(i)) {
                i = readCaption(checkNumber(i));
            } else {
                strayLine(i++);
            }
        }
        if (check_.captions.empty())
            report(0, error, "empty", "no caption", "captions");
    }

    /// The line of the times that belong to the number.
    std::size_t checkNumber(std::size_t i)
    {
        unsigned long long const number = *looseNumber(line(i));
        if (number != expectedNumber_) {
            report(i + 1, error, "number", "number " + std::to_string(number),
                   std::to_string(expectedNumber_), "numbered anew from here on");
        } else if (!std::all_of(line(i).begin(), line(i).end(), isDigit)) {
            report(i + 1, error, "number", excerpt(line(i)), "the digits alone", "digits kept");
        }
        expectedNumber_ = number + 1;
        std::size_t times = i + 1;
        while (trimmed(line(times)).empty())
            ++times;
        if (times > i + 1) {
            report(i + 2, error, "time line", "an empty line behind the number", "the times",
                   "left out");
        }
        return times;
    }

    /// Text that belongs to no block.
    void strayLine(std::size_t i)
    {
        if (check_.captions.empty() || !lastCaptionIsWhole_) {
            report(i + 1, error, "stray text", excerpt(line(i)), "a caption's number", "left out");
            return;
        }
        report(i + 1, error, "stray text", "text behind an empty line: " + excerpt(line(i)),
               "a caption's number", "joined to the text before");
        SubRipCaption& caption = check_.captions.back();
        caption.text += (caption.text.empty() ? "" : "\n") + lines_[i];
    }

    /// From the times on; answers where the next block may begin.
    std::size_t readCaption(std::size_t times)
    {
        auto const range = readTimes(times);
        std::size_t i = times + 1;
        if (i + 1 < lines_.size() && line(i).empty() && !line(i + 1).empty() &&
            !beginsBlock(i + 1)) {
            report(i + 1, warning, "blank line", "an empty first line of text", "text", "left out");
            ++i;
        }
        std::string text;
        std::size_t const firstLine = i;
        for (; i < lines_.size() && !line(i).empty(); ++i) {
            if (beginsBlock(i)) {
                report(i + 1, error, "missing line",
                       "the next caption without an empty line before it", "an empty line",
                       "put in");
                break;
            }
            if (trimmed(line(i)).empty()) {
                report(i + 1, warning, "blank line",
                       "a line of blanks, which is text to a strict reader", "an empty line",
                       "left out");
                continue;
            }
            text += (text.empty() ? "" : "\n") + lines_[i];
        }
        if (text.empty())
            reportEmptyText(firstLine, i);
        checkTags(text, firstLine + 1);
        lastCaptionIsWhole_ = range.has_value();
        if (range)
            check_.captions.push_back({times + 1, (*range)[0], (*range)[1], std::move(text)});
        return i;
    }

    void reportEmptyText(std::size_t firstLine, std::size_t end)
    {
        std::size_t const number = std::min(firstLine + 1, lines_.size());
        if (end + 1 < lines_.size() && beginsBlock(end + 1)) {
            report(number, error, "empty caption",
                   "no text and one empty line, so a strict reader takes the next caption for text",
                   "text", "left out");
        } else {
            report(number, warning, "empty caption", "no text", "text", "left out");
        }
    }

    std::optional<std::array<long long, 2>> readTimes(std::size_t i)
    {
        std::string_view const whole = line(i);
        Arrow const arrow = *findArrow(whole);
        if (whole.substr(arrow.position, arrow.length) != "-->") {
            report(i + 1, error, "time line", excerpt(whole.substr(arrow.position, arrow.length)),
                   "\"-->\"", "replaced");
        }
        std::string_view const parts[2] = {
            trimmed(whole.substr(0, arrow.position)),
            trimmed(withoutPlacement(whole.substr(arrow.position + arrow.length), i))};
        std::array<long long, 2> times{};
        for (std::size_t part = 0; part < 2; ++part) {
            auto const time = looseTime(parts[part]);
            if (!time) {
                report(i + 1, error, "time", excerpt(parts[part]),
                       "hours:minutes:seconds,milliseconds", "the caption is left out");
                return std::nullopt;
            }
            times[part] = time->milliseconds;
            if (!time->complaint.empty()) {
                report(i + 1, time->isError ? error : warning, "time",
                       excerpt(parts[part]) + ", which " + time->complaint, timecode(times[part]),
                       "written as " + timecode(std::max(times[part], 0LL)));
            }
        }
        if (times[1] < 0) {
            report(i + 1, warning, "time", "a caption that ends before zero", "a later one",
                   "the caption is left out");
            return std::nullopt;
        }
        return times;
    }

    /// Some writers put the text's place behind the times ("X1:40 X2:600 Y1:20 Y2:50").
    std::string_view withoutPlacement(std::string_view text, std::size_t i)
    {
        std::size_t const place = text.find_first_of("XYxy");
        if (place == text.npos)
            return text;
        report(i + 1, error, "time line",
               "a placement behind the times: " + excerpt(text.substr(place)), "the times alone",
               "left out");
        return text.substr(0, place);
    }

    // --- Tags ---

    void checkTags(std::string const& text, std::size_t firstLine)
    {
        struct Style {
            char const* name;
            int open;
            std::size_t line;
        };
        Style styles[3] = {{"b", 0, 0}, {"i", 0, 0}, {"u", 0, 0}};
        std::size_t lineNumber = firstLine;
        using Importer = KVSRTCaptionsImporter;
        for (KVString const& token : importer_->_tokenizeString(
                 text, importer_->tagBeginningCharacters(), importer_->tagEndingCharacters())) {
            std::string const tag = token;
            int const kind = importer_->_tagFromToken(token);
            bool const isOpened = tag[0] == '<' || tag[0] == '{';
            if (kind == Importer::unknownTag && tag != "</font>") {
                report(lineNumber, warning, "tag",
                       "the unknown tag " + excerpt(tag) + ", which is dropped",
                       "<b>, <i>, <u>, <br> or <font color=\"...\">");
            } else if (kind == Importer::notATag && isOpened) {
                bool const isClosed = tag.size() > 1 && (tag.back() == '>' || tag.back() == '}');
                report(lineNumber, warning, "tag",
                       isClosed ? excerpt(tag) + ", which is no tag but text"
                                : "an opened bracket that nothing closes: " + excerpt(tag),
                       isClosed ? "a known tag" : "\">\" or \"}\"");
            } else if (kind >= Importer::boldOn && kind <= Importer::underlineOff) {
                Style& style = styles[(kind - Importer::boldOn) / 2];
                bool const opens = (kind - Importer::boldOn) % 2 == 0;
                if (opens && style.open++ == 0)
                    style.line = lineNumber;
                else if (!opens && --style.open < 0)
                    report(lineNumber, warning, "tag", excerpt(tag) + " without an opening tag",
                           std::string("<") + style.name + "> before it");
            }
            lineNumber += static_cast<std::size_t>(std::count(tag.begin(), tag.end(), '\n'));
        }
        for (Style const& style : styles) {
            if (style.open > 0)
                report(style.line, warning, "tag",
                       std::string("<") + style.name + "> that is not closed",
                       std::string("</") + style.name + "> behind it");
        }
    }

    // --- Captions among each other ---

    void checkOrder()
    {
        constexpr long long usualLength = 2000;
        std::vector<SubRipCaption>& captions = check_.captions;
        std::erase_if(captions, [](SubRipCaption const& c) { return c.text.empty(); });
        for (std::size_t i = 0; i < captions.size(); ++i) {
            SubRipCaption& caption = captions[i];
            caption.startMilliseconds = std::max(caption.startMilliseconds, 0LL);
            long long& start = caption.startMilliseconds;
            long long& end = caption.endMilliseconds;
            if (end < start) {
                std::swap(start, end);
                report(caption.line, error, "length",
                       "end time " + timecode(start) + " that precedes start time " + timecode(end),
                       "a later end", "the two are exchanged");
            } else if (end == start) {
                long long const next =
                    i + 1 < captions.size() ? captions[i + 1].startMilliseconds : start;
                end = next > start ? std::min(next, start + usualLength) : start + usualLength;
                report(caption.line, error, "length", "start and end at " + timecode(start),
                       "a later end", "ends at " + timecode(end));
            }
            if (i == 0)
                continue;
            SubRipCaption const& before = captions[i - 1];
            if (start < before.startMilliseconds) {
                report(caption.line, warning, "order", "start time " + timecode(start),
                       timecode(before.startMilliseconds) + " or later, as the caption before has");
            } else if (start < before.endMilliseconds) {
                report(caption.line, warning, "overlap", "start time " + timecode(start),
                       timecode(before.endMilliseconds) +
                           " or later, where the caption before ends");
            }
        }
    }

    std::vector<std::string> lines_;
    unsigned long long expectedNumber_ = 1;
    bool lastCaptionIsWhole_ = false;
    KVNSRef<KVSRTCaptionsImporter*> importer_ = KVMakeRef<KVSRTCaptionsImporter>();
    SubRipCheck check_;
};

} // namespace

SubRipCheck checkSubRip(std::string_view bytes)
{
    return Checker(bytes).take();
}

std::string repairedSubRip(std::vector<SubRipCaption> const& captions)
{
    std::string file;
    std::size_t number = 0;
    for (SubRipCaption const& caption : captions) {
        file += (number > 0 ? "\n" : "") + std::to_string(number + 1) + "\n" +
                timecode(caption.startMilliseconds) + " --> " + timecode(caption.endMilliseconds) +
                "\n" + caption.text + "\n";
        ++number;
    }
    return file;
}

std::string withoutTags(std::string const& text)
{
    auto const importer = KVMakeRef<KVSRTCaptionsImporter>();
    std::string plain;
    for (KVString const& token : importer->_tokenizeString(text, importer->tagBeginningCharacters(),
                                                           importer->tagEndingCharacters())) {
        int const kind = importer->_tagFromToken(token);
        if (kind == KVSRTCaptionsImporter::notATag)
            plain += token.toUTF8();
        else if (kind == KVSRTCaptionsImporter::lineBreak)
            plain += '\n';
    }
    return plain;
}
