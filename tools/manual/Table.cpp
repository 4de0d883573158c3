#include "Table.h"

#include <CLI/CLI.hpp>

#include <algorithm>
#include <sstream>

namespace manual {
namespace {

/// The pieces of a text between the empty lines.
std::vector<std::string> paragraphs(std::string const& text)
{
    std::vector<std::string> result(1);
    std::istringstream lines(text);
    for (std::string line; std::getline(lines, line);) {
        if (line.empty() && !result.back().empty())
            result.emplace_back();
        else if (!line.empty())
            result.back() += (result.back().empty() ? "" : "\n") + line;
    }
    if (result.back().empty())
        result.pop_back();
    return result;
}

/// The lines behind the first one of "Examples:", without their indent.
std::vector<std::string> listed(std::string const& paragraph)
{
    std::vector<std::string> result;
    std::istringstream lines(paragraph);
    std::string line;
    std::getline(lines, line);
    while (std::getline(lines, line))
        result.push_back(line.substr(std::min(line.size(), line.find_first_not_of(' '))));
    return result;
}

/// "text,binary" and "cube->2,mga->1" as what one may write.
std::vector<std::string> listedValues(std::string const& list)
{
    std::vector<std::string> result;
    std::istringstream items(list);
    for (std::string item; std::getline(items, item, ',');)
        result.push_back(item.substr(0, item.find("->")));
    return result;
}

/// Takes "TEXT:{text,binary}" and "FLOAT:FLOAT in [-180 - 180]" apart: the type and what the
/// validators say of it.
void readType(std::string const& type, Argument& argument)
{
    std::size_t const colon = type.find(':');
    argument.placeholder = type.substr(0, colon);
    if (colon == type.npos)
        return;
    std::string const said = type.substr(colon + 1);
    std::size_t const open = said.find('{');
    std::size_t const close = said.find('}');
    if (open != said.npos && close != said.npos) {
        argument.values = listedValues(said.substr(open + 1, close - open - 1));
        return;
    }
    std::size_t const from = said.find('[');
    std::size_t const dash = said.find(" - ");
    if (from != said.npos && dash != said.npos && said.back() == ']')
        argument.range = said.substr(from + 1, dash - from - 1) + " to " +
                         said.substr(dash + 3, said.size() - dash - 4);
    else if (said == "NONNEGATIVE")
        argument.range = "0 or more";
    else if (said != "NUMBER")
        argument.range = said;
}

Argument argumentOf(CLI::Option const& option)
{
    Argument argument;
    if (option.get_positional()) {
        argument.names = {option.get_name(true)};
    } else {
        for (std::string const& name : option.get_snames())
            argument.names.push_back("-" + name);
        for (std::string const& name : option.get_lnames())
            argument.names.push_back("--" + name);
    }
    int const most = option.get_items_expected_max();
    if (most > 0)
        readType(option.get_type_name(), argument);
    // Where a name alone is said, files are what most arguments are.
    argument.isFile =
        option.get_positional() ? argument.values.empty() : argument.placeholder == "FILE";
    if (option.get_positional())
        argument.placeholder = argument.names.front();
    argument.most = most >= CLI::detail::expected_max_vector_size ? -1 : most;
    argument.isRequired = option.get_required();
    argument.fallback = option.get_default_str();
    argument.description = option.get_description();
    return argument;
}

Command commandOf(CLI::App const& app, std::string const& above, std::string const& inherited)
{
    Command command;
    command.name = app.get_name();
    command.path = above.empty() ? command.name : above + " " + command.name;
    command.description = app.get_description();
    std::vector<std::string> const known = paragraphs(inherited);
    for (std::string const& paragraph : paragraphs(app.get_footer())) {
        if (paragraph.rfind("Examples:\n", 0) == 0)
            command.examples = listed(paragraph);
        else if (std::find(known.begin(), known.end(), paragraph) == known.end())
            command.notes.push_back(paragraph);
    }
    for (CLI::Option const* option : app.get_options())
        (option->get_positional() ? command.positionals : command.options)
            .push_back(argumentOf(*option));
    for (CLI::App const* below : app.get_subcommands([](CLI::App const*) { return true; }))
        command.commands.push_back(
            commandOf(*below, command.path, inherited + "\n\n" + app.get_footer()));
    return command;
}

void gather(Command const& command, std::vector<Command const*>& result)
{
    result.push_back(&command);
    for (Command const& below : command.commands)
        gather(below, result);
}

} // namespace

Table tableOf(CLI::App const& program)
{
    Table table{commandOf(program, "", ""), program.version(), {}};
    // The version alone: the binary interface's number is no part of a page's foot.
    table.version = table.version.substr(0, table.version.find(" ("));
    std::vector<std::string> notes;
    for (std::string const& note : table.program.notes) {
        if (note.rfind("Exit codes:\n", 0) != 0) {
            notes.push_back(note);
            continue;
        }
        for (std::string const& line : listed(note)) {
            std::size_t const end = line.find(' ');
            table.exitStatuses.push_back(
                {line.substr(0, end), line.substr(line.find_first_not_of(' ', end))});
        }
    }
    table.program.notes = notes;
    return table;
}

std::vector<Command const*> allCommands(Command const& command)
{
    std::vector<Command const*> result;
    gather(command, result);
    return result;
}

std::string join(std::vector<std::string> const& words, char const* between)
{
    std::string result;
    for (std::string const& word : words)
        result += (result.empty() ? "" : between) + word;
    return result;
}

} // namespace manual
