// korvane report: what files hold, as pictures on one page.

#include "AtomicOutput.h"
#include "FileBytes.h"
#include "Input.h"
#include "LutFile.h"
#include "ToolError.h"
#include "commands.h"
#include "report/Page.h"
#include "report/Sections.h"

#include <CLI/CLI.hpp>

#include <algorithm>
#include <filesystem>
#include <memory>
#include <optional>
#include <string_view>

namespace {

using std::string_view;

enum class FileKind { Scene, Captions, Lut, Movie, Matrix, Unknown };

char const* nameOf(FileKind kind)
{
    static char const* const names[] = {"Scene document", "SubRip captions", "Colour lookup table",
                                        "QuickTime or MP4 movie", "Transform matrix"};
    return names[static_cast<int>(kind)];
}

// --- Which kind a file is ---

bool beginsAtom(string_view start)
{
    static constexpr string_view types[] = {"ftyp", "moov", "mdat", "free", "skip", "wide",
                                            "pnot", "moof", "styp", "sidx", "uuid", "meta"};
    return start.size() >= 8 &&
           std::ranges::find(types, start.substr(4, 4)) != std::ranges::end(types);
}

/// Numbers and what stands between them, one digit at least, and nothing else.
bool isNumbers(string_view text)
{
    return text.find_first_not_of(" \t\r\n,;()[]+-.0123456789eE") == text.npos &&
           text.find_first_of("0123456789") != text.npos;
}

/// XML that is a scene, or at least begins as one could.
bool beginsScene(string_view start)
{
    if (start.starts_with("VZBML"))
        return true;
    if (start.starts_with("\xEF\xBB\xBF"))
        start.remove_prefix(3);
    start.remove_prefix(std::min(start.find_first_not_of(" \t\r\n"), start.size()));
    return start.starts_with("<?xml") || start.starts_with("<vzml") ||
           start.starts_with("<!DOCTYPE") || start.starts_with("<!--");
}

FileKind kindByContent(ReopenableFile const& file, string_view start)
{
    if (beginsScene(start))
        return FileKind::Scene;
    if (beginsAtom(start))
        return FileKind::Movie;
    if (start.find("-->") != start.npos)
        return FileKind::Captions;
    if (isNumbers(start))
        return FileKind::Matrix;
    return looksLikeLut(file) ? FileKind::Lut : FileKind::Unknown;
}

FileKind kindBySuffix(std::string const& path)
{
    struct Row {
        string_view suffix;
        FileKind kind;
    };
    static constexpr Row rows[] = {{".vzml", FileKind::Scene},   {".vzbml", FileKind::Scene},
                                   {".srt", FileKind::Captions}, {".cube", FileKind::Lut},
                                   {".mga", FileKind::Lut},      {".mov", FileKind::Movie},
                                   {".mp4", FileKind::Movie},    {".m4v", FileKind::Movie},
                                   {".m4a", FileKind::Movie},    {".matrix", FileKind::Matrix}};
    std::string suffix = std::filesystem::path(path).extension().string();
    for (char& c : suffix)
        c = c >= 'A' && c <= 'Z' ? static_cast<char>(c - 'A' + 'a') : c;
    auto const* const row = std::ranges::find(rows, suffix, &Row::suffix);
    return row == std::ranges::end(rows) ? FileKind::Unknown : row->kind;
}

FileKind kindOf(ReopenableFile const& file)
{
    char bytes[16384];
    string_view const start(bytes, FileBytes(file.path()).read(0, bytes, sizeof bytes));
    if (start.empty())
        throw badInput(file.shown(), "the file is empty");
    FileKind kind = kindByContent(file, start);
    if (kind == FileKind::Unknown)
        kind = kindBySuffix(file.shown());
    if (kind == FileKind::Unknown)
        throw badInput(file.shown(), "is neither a scene, captions, a LUT, a movie nor a matrix");
    return kind;
}

// --- The page ---

struct Options {
    std::vector<std::string> files;
    std::string output;
    std::string before;
};

/// The same failure with the name that a person gave to the file.
ToolError renamed(ToolError const& error, ReopenableFile const& file)
{
    std::string message = error.what();
    if (message.starts_with(file.path() + ":"))
        message.replace(0, file.path().size(), inputName(file.shown()));
    return {error.code(), message};
}

void checkPaths(Options const& options)
{
    std::vector<std::string> inputs = options.files;
    inputs.push_back(options.before);
    if (std::ranges::count(inputs, "-") > 1)
        throw ToolError(ExitCode::Usage, "standard input can be read once only");
    for (std::string const& input : inputs)
        if (FileBytes::isSameFile(input, options.output))
            throw ToolError(ExitCode::Usage,
                            options.output + ": is an input; write to another file");
}

std::string htmlOf(ReopenableFile const& file, FileKind kind, std::string const& id,
                   std::string const& before)
{
    switch (kind) {
    case FileKind::Scene:
        return sceneHtml(file, id);
    case FileKind::Captions:
        return captionsHtml(file, id);
    case FileKind::Lut:
        return lutHtml(file, id);
    case FileKind::Movie:
        return movieHtml(file, id, before);
    default:
        return matrixHtml(file, id);
    }
}

void report(Options const& options)
{
    checkPaths(options);
    std::optional<ReopenableFile> before;
    if (!options.before.empty())
        before.emplace(options.before);
    std::vector<ReportSection> sections;
    bool hasMovie = false;
    for (std::string const& path : options.files) {
        ReopenableFile const file(path);
        try {
            FileKind const kind = kindOf(file);
            hasMovie |= kind == FileKind::Movie;
            std::string const name = std::filesystem::path(inputName(path)).filename().string();
            std::string const id = "f" + std::to_string(sections.size() + 1);
            std::string const original = before ? before->path() : "";
            sections.push_back({name, nameOf(kind), htmlOf(file, kind, id, original)});
        } catch (ToolError const& error) {
            ToolError const own = renamed(error, file);
            throw before ? renamed(own, *before) : own;
        }
    }
    if (before && !hasMovie)
        throw ToolError(ExitCode::Usage, "--before is for movies, and none of the files is one");
    AtomicOutput output(options.output);
    output.write(reportPage(sections));
    output.commit();
}

} // namespace

void addReportCommands(CLI::App& program)
{
    auto const options = std::make_shared<Options>();
    CLI::App& command =
        *program.add_subcommand("report", "Show files of all kinds as pictures on one HTML page");
    command.add_option("FILE", options->files, "Scenes, captions, LUTs, movies and matrices, or -")
        ->required();
    command.add_option("-o,--output", options->output, "The page to write, or -")
        ->required()
        ->type_name("FILE");
    command
        .add_option("--before", options->before,
                    "Mark in every movie among the files what is not as in this one")
        ->type_name("FILE");
    command.footer("What a file is, its content tells, and its suffix only where that does not.\n"
                   "Of very large files the page shows the whole in a coarser picture, and the\n"
                   "first rows of its tables, and tells how many more there are.");
    command.callback([options] { report(*options); });

    addExamples(command,
                {"korvane report showreel.vzml lighthouse.srt warm-evening.cube camera.txt "
                 "-o report.html",
                 "korvane report sphere.mp4 --before movie.mp4 -o changes.html"});
}
