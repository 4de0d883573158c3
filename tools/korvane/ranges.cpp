#include "Input.h"
#include "RangeTimeline.h"
#include "TimeExpression.h"
#include "TimeForms.h"
#include "ToolError.h"
#include "commands.h"

#include <korvane/time/VexTimeRangeAndObject.h>
#include <korvane/time/VexTimeRanges.h>

namespace {

char const* const rangesFooter =
    R"(A SET is a list of ranges, "0..3,1001/30000+2,5..inf=clip", or the name of a file that has a range
on each line; a line that begins with # is a comment. A list begins with a digit, a sign or "inf";
"-" alone is standard input. A range is START..END or START+DURATION, in the forms of "korvane
time", and may have a name behind "=". A list that begins with "-inf" stands behind "--". Results
are printed as a file has them. Ranges that touch stay two.)";

struct RangesOptions {
    std::vector<std::string> sets;
    std::string svg;
    bool apart = false, timeline = false, json = false;
};

/// One range; throws TimeSyntaxError.
KVNSRef<VexTimeRangeObj*> parseRange(std::string_view text)
{
    std::string_view name;
    if (std::size_t const equals = text.find('='); equals != text.npos) {
        name = text.substr(equals + 1);
        text = text.substr(0, equals);
    }
    CMTimeRange range;
    if (std::size_t const dots = text.find(".."); dots != text.npos) {
        CMTime const start = parseTime(text.substr(0, dots));
        CMTime const end = parseTime(text.substr(dots + 2));
        if (CMTimeCompare(end, start) < 0)
            throw TimeSyntaxError(dots + 2, "\"" + std::string(text) + "\" ends before it starts");
        range = KV_CMTimeRangeMakeWithStartEnd(start, end);
    } else if (std::size_t const plus = text.find('+', 1); plus != text.npos) {
        range = CMTimeRangeMake(parseTime(text.substr(0, plus)), parseTime(text.substr(plus + 1)));
    } else {
        throw TimeSyntaxError(0, "\"" + std::string(text.substr(0, 60)) +
                                     "\" is not START..END or START+DURATION");
    }
    if (name.empty())
        return KVMakeRef<VexTimeRangeObj>(range);
    return KVMakeRef<VexTimeRangeAndObject>(range, KVString::fromUTF8(name).cf_str());
}

std::string_view trimmed(std::string_view text)
{
    constexpr char blanks[] = " \t\r";
    text.remove_prefix(std::min(text.find_first_not_of(blanks), text.size()));
    return text.substr(0, text.find_last_not_of(blanks) + 1);
}

/// Calls `visit` with each piece between separators and its number, from 1.
template <class Visit>
void split(std::string_view text, char separator, Visit visit)
{
    for (unsigned long number = 1; !text.empty(); ++number) {
        std::size_t const end = std::min(text.find(separator), text.size());
        visit(trimmed(text.substr(0, end)), number);
        text.remove_prefix(std::min(end + 1, text.size()));
    }
}

VexTimeRangeArray readList(std::string_view list)
{
    VexTimeRangeArray ranges;
    split(list, ',', [&](std::string_view item, unsigned long) {
        try {
            ranges.push_back(parseRange(item));
        } catch (TimeSyntaxError const& error) {
            throw ToolError(ExitCode::Usage, error.what());
        }
    });
    return ranges;
}

VexTimeRangeArray readRangeFile(std::string const& path)
{
    VexTimeRangeArray ranges;
    split(readFile(path), '\n', [&](std::string_view item, unsigned long line) {
        if (item.empty() || item.starts_with('#'))
            return;
        try {
            ranges.push_back(parseRange(item));
        } catch (TimeSyntaxError const& error) {
            throw badInput(path, line, error.what());
        }
    });
    return ranges;
}

VexTimeRangeArray readSet(std::string const& set)
{
    bool const isList =
        set != "-" && (set.find_first_of("0123456789+-") == 0 || set.starts_with("inf"));
    return isList ? readList(set) : readRangeFile(set);
}

std::string listText(VexTimeRangeArray const& ranges)
{
    std::string text;
    for (VexTimeRangeObj const* range : ranges) {
        text += timeFraction(range->start()) + ".." + timeFraction(range->end());
        if (std::string const name = nameOf(range); !name.empty())
            text += "=" + name;
        text += "\n";
    }
    return text;
}

