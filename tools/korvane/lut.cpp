#include "Input.h"
#include "Json.h"
#include "LutFile.h"
#include "LutLookup.h"
#include "LutPlot.h"
#include "Numbers.h"
#include "ToolError.h"
#include "commands.h"

#include <algorithm>
#include <cctype>
#include <charconv>
#include <cmath>
#include <filesystem>
#include <map>
#include <memory>
#include <sstream>

namespace {

/// False for what is not one finite number and nothing else.
bool parse(std::string_view word, float& value)
{
    word.remove_prefix(word.starts_with('+') && !word.starts_with("+-") ? 1 : 0);
    auto const [end, error] = std::from_chars(word.data(), word.data() + word.size(), value);
    return error == std::errc() && end == word.data() + word.size() && std::isfinite(value);
}

// --- info ---

Json describe(cc::lut_t const& lut)
{
    Json values = Json::object();
    auto const channels = channelNames(lut);
    for (std::size_t i = 0; i < channels.size(); ++i) {
        auto const [least, greatest] = rangeOf(lut, i);
        values[channels[i]] = {least, greatest};
    }
    return {{"format", lut.format() == cc::lut_t::kMGA ? "mga" : "cube"},
            {"kind", lut.kind == cc::lut_t::k3D ? "3D" : "1D"},
            {"size", lut.size},
            {"title", lut.title},
            {"domain", {lut.domainMin, lut.domainMax}},
            {"values", values}};
}

void info(std::string const& path, bool json)
{
    std::vector<cc::lut_t> const luts = readLuts(ReopenableFile(path));
    Json tables = Json::array();
    std::string text;
    for (std::size_t index = 0; index < luts.size(); ++index) {
        cc::lut_t const& lut = luts[index];
        tables.push_back(describe(lut));
        if (luts.size() > 1)
            text += (index ? "\ntable   " : "table   ") + std::to_string(index) + "\n";
        text += std::string("format  ") + formatName(lut.format()) + "\n";
        if (!lut.title.empty())
            text += "title   " + lut.title + "\n";
        text += "size    " + sizeText(lut) + "\n";
        text += "domain  " + shortest(lut.domainMin) + " to " + shortest(lut.domainMax) + "\n";
        auto const channels = channelNames(lut);
        for (std::size_t i = 0; i < channels.size(); ++i) {
            auto const [least, greatest] = rangeOf(lut, i);
            text += "values  " + shortest(least) + " to " + shortest(greatest) + " in " +
                    channels[i] + "\n";
        }
    }
    if (json)
        printJson(tables);
    else
        printOutput(text);
}

// --- convert ---

/// The format that a file's extension names.
unsigned int formatFor(std::string const& path)
{
    std::string extension = std::filesystem::path(path).extension();
    std::transform(extension.begin(), extension.end(), extension.begin(),
                   [](unsigned char c) { return static_cast<char>(std::tolower(c)); });
    if (extension == ".cube")
        return cc::lut_t::kCUBE;
    if (extension == ".mga")
        return cc::lut_t::kMGA;
    throw ToolError(ExitCode::Usage,
                    path + ": give a name that ends in .cube or .mga, or --format");
}

void writeLut(cc::lut_t const& lut, std::string const& path, unsigned int format)
{
    AtomicOutput output(path);
    std::string const stem = path == "-" ? "" : std::filesystem::path(path).stem();
    int error = 0;
    if (format == cc::lut_t::kMGA)
        lut.writeMGA(output.descriptor(), stem.c_str(), &error);
    else
        lut.writeCUBE(output.descriptor(), stem.c_str(), &error);
    if (error != 0)
        output.fail(error);
    output.commit();
}

struct ConvertOptions {
    std::string in;
    std::string out;
    unsigned int format = 0;
    unsigned long index = 0;
    int size = 0;
    Interpolation interpolation = Interpolation::Tetrahedral;
};

void convert(ConvertOptions const& options)
{
    unsigned int const format = options.format ? options.format : formatFor(options.out);
    cc::lut_t lut = readLut(ReopenableFile(options.in), options.index);
    // Neither format has a form for curves: one becomes a cube.
    int const size = options.size ? options.size : lut.kind == cc::lut_t::k1D ? 33 : lut.size;
    if (lut.kind == cc::lut_t::k1D || size != lut.size) {
        cc::lut_t cube;
        cube.makeCube(size, lut.domainMin, lut.domainMax);
        cube.title = lut.title;
        cube.process(*makeLookup(lut, options.interpolation));
        lut = std::move(cube);
    }
    if (format == cc::lut_t::kMGA && (lut.domainMin != 0.0f || lut.domainMax != 1.0f))
        printMessage(options.out + ": a .mga file cannot tell the domain " +
                     shortest(lut.domainMin) + " to " + shortest(lut.domainMax) +
                     "; its readers will take it for 0 to 1");
    writeLut(lut, options.out, format);
}

// --- apply ---

std::string applied(cc::lut_t::processor_t const& lookup, cc::rgb_t const& colour)
{
    cc::rgb_t const result = lookup.process(colour);
    return shortest(result[0]) + " " + shortest(result[1]) + " " + shortest(result[2]) + "\n";
}

void applyToArguments(cc::lut_t::processor_t const& lookup, std::vector<std::string> const& words)
{
    std::string text;
    cc::rgb_t colour{};
    for (std::size_t i = 0; i < words.size(); ++i) {
        if (!parse(words[i], colour[i % 3]))
            throw ToolError(ExitCode::Usage, "\"" + words[i] + "\" is not a number");
        if (i % 3 == 2)
            text += applied(lookup, colour);
    }
    printOutput(text);
}

void applyToInput(cc::lut_t::processor_t const& lookup)
{
    std::istringstream lines(readFile("-"));
    AtomicOutput output("-");
    unsigned long number = 0;
    for (std::string line; std::getline(lines, line);) {
        ++number;
        std::istringstream words(line);
        std::vector<std::string> found;
        for (std::string word; words >> word;)
            found.push_back(word);
        if (found.empty())
            continue;
        cc::rgb_t colour{};
        if (found.size() != 3)
            throw badInput("-", number,
                           "a colour is three numbers, here are " + std::to_string(found.size()));
        for (std::size_t i = 0; i < 3; ++i)
            if (!parse(found[i], colour[i]))
                throw badInput("-", number, "\"" + found[i].substr(0, 40) + "\" is not a number");
        output.write(applied(lookup, colour));
    }
    output.commit();
}

void apply(std::string const& path, unsigned long index, Interpolation interpolation,
           std::vector<std::string> const& words)
{
    if (words.size() % 3 != 0)
        throw ToolError(ExitCode::Usage, "a colour is three numbers: red, green and blue");
    if (words.empty() && path == "-")
        throw ToolError(ExitCode::Usage, "the table and the colours cannot both come from "
                                         "standard input");
    cc::lut_t const lut = readLut(ReopenableFile(path), index);
    auto const lookup = makeLookup(lut, interpolation);
    if (words.empty())
        applyToInput(*lookup);
    else
        applyToArguments(*lookup, words);
}

// --- plot ---

void plot(std::string const& path, std::string const& out, unsigned long index, float slice)
{
    cc::lut_t const lut = readLut(ReopenableFile(path), index);
    std::string const svg = plotLut(lut, *makeLookup(lut, Interpolation::Tetrahedral), slice);
    AtomicOutput output(out);
    output.write(svg);
    output.commit();
}

// --- The command line ---

void addIndex(CLI::App& command, unsigned long& index)
{
    command.add_option("--index", index, "Which table of the file, 0 for the first")
        ->check(CLI::NonNegativeNumber)
        ->type_name("N");
}

void addMethod(CLI::App& command, Interpolation& interpolation)
{
    static std::map<std::string, Interpolation> const methods = {
        {"tetrahedral", Interpolation::Tetrahedral}, {"trilinear", Interpolation::Trilinear}};
    command.add_option("--method", interpolation, "How to look up between points")
        ->transform(CLI::CheckedTransformer(methods, CLI::ignore_case))
        ->type_name("tetrahedral|trilinear");
}

void addInfo(CLI::App& family)
{
    struct Options {
        std::string path;
        bool json = false;
    };
    auto const options = std::make_shared<Options>();
    auto& command = *family.add_subcommand(
        "info", "Tell kind, size, domain, title and range of values of a file's tables");
    command.add_option("FILE", options->path, "A .cube or .mga file")->required();
    addJsonFlag(command, options->json);
    command.callback([options] { info(options->path, options->json); });
}

void addConvert(CLI::App& family)
{
    auto const options = std::make_shared<ConvertOptions>();
    auto& command = *family.add_subcommand("convert", "Write a table in the other format or size");
    command.add_option("IN", options->in, "A .cube or .mga file")->required();
    command.add_option("OUT", options->out, "The file to write; its extension chooses the format")
        ->required();
    static std::map<std::string, unsigned int> const formats = {{"cube", cc::lut_t::kCUBE},
                                                                {"mga", cc::lut_t::kMGA}};
    command.add_option("--format", options->format, "The format, whatever OUT is called")
        ->transform(CLI::CheckedTransformer(formats, CLI::ignore_case))
        ->type_name("cube|mga");
    command
        .add_option("--size", options->size,
                    "Points along an edge of the cube; a curve becomes a cube of 33")
        ->check(CLI::Range(1, 256))
        ->type_name("N");
    addIndex(command, options->index);
    addMethod(command, options->interpolation);
    command.callback([options] { convert(*options); });
}

void addApply(CLI::App& family)
{
    struct Options {
        std::string path;
        std::vector<std::string> words;
        unsigned long index = 0;
        Interpolation interpolation = Interpolation::Tetrahedral;
    };
    auto const options = std::make_shared<Options>();
    auto& command = *family.add_subcommand("apply", "Look colours up in a table");
    command.add_option("FILE", options->path, "A .cube or .mga file")->required();
    command.add_option(
        "COLOUR", options->words,
        "Red, green and blue of each colour; left out, a colour a line of standard input");
    addIndex(command, options->index);
    addMethod(command, options->interpolation);
    command.callback([options] {
        apply(options->path, options->index, options->interpolation, options->words);
    });
}

void addPlot(CLI::App& family)
{
    struct Options {
        std::string path;
        std::string out;
        unsigned long index = 0;
        float slice = 0.5f;
    };
    auto const options = std::make_shared<Options>();
    auto& command = *family.add_subcommand("plot", "Draw a table's curves and a slice of its cube");
    command.add_option("FILE", options->path, "A .cube or .mga file")->required();
    command.add_option("OUT", options->out, "The SVG file to write")->required();
    command.add_option("--slice", options->slice, "Where blue is cut, 0 to 1 over the domain")
        ->check(CLI::Range(0.0f, 1.0f))
        ->type_name("X");
    addIndex(command, options->index);
    command.callback(
        [options] { plot(options->path, options->out, options->index, options->slice); });
}

} // namespace

void addLutCommands(CLI::App& program)
{
    auto& family =
        *program.add_subcommand("lut", "Show, convert, apply and draw colour lookup tables");
    family.require_subcommand(1);
    addInfo(family);
    addConvert(family);
    addApply(family);
    addPlot(family);

    addExamples(family, {"korvane lut info warm-evening.cube",
                         "korvane lut convert warm-evening.cube warm-evening.mga --size 33",
                         "korvane lut apply warm-evening.cube 0.5 0.4 0.3"});
}
