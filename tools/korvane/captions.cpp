// korvane captions show, convert, check: SubRip files listed, retimed, explained.

#include "AtomicOutput.h"
#include "Input.h"
#include "Json.h"
#include "SubRipChecker.h"
#include "TimeForms.h"
#include "ToolError.h"
#include "commands.h"

#include <korvane/korvane.h>

#include <algorithm>
#include <charconv>
#include <memory>
#include <optional>

namespace {

// --- Options ---

/// "1001/24000": a number of seconds above zero.
std::optional<CMTime> parseFrame(std::string const& text)
{
    char const* const end = text.data() + text.size();
    std::int64_t value = 0;
    std::int32_t scale = 1;
    auto [next, error] = std::from_chars(text.data(), end, value);
    if (error == std::errc() && next != end && *next == '/') {
        auto const rest = std::from_chars(next + 1, end, scale);
        next = rest.ptr;
        error = rest.ec;
    }
    if (error != std::errc() || next != end || value < 1 || scale < 1)
        return std::nullopt;
    return CMTimeMake(value, scale);
}

/// "-01:00:00", "00:00:01.5", "90" or "-0.25": seconds in thousandths, with or without hours and
/// minutes.
std::optional<CMTime> parseOffset(std::string text)
{
    bool const isNegative = text.starts_with('-');
    text.erase(0, isNegative || text.starts_with('+') ? 1 : 0);
    std::int64_t seconds = 0;
    std::int64_t thousandths = 0;
    char const* next = text.data();
    char const* const end = next + text.size();
    for (int field = 0;; ++field) {
        // Seven digits keep the sum far from its limits.
        char const* const start = next;
        std::int64_t value = 0;
        while (next != end && *next >= '0' && *next <= '9' && next - start < 7)
            value = value * 10 + (*next++ - '0');
        if (next == start)
            return std::nullopt;
        seconds = seconds * 60 + value;
        if (next == end || *next != ':' || field == 2)
            break;
        ++next;
    }
    if (next != end && (*next == '.' || *next == ',')) {
        ++next;
        std::int64_t unit = 100;
        for (; next != end && *next >= '0' && *next <= '9' && unit > 0; unit /= 10)
            thousandths += unit * (*next++ - '0');
    }
    if (next != end)
        return std::nullopt;
    std::int64_t const sum = seconds * 1000 + thousandths;
    return CMTimeMake(isNegative ? -sum : sum, 1000);
}

/// The option's text as a time, or the end with code 2.
template <class Parse>
CMTime timeOption(char const* option, std::string const& text, Parse parse, char const* expected)
{
    auto const time = parse(text);
    if (!time) {
        throw ToolError(ExitCode::Usage,
                        std::string(option) + ": \"" + text + "\" is not " + expected);
    }
    return *time;
}

/// Empty text asks for no frames.
std::optional<CMTime> frameOption(std::string const& text)
{
    if (text.empty())
        return std::nullopt;
    return timeOption("--frame", text, parseFrame,
                      "a duration in seconds above zero, such as 1/25 or 1001/24000");
}

// --- Reading ---

struct Strict {
    KVCaptionArray captions;
    /// 0 for a file that was read whole.
    long long code;
};

/// Without frames the times are those of the file, to the millisecond.
Strict importStrictly(std::string_view bytes, std::optional<CMTime> frame, CMTime offset)
{
    // A time of n milliseconds is seldom a whole number of them as a `double`, and the import
    // rounds down: so it takes place on a finer grid and the nearest millisecond is taken.
    CMTime const microsecond = CMTimeMake(1, 1'000'000);
    CMTime const millisecond = CMTimeMake(1, 1000);
    std::vector<KVCaptionArray> arrays;
    auto const importer = KVMakeRef<KVSRTCaptionsImporter>();
    auto const error = importer->importCaptionsFromString(NSStringWithBytes(bytes), arrays,
                                                          frame.value_or(microsecond), offset);
    Strict result{{}, error ? error->code() : 0};
    for (KVCaptionArray const& one : arrays) {
        KVNSRef<KVCaption*> const& caption = one.at(0);
        result.captions.push_back(caption);
        if (frame)
            continue;
        CMTimeRange const range = caption->timeRange();
        result.captions.back() = KVMakeRef<KVCaptionSRT>(
            caption->attributedString(),
            CMTimeRangeFromTimeToTime(
                KV_CMTimeRoundToSampleDuration(range.start, millisecond),
                KV_CMTimeRoundToSampleDuration(KV_CMTimeRangeEnd(range), millisecond)));
    }
    return result;
}

char const* meaningOf(long long code)
{
    switch (code) {
    case KVSRTCaptionsImporter::badFile:
        return "it is empty, does not begin with \"1\", or a number or time line is wrong";
    case KVSRTCaptionsImporter::badTimecode:
        return "a time cannot be read";
    default:
        return "a caption has no length on the frame grid";
    }
}

/// Reads a file, or ends with code 3 and the line that is to blame.
KVCaptionArray readCaptions(std::string const& path, std::optional<CMTime> frame, CMTime offset)
{
    std::string const bytes = readFile(path);
    Strict strict = importStrictly(bytes, frame, offset);
    if (strict.code == 0)
        return std::move(strict.captions);
    // The first fault from the last caption on that was read: what stopped the reader.
    SubRipCheck const check = checkSubRip(bytes);
    std::size_t from = 0;
    if (!strict.captions.empty() && strict.captions.size() <= check.captions.size())
        from = check.captions[strict.captions.size() - 1].line;
    for (SubRipFinding const& finding : check.findings) {
        if (finding.isError && finding.line >= from) {
            throw badInput(path, std::max<std::size_t>(finding.line, 1),
                           "found " + finding.found + ", expected " + finding.expected);
        }
    }
    throw badInput(path, std::string(meaningOf(strict.code)) + ", at caption " +
                             std::to_string(strict.captions.size() + 1));
}

double startOf(KVCaption const* caption)
{
    return CMTimeGetSeconds(caption->timeRange().start);
}

double endOf(KVCaption const* caption)
{
    return CMTimeGetSeconds(KV_CMTimeRangeEnd(caption->timeRange()));
}

/// A caption's text in one line, " / " for a line end.
std::string withSlashes(std::string text)
{
    for (std::size_t i = 0; (i = text.find('\n', i)) != text.npos; i += 3)
        text.replace(i, 1, " / ");
    return text;
}

// --- show ---

struct ShowOptions {
    std::string file;
    std::string frame;
    bool tags = false;
    bool json = false;
};

void show(ShowOptions const& options)
{
    KVCaptionArray const captions =
        readCaptions(options.file, frameOption(options.frame), kCMTimeZero);
    Json list = Json::array();
    std::string table;
    std::size_t number = 0;
    for (KVCaption const* caption : captions) {
        ++number;
        std::string const tagged =
            KVSRTCaptionsExporter::_taggedTextFromCaptionString(caption->attributedString());
        std::string const text = caption->text();
        if (options.json) {
            list.push_back({{"number", number},
                            {"start", startOf(caption)},
                            {"end", endOf(caption)},
                            {"text", text},
                            {"tagged", tagged}});
            continue;
        }
        std::string const digits = std::to_string(number);
        table += std::string(digits.size() < 4 ? 4 - digits.size() : 0, ' ') + digits + "  " +
                 timecodeText(startOf(caption)) + "  " + timecodeText(endOf(caption)) + "  " +
                 withSlashes(options.tags ? tagged : text) + "\n";
    }
    if (options.json)
        printJson({{"file", options.file}, {"captions", std::move(list)}});
    else
        printOutput(table);
}

// --- convert ---

struct ConvertOptions {
    std::string input;
    std::string output;
    std::string frame;
    std::string offset = "0";
    bool tags = false;
};

void convert(ConvertOptions const& options)
{
    std::optional<CMTime> const frame = frameOption(options.frame);
    CMTime const offset = timeOption("--offset", options.offset, parseOffset,
                                     "an offset such as -01:00:00, 00:00:01.500 or 2.5");
    KVCaptionArray const captions = readCaptions(options.input, frame, offset);
    std::size_t cut = 0;
    std::size_t number = 0;
    for (KVCaption const* caption : captions) {
        ++number;
        if (endOf(caption) <= 0) {
            throw ToolError(ExitCode::Failed, "the offset moves caption " + std::to_string(number) +
                                                  " before zero, where a file has no times");
        }
        cut += startOf(caption) < 0;
    }
    if (cut > 0)
        printMessage(std::to_string(cut) + (cut == 1 ? " caption begins" : " captions begin") +
                     " before zero and is cut there");

    std::string file;
    if (KVSRTCaptionsExporter::exportCaptionsToString(
            file, captions, frame.value_or(CMTimeMake(1, 1000)), kCMTimeZero, options.tags)) {
        throw badInput(options.input,
                       "a text holds half a surrogate pair, which UTF-8 cannot hold");
    }
    AtomicOutput output(options.output);
    output.write(file);
    output.commit();
}

// --- check ---

struct CheckOptions {
    std::string file;
    std::string repair;
    std::string frame;
    bool json = false;
};

std::string strictAnswer(Strict const& strict)
{
    if (strict.code == 0)
        return "a strict import takes it";
    return "a strict import refuses it with code " + std::to_string(strict.code) + ": " +
           meaningOf(strict.code);
}

void printFindings(CheckOptions const& options, SubRipCheck const& check, Strict const& strict)
{
    std::string text;
    for (SubRipFinding const& finding : check.findings) {
        text += options.file;
        if (finding.line > 0)
            text += ':' + std::to_string(finding.line);
        text += finding.isError ? ": error: " : ": warning: ";
        text += "found " + finding.found + ", expected " + finding.expected;
        if (!options.repair.empty() && !finding.repair.empty())
            text += "; repaired: " + finding.repair;
        text += '\n';
    }
    auto const errors = std::count_if(check.findings.begin(), check.findings.end(),
                                      [](auto const& finding) { return finding.isError; });
    text += options.file + ": " + std::to_string(check.captions.size()) + " captions, " +
            std::to_string(errors) + " errors, " +
            std::to_string(check.findings.size() - static_cast<std::size_t>(errors)) +
            " warnings, " + check.encoding + "; " + strictAnswer(strict) + "\n";
    printOutput(text);
}

void printFindingsAsJson(CheckOptions const& options, SubRipCheck const& check,
                         Strict const& strict)
{
    Json findings = Json::array();
    for (SubRipFinding const& finding : check.findings) {
        Json entry = {{"line", finding.line},
                      {"severity", finding.isError ? "error" : "warning"},
                      {"kind", finding.kind},
                      {"found", finding.found},
                      {"expected", finding.expected}};
        if (!options.repair.empty() && !finding.repair.empty())
            entry["repair"] = finding.repair;
        findings.push_back(std::move(entry));
    }
    printJson({{"file", options.file},
               {"encoding", check.encoding},
               {"captions", check.captions.size()},
               {"strictImport", {{"code", strict.code}, {"captions", strict.captions.size()}}},
               {"findings", std::move(findings)}});
}

void check(CheckOptions const& options)
{
    std::optional<CMTime> const frame = frameOption(options.frame);
    std::string const bytes = readFile(options.file);
    SubRipCheck const found = checkSubRip(bytes);
    Strict const strict = importStrictly(bytes, frame, kCMTimeZero);
    if (options.json)
        printFindingsAsJson(options, found, strict);
    else
        printFindings(options, found, strict);

    if (!options.repair.empty()) {
        if (found.captions.empty())
            throw badInput(options.file, "nothing of it can be saved");
        std::string const repaired = repairedSubRip(found.captions);
        AtomicOutput output(options.repair);
        output.write(repaired);
        output.commit();
        if (importStrictly(repaired, frame, kCMTimeZero).code != 0) {
            throw ToolError(ExitCode::Failed, options.repair + ": a strict import refuses the "
                                                               "repaired file at this frame rate");
        }
        return;
    }
    bool const hasErrors = std::any_of(found.findings.begin(), found.findings.end(),
                                       [](auto const& finding) { return finding.isError; });
    if (hasErrors || strict.code != 0)
        throw ToolError(ExitCode::Failed, "");
}

} // namespace