Json listJson(VexTimeRangeArray const& ranges)
{
    Json list = Json::array();
    for (VexTimeRangeObj const* range : ranges) {
        Json entry = {{"start", timeJson(range->start())},
                      {"end", timeJson(range->end())},
                      {"duration", timeJson(range->duration())}};
        if (std::string const name = nameOf(range); !name.empty())
            entry["name"] = name;
        list.push_back(entry);
    }
    return {{"ranges", list}};
}

void printRanges(RangesOptions const& options, std::vector<TimelineSet> const& sets)
{
    if (!options.svg.empty()) {
        AtomicOutput output(options.svg);
        output.write(timelineSvg(sets));
        output.commit();
        if (options.svg == "-")
            return;
    }
    if (options.json)
        printJson(listJson(sets.back().ranges));
    else if (options.timeline)
        printOutput(timelineText(sets));
    else
        printOutput(listText(sets.back().ranges));
}

using SetOperation = VexTimeRangeArray (*)(RangesOptions const& options,
                                           std::vector<TimelineSet> const& sets);

VexTimeRangeArray joined(RangesOptions const& options, std::vector<TimelineSet> const& sets)
{
    VexTimeRangeArray result;
    for (TimelineSet const& set : sets) {
        if (options.apart)
            VexTimeMutableRangeAndObjectsAddUnsortedRangeAndObjects(result, set.ranges);
        else
            VexTimeMutableRangesAddUnsortedRanges(result, set.ranges);
    }
    return result;
}

VexTimeRangeArray subtracted(RangesOptions const&, std::vector<TimelineSet> const& sets)
{
    VexTimeRangeArray result = sets[0].ranges;
    for (std::size_t i = 1; i < sets.size(); ++i)
        VexTimeMutableRangesSubtractUnsortedRanges(result, sets[i].ranges);
    return result;
}

VexTimeRangeArray masked(RangesOptions const&, std::vector<TimelineSet> const& sets)
{
    return VexTimeRangesANDMask(sets[0].ranges, sets[1].ranges);
}

/// Reads the sets, draws them as A, B, ..., and the result, where there is an operation, behind
/// "=".
void runRanges(RangesOptions const& options, SetOperation operation)
{
    std::vector<TimelineSet> sets;
    for (std::string const& set : options.sets)
        sets.push_back({std::string(1, static_cast<char>('A' + sets.size() % 26)), readSet(set)});
    if (operation)
        sets.push_back({"=", operation(options, sets)});
    printRanges(options, sets);
}

} // namespace

void addRangesCommands(CLI::App& program)
{
    CLI::App& ranges =
        *program.add_subcommand("ranges", "Add, subtract, mask and draw time ranges");
    ranges.require_subcommand(1);
    ranges.footer(rangesFooter);
    struct Row {
        char const *name, *description;
        SetOperation operation;
        int least, most; ///< sets; -1 where there is no end
    } const rows[] = {
        {"union", "All sets as one, overlapping ranges joined", joined, 1, -1},
        {"subtract", "The pieces of the first set outside the others", subtracted, 2, -1},
        {"mask", "The pieces of the first set inside the second", masked, 2, 2},
        {"show", "Draw the sets as they are", nullptr, 1, -1},
    };
    for (Row const& row : rows) {
        auto options = std::make_shared<RangesOptions>();
        CLI::App& command = *ranges.add_subcommand(row.name, row.description);
        command.add_option("SET", options->sets, "A list of ranges, or a file of them")
            ->required()
            ->expected(row.least, row.most);
        if (row.operation == joined)
            command.add_flag("--apart", options->apart, "Join only ranges of the same name");
        options->timeline = row.operation == nullptr;
        if (row.operation)
            command.add_flag("--timeline", options->timeline, "Draw the sets and the result");
        command.add_option("--svg", options->svg, "Draw them as a picture as well")
            ->type_name("FILE");
        addJsonFlag(command, options->json);
        command.callback([options, operation = row.operation] { runRanges(*options, operation); });
    }

    addExamples(ranges, {"korvane ranges subtract 0..10=interview 3..4 --timeline"});
}
