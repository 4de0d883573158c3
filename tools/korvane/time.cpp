#include "TimeExpression.h"
#include "TimeForms.h"
#include "ToolError.h"
#include "commands.h"

#include <korvane/time/KVTime.h>

namespace {

char const* const timeFooter = R"(EXPRESSION is one of
  a sum, product or quotient of times    "1001/30000 * 30000", "(1/24 + 0.5) / 3"
  floor, ceiling or round TIME           to the grid of --frame
  sample TIME                            the number of the --frame that it lies in
  remap TIME OLD NEW                     from frames of OLD to frames of NEW seconds
  sum TIME                               added up --times times
  halve TIME, reduce TIME                half of it, and lowest terms
  alias TIME                             the broadcast form of a frame duration
TIME is an expression itself. A fraction without blanks is one number.

Prints the result as value/timescale, in lowest terms and in seconds, and whether it is exact or
has been rounded. Ends with code 1 when the result is invalid.)";

struct TimeOptions {
    std::vector<std::string> words;
    std::string frame;
    std::int64_t times = 1;
    bool exact = false, json = false;
};

CMTime evaluate(std::string const& text)
{
    try {
        return evaluateTime(text);
    } catch (TimeSyntaxError const& error) {
        throw ToolError(ExitCode::Usage, error.what());
    }
}

CMTime frameOf(TimeOptions const& options)
{
    if (options.frame.empty())
        throw ToolError(ExitCode::Usage, options.words[0] + " needs --frame");
    CMTime const frame = evaluate(options.frame);
    if (!CMTimeIsNumeric(frame) || frame.value <= 0)
        throw ToolError(ExitCode::Usage,
                        "--frame: \"" + options.frame + "\" is not a length above zero");
    return frame;
}

/// The words from one on as one expression.
CMTime expression(TimeOptions const& options, std::size_t first)
{
    std::string text;
    for (std::size_t i = first; i < options.words.size(); ++i)
        text += (i > first ? " " : "") + options.words[i];
    return evaluate(text);
}

/// All words but the first as one expression.
CMTime argument(TimeOptions const& options)
{
    return expression(options, 1);
}

CMTime remap(TimeOptions const& options)
{
    if (options.words.size() != 4)
        throw ToolError(ExitCode::Usage, "remap needs TIME OLD NEW");
    return KV_CMTimeRemap(evaluate(options.words[1]), evaluate(options.words[2]),
                          evaluate(options.words[3]), options.exact);
}

CMTime sumUp(TimeOptions const& options)
{
    CMTime const step = argument(options);
    CMTime total = kCMTimeZero;
    for (std::int64_t i = 0; i < options.times; ++i)
        total = KV_CMTimeSaferAdd(total, step);
    return total;
}

CMTime reduced(CMTime time)
{
    SimpCMTime(&time);
    return time;
}

CMTime calculate(TimeOptions const& options)
{
    std::string const& verb = options.words[0];
    if (verb == "floor")
        return KV_CMTimeFloorToSampleDuration(argument(options), frameOf(options));
    if (verb == "ceiling")
        return KV_CMTimeCeilingToSampleDuration(argument(options), frameOf(options));
    if (verb == "round")
        return KV_CMTimeRoundToSampleDuration(argument(options), frameOf(options));
    if (verb == "remap")
        return remap(options);
    if (verb == "sum")
        return sumUp(options);
    if (verb == "halve")
        return KV_CMTimeHalve(argument(options));
    if (verb == "reduce")
        return reduced(argument(options));
    if (verb == "alias")
        return KV_CMTimeGetPreferredSampleDurationAlias(argument(options));
    return expression(options, 0);
}

void printSample(TimeOptions const& options)
{
    CMTime const time = argument(options);
    CMTime const frame = frameOf(options);
    if (!CMTimeIsNumeric(time))
        throw ToolError(ExitCode::Failed, timeFraction(time) + " lies in no frame");
    long long const sample = KV_CMTimeGetSampleNumber(time, frame);
    if (options.json)
        printJson({{"sample", sample}});
    else
        printOutput(std::to_string(sample) + "\n");
}

std::string lineOf(CMTime const& time)
{
    std::string line = timeFraction(time);
    if (CMTimeIsNumeric(time)) {
        if (CMTime const lowest = reduced(time); lowest.timescale != time.timescale)
            line += " = " + timeFraction(lowest);
        CMTime plain = time;
        plain.flags = kCMTimeFlags_Valid;
        line += " = " + KV_CMTimeToString(plain).toUTF8() + " s";
        line += CMTimeIsRounded(time) ? ", rounded" : ", exact";
    }
    return line + "\n";
}

void runTime(TimeOptions const& options)
{
    if (options.words[0] == "sample")
        return printSample(options);
    CMTime const result = calculate(options);
    if (options.json) {
        Json document = timeJson(result);
        if (CMTimeIsNumeric(result))
            document["reduced"] = timeFraction(reduced(result));
        printJson(document);
    } else {
        printOutput(lineOf(result));
    }
    if (!CMTimeIsValid(result))
        throw ToolError(ExitCode::Failed, "");
}

} // namespace

void addTimeCommands(CLI::App& program)
{
    auto options = std::make_shared<TimeOptions>();
    CLI::App& time = *program.add_subcommand("time", "Calculate with exact times");
    time.add_option("EXPRESSION", options->words, "What to calculate")->required();
    time.add_option("--frame", options->frame, "The length of a frame in seconds")
        ->type_name("TIME");
    time.add_option("--times", options->times, "How often a sum takes its time")
        ->type_name("N")
        ->check(CLI::Range(std::int64_t{0}, std::int64_t{1'000'000'000}));
    time.add_flag("--exact", options->exact, "Remap the time itself and not its frame");
    addJsonFlag(time, options->json);
    time.footer(timeFooter);
    time.callback([options] { runTime(*options); });

    addExamples(time, {"korvane time \"1001/30000 * 30000\"",
                       "korvane time floor 3.52 --frame 1001/24000"});
}
