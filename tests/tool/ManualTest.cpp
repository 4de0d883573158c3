// The manual pages and the completions, held against the tool's own table of commands.
#include "App.h"
#include "tool/Tool.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <algorithm>
#include <fstream>
#include <sstream>

using ::testing::HasSubstr;
using ::testing::IsEmpty;
using ::testing::IsSupersetOf;

namespace {

std::string const share = KORVANE_SHARE;
std::string const bashFile = share + "/bash-completion/completions/korvane";
std::string const zshFile = share + "/zsh/site-functions/_korvane";
std::string const fishFile = share + "/fish/vendor_completions.d/korvane.fish";

std::string contents(std::string const& path)
{
    std::ifstream file(path);
    return {std::istreambuf_iterator<char>(file), {}};
}

bool isInstalled(std::string const& program)
{
    return runShell("command -v " + program).exitCode == 0;
}

/// A command of the table with all its names on the command line.
struct Entry {
    std::string path, page, footer;
    std::vector<std::string> commands, options, positionals;
};

std::vector<std::string> words(std::string const& text, char between = ' ')
{
    std::vector<std::string> result;
    std::istringstream stream(text);
    for (std::string word; std::getline(stream, word, between);)
        if (!word.empty())
            result.push_back(word);
    return result;
}

void gather(CLI::App const& app, std::string const& above, std::vector<Entry>& entries)
{
    Entry entry{above + app.get_name(), "", app.get_footer(), {}, {}, {}};
    std::vector<std::string> const names = words(entry.path);
    entry.page = share + "/man/man1/korvane" + (names.size() > 1 ? "-" + names[1] : "") + ".1";
    for (CLI::Option const* option : app.get_options())
        for (std::string const& name : words(option->get_name(true, true), ','))
            (name[0] == '-' ? entry.options : entry.positionals).push_back(name);
    auto const below = app.get_subcommands([](CLI::App const*) { return true; });
    for (CLI::App const* command : below)
        entry.commands.push_back(command->get_name());
    entries.push_back(entry);
    for (CLI::App const* command : below)
        gather(*command, entry.path + " ", entries);
}

std::vector<Entry> table()
{
    std::vector<Entry> entries;
    gather(*makeApp(), "", entries);
    return entries;
}

/// What a shell offers behind each of these lines, a list a line.
std::vector<std::vector<std::string>> replies(std::string const& shell, std::string const& script,
                                              std::vector<std::string> const& lines)
{
    ScratchFolder const folder;
    std::string input;
    for (std::string const& line : lines)
        input += line + "\n";
    ToolResult const result = runShell(shell + " " + folder.write("script", script) + " < " +
                                       folder.write("lines", input));
    EXPECT_THAT(result.messages, IsEmpty());
    std::vector<std::vector<std::string>> answers;
    std::istringstream stream(result.out);
    for (std::string line; std::getline(stream, line);)
        answers.push_back(words(line));
    EXPECT_EQ(answers.size(), lines.size());
    answers.resize(lines.size());
    return answers;
}

/// Calls the function that `complete` has been told of, with the words as bash cuts them.
std::vector<std::vector<std::string>> bashReplies(std::vector<std::string> const& lines)
{
    return replies("bash --norc", R"bash(
compopt() { COMPREPLY+=("FILES"); }
source )bash" + bashFile + R"bash(
registered=$(complete -p korvane)
function=${registered#*-F }
function=${function%% *}
while IFS= read -r line; do
  read -ra COMP_WORDS <<<"${line//=/ = }"
  [[ $line == *' ' ]] && COMP_WORDS+=('')
  COMP_CWORD=$((${#COMP_WORDS[@]} - 1))
  "$function"
  echo "${COMPREPLY[*]}"
done
)bash",
                   lines);
}

std::vector<std::vector<std::string>> fishReplies(std::vector<std::string> const& lines)
{
    return replies("fish --no-config", "source " + fishFile + R"fish(
while read -l line
    echo (complete -C (string trim -r -c '|' $line) | string split -f 1 \t)
end
)fish",
                   lines);
}

} // namespace

TEST(Manual, EveryCommandAndOptionIsInItsPage)
{
    for (Entry const& entry : table()) {
        std::string page = contents(entry.page);
        // Commands below a family have a section each.
        if (std::size_t const at = page.find(".SS " + entry.path + "\n"); at != page.npos)
            page = page.substr(at, page.find("\n.S", at) - at);
        EXPECT_THAT(page, HasSubstr(entry.path));
        for (std::string const& option : entry.options) {
            std::string name;
            for (char c : option)
                name += c == '-' ? "\\-" : std::string(1, c);
            if (option.rfind("--help", 0) == 0 || option == "-h")
                continue; // told once a page
            EXPECT_THAT(page, HasSubstr("\\fB" + name + "\\fR")) << entry.path;
        }
        for (std::string const& positional : entry.positionals)
            EXPECT_THAT(page, HasSubstr(".TP\n\\fI" + positional + "\\fR\n")) << entry.path;
        EXPECT_THAT(entry.footer, HasSubstr("Exit codes:\n  0  done\n")) << entry.path;
    }
    EXPECT_THAT(contents(share + "/man/man1/korvane-scene.1"),
                HasSubstr(".SH EXIT STATUS\n.TP\n0\ndone.\n.TP\n1\n"));
}

TEST(Manual, EveryCommandAndOptionIsOfferedByTheShells)
{
    std::vector<Entry> const entries = table();
    std::vector<std::string> optionLines, commandLines;
    for (Entry const& entry : entries) {
        optionLines.push_back(entry.path + " -");
        commandLines.push_back(entry.path + " ");
    }
    auto const bashOptions = bashReplies(optionLines), bashCommands = bashReplies(commandLines);
    std::vector<std::vector<std::string>> fishOptions, fishCommands;
    if (isInstalled("fish")) {
        for (std::string& line : commandLines)
            line += "|"; // fish's read takes blanks at the end away
        fishOptions = fishReplies(optionLines), fishCommands = fishReplies(commandLines);
    }
    std::string const zsh = contents(zshFile);
    for (std::size_t i = 0; i < entries.size(); ++i) {
        Entry const& entry = entries[i];
        EXPECT_THAT(bashOptions[i], IsSupersetOf(entry.options)) << entry.path;
        EXPECT_THAT(bashCommands[i], IsSupersetOf(entry.commands)) << entry.path;
        if (!fishOptions.empty()) {
            EXPECT_THAT(fishOptions[i], IsSupersetOf(entry.options)) << entry.path;
            EXPECT_THAT(fishCommands[i], IsSupersetOf(entry.commands)) << entry.path;
        }
        std::string name = "_" + entry.path;
        std::replace(name.begin(), name.end(), ' ', '_');
        std::size_t const at = zsh.find("\n" + name + "() {\n");
        ASSERT_NE(at, zsh.npos) << name;
        std::string const function = zsh.substr(at, zsh.find("\n}\n", at) - at);
        for (std::string const& command : entry.commands)
            EXPECT_THAT(function, HasSubstr(" " + command + ") " + name + "_" + command + " ;;"));
        for (std::string const& option : entry.options)
            EXPECT_TRUE(function.find("'" + option + "[") != function.npos ||
                        function.find("'" + option + "=[") != function.npos ||
                        function.find("'" + option + "+[") != function.npos)
                << entry.path << " " << option;
    }
}

TEST(Manual, TheShellsOfferWhatMayStandNext)
{
    struct Row {
        std::string line;
        std::vector<std::string> bash;
        std::string fish;
    } const rows[] = {
        {"korvane scene sh", {"show"}, "show"},
        {"korvane scene convert --to ", {"text", "binary"}, "binary text"},
        {"korvane scene convert --to b", {"binary"}, "binary"},
        {"korvane scene convert --to=b", {"binary"}, "--to=binary"},
        {"korvane lut convert a b --method te", {"tetrahedral"}, "tetrahedral"},
        {"korvane media set --stereo top-bottom --sph", {"--spherical"}, "--spherical"},
        {"korvane captions show --frame ", {}, ""},
        {"korvane captions show ", {"FILES"}, ""},
        {"korvane media tree --against ", {"FILES"}, ""},
        // Behind a command its name means nothing any more.
        {"korvane time scene --ex", {"--exact"}, "--exact"},
        {"korvane scene show convert --t", {}, ""},
    };
    std::vector<std::string> lines;
    for (Row const& row : rows)
        lines.push_back(row.line);
    auto const inBash = bashReplies(lines);
    for (std::size_t i = 0; i < std::size(rows); ++i)
        EXPECT_EQ(inBash[i], rows[i].bash) << rows[i].line;
    if (!isInstalled("fish"))
        return;
    for (std::string& line : lines)
        line += "|";
    auto const inFish = fishReplies(lines);
    for (std::size_t i = 0; i < std::size(rows); ++i) {
        if (rows[i].bash == std::vector<std::string>{"FILES"})
            continue; // those that lie about
        EXPECT_EQ(inFish[i], words(rows[i].fish)) << rows[i].line;
    }
}

TEST(Manual, TheirOwnReadersFindNoFault)
{
    ScratchFolder const folder;
    std::string const write = std::string("SOURCE_DATE_EPOCH=1700000000 ") + KORVANE_MANUAL + " ";
    // The same table gives the same bytes; a date makes mandoc content.
    EXPECT_EQ(runShell(write + folder.path("one") + " && " + write + folder.path("two") +
                       " && diff -r " + folder.path("one") + " " + folder.path("two"))
                  .out,
              "");
    std::string const pages = " " + folder.path("one") + "/man/man1/*.1";
    struct Row {
        char const* program;
        std::string arguments;
    } const rows[] = {
        {"mandoc", "-Tlint" + pages}, {"groff", "-man -ww -z -Tutf8" + pages},
        {"bash", "-n " + bashFile},   {"zsh", "-n " + zshFile},
        {"fish", "-n " + fishFile},
    };
    for (Row const& row : rows) {
        if (!isInstalled(row.program))
            continue;
        ToolResult const result = runShell(row.program + (" " + row.arguments));
        EXPECT_EQ(result.out + result.messages, "") << row.program;
        EXPECT_EQ(result.exitCode, 0) << row.program;
    }
}

TEST(Manual, ExamplesRunAsTheyStand)
{
    ScratchFolder const folder;
    std::string const source = KORVANE_SOURCE_DIR;
    ASSERT_EQ(runShell("cp " + source + "/examples/data/* " + folder.path("") + " && cp " + source +
                       "/tests/data/media/head-moov.mp4 " + folder.path("movie.mp4"))
                  .exitCode,
              0);
    for (Entry const& entry : table()) {
        if (words(entry.path).size() > 2)
            continue;
        std::size_t const from = entry.footer.find("Examples:\n");
        ASSERT_NE(from, entry.footer.npos) << entry.path;
        std::string const block = entry.footer.substr(from, entry.footer.find("\n\n", from) - from);
        for (std::string const& line : words(block, '\n')) {
            if (line == "Examples:")
                continue;
            ToolResult const result = runShell("korvane() { \"$KORVANE\" \"$@\"; }; cd " +
                                               folder.path("") + " && " + line);
            EXPECT_EQ(result.exitCode, 0) << line << "\n" << result.messages;
        }
    }
}