void addCaptionsCommands(CLI::App& program)
{
    CLI::App& captions =
        *program.add_subcommand("captions", "List, move, explain and mend SubRip captions");
    captions.require_subcommand(1);
    char const* const frameHelp =
        "The length of a frame in seconds, such as 1001/24000; times go up to whole frames";

    auto const showOptions = std::make_shared<ShowOptions>();
    CLI::App& showCommand =
        *captions.add_subcommand("show", "List the captions of a file as the library reads them");
    showCommand.add_option("FILE", showOptions->file, "A SubRip file")->required();
    showCommand.add_option("--frame", showOptions->frame, frameHelp)->type_name("TIME");
    showCommand.add_flag("--tags", showOptions->tags, "Print styles as tags");
    addJsonFlag(showCommand, showOptions->json);
    showCommand.callback([showOptions] { show(*showOptions); });

    auto const convertOptions = std::make_shared<ConvertOptions>();
    CLI::App& convertCommand = *captions.add_subcommand(
        "convert", "Move a file's captions in time, and onto whole frames");
    convertCommand.add_option("IN", convertOptions->input, "A SubRip file")->required();
    convertCommand.add_option("OUT", convertOptions->output, "The file to write")->required();
    convertCommand.add_option("--frame", convertOptions->frame, frameHelp)->type_name("TIME");
    convertCommand
        .add_option("--offset", convertOptions->offset,
                    "What is added to all times, such as -01:00:00 or 2.5")
        ->type_name("TIME")
        ->capture_default_str();
    convertCommand.add_flag("--tags", convertOptions->tags, "Write styles as tags");
    convertCommand.callback([convertOptions] { convert(*convertOptions); });

    auto const checkOptions = std::make_shared<CheckOptions>();
    CLI::App& checkCommand = *captions.add_subcommand(
        "check", "Tell line by line what is wrong with a file: 1 where there are errors");
    checkCommand.add_option("FILE", checkOptions->file, "Any file")->required();
    checkCommand
        .add_option("--repair", checkOptions->repair,
                    "Write what can be saved to this file, and list each repair")
        ->type_name("FILE");
    checkCommand.add_option("--frame", checkOptions->frame, frameHelp)->type_name("TIME");
    addJsonFlag(checkCommand, checkOptions->json);
    checkCommand.callback([checkOptions] { check(*checkOptions); });

    addExamples(
        captions,
        {"korvane captions check lighthouse.srt",
         "korvane captions convert lighthouse.srt later.srt --offset 2.5 --frame 1001/24000"});
}
