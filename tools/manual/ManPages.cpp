// Manual pages in the man macros (groff_man(7)).
#include "Writers.h"

#include <algorithm>
#include <sstream>

namespace manual {
namespace {

/// As text of a line: no escapes of its own, hyphens that can be copied as such.
std::string escaped(std::string const& text)
{
    std::string result;
    for (char c : text) {
        if (c == '\\')
            result += "\\e";
        else if (c == '-')
            result += "\\-";
        else
            result += c;
    }
    return result;
}

/// Lines of text; none may be taken for a request, none is longer than a screen is wide.
std::string textLines(std::string const& text)
{
    std::string result, line;
    std::istringstream words(text);
    auto const flush = [&] {
        if (line.empty())
            return;
        result += (line[0] == '.' || line[0] == '\'' ? "\\&" : "") + line + "\n";
        line.clear();
    };
    for (std::string word; words >> word;) {
        word = escaped(word);
        if (line.size() + word.size() > 75)
            flush();
        line += (line.empty() ? "" : " ") + word;
    }
    flush();
    return result;
}

/// Lines as they stand.
std::string literalLines(std::string const& text)
{
    std::string result = ".nf\n";
    std::istringstream lines(text);
    for (std::string line; std::getline(lines, line);)
        result += (line[0] == '.' || line[0] == '\'' ? "\\&" : "") + escaped(line) + "\n";
    return result + ".fi\n";
}

bool isFlag(Argument const& argument)
{
    return argument.placeholder.empty();
}

std::string synopsisOf(Command const& command)
{
    std::string text = "\\fB" + escaped(command.path) + "\\fR";
    if (!command.options.empty())
        text += " [\\fIOPTIONS\\fR]";
    if (!command.commands.empty())
        text += " \\fICOMMAND\\fR";
    for (Argument const& argument : command.positionals) {
        std::string const name =
            "\\fI" + argument.names[0] + "\\fR" + (argument.most != 1 ? "\\&..." : "");
        text += argument.isRequired ? " " + name : " [" + name + "]";
    }
    return text + "\n";
}

std::string itemOf(Argument const& argument, bool isPositional)
{
    std::string item = ".TP\n";
    if (isPositional) {
        item += "\\fI" + argument.names[0] + "\\fR\n";
    } else {
        std::string names;
        for (std::string const& name : argument.names)
            names += (names.empty() ? "\\fB" : ", \\fB") + escaped(name) + "\\fR";
        item += names;
        std::string const value =
            argument.values.empty() ? argument.placeholder : join(argument.values, "|");
        for (int i = 0; !isFlag(argument) && i < std::max(1, argument.most); ++i)
            item += " \\fI" + escaped(value) + "\\fR";
        item += "\n";
    }
    item += textLines(argument.description + ".");
    std::string more;
    if (isPositional && !argument.values.empty())
        more += "One of " + join(argument.values, ", ") + ". ";
    if (!argument.range.empty() && argument.description.find(argument.range) == std::string::npos)
        more += "Range: " + argument.range + ". ";
    if (!argument.fallback.empty())
        more += "Default: " + argument.fallback + ".";
    if (argument.isRequired && !isPositional)
        more += "Required.";
    return item + textLines(more);
}

/// Help is the same everywhere and told once a page.
bool isHelp(Argument const& argument)
{
    return argument.names.back() == "--help" || argument.names.back() == "--help-all";
}

std::string itemsOf(Command const& command, bool withHelp)
{
    std::string items;
    for (Argument const& argument : command.positionals)
        items += itemOf(argument, true);
    for (Argument const& argument : command.options)
        if (withHelp || !isHelp(argument))
            items += itemOf(argument, false);
    return items;
}

std::string heading(std::string name, std::string const& table, std::string const& date)
{
    std::transform(name.begin(), name.end(), name.begin(),
                   [](unsigned char c) { return static_cast<char>(std::toupper(c)); });
    return ".\\\" Made from the tool's own table of commands.\n.TH " + name + " 1 \"" + date +
           "\" \"" + table + "\" \"Korvane\"\n";
}

std::string notesOf(Command const& command)
{
    std::string text;
    for (std::string const& note : command.notes)
        text += ".PP\n" + literalLines(note);
    return text;
}

/// What holds for every command: exit status, streams.
std::string commonSections(Table const& table)
{
    std::string text = ".SH EXIT STATUS\n";
    for (ExitStatus const& status : table.exitStatuses)
        text += ".TP\n" + status.code + "\n" + textLines(status.meaning + ".");
    text += ".SH FILES\n";
    for (std::string const& note : table.program.notes)
        text += textLines(note);
    return text;
}

std::string examplesOf(Command const& command)
{
    if (command.examples.empty())
        return "";
    return ".SH EXAMPLES\n" + literalLines(join(command.examples, "\n"));
}

std::string pageName(Command const& family)
{
    std::string name = family.path;
    std::replace(name.begin(), name.end(), ' ', '-');
    return name;
}

/// The pages of the program and of all families but this one.
std::string seeAlso(Table const& table, Command const& page)
{
    std::vector<std::string> names;
    if (&page != &table.program)
        names.push_back(table.program.name);
    for (Command const& family : table.program.commands)
        if (&family != &page)
            names.push_back(pageName(family));
    std::string text = ".SH SEE ALSO\n";
    for (std::string const& name : names)
        text += ".BR " + escaped(name) + " (1)" + (name == names.back() ? "\n" : ",\n");
    return text;
}

} // namespace

std::string programPage(Table const& table, std::string const& date)
{
    Command const& program = table.program;
    std::string page = heading(program.name, table.version, date);
    page += ".SH NAME\n" + program.name + " \\- " + escaped(program.description) + "\n";
    page += ".SH SYNOPSIS\n" + synopsisOf(program);
    page += ".SH DESCRIPTION\nEach family of commands has a page of its own.\n";
    for (Command const& family : program.commands)
        page += ".TP\n.BR " + escaped(pageName(family)) + " (1)\n" +
                textLines(family.description + ".");
    page += ".SH OPTIONS\n" + itemsOf(program, true);
    return page + examplesOf(program) + commonSections(table) + seeAlso(table, program);
}

std::string familyPage(Table const& table, Command const& family, std::string const& date)
{
    std::vector<Command const*> const commands = allCommands(family);
    std::string page = heading(pageName(family), table.version, date);
    page += ".SH NAME\n" + pageName(family) + " \\- " + escaped(family.description) + "\n";
    page += ".SH SYNOPSIS\n";
    for (Command const* command : commands)
        if (command->commands.empty())
            page += (command == commands[0] || command == commands[1] ? "" : ".br\n") +
                    synopsisOf(*command);
    page += ".SH DESCRIPTION\n" + textLines(family.description + ".") + notesOf(family);
    if (!family.commands.empty()) {
        page += ".SH COMMANDS\n";
        for (std::size_t i = 1; i < commands.size(); ++i)
            page += ".SS " + escaped(commands[i]->path) + "\n" +
                    textLines(commands[i]->description + ".") + notesOf(*commands[i]) +
                    itemsOf(*commands[i], false);
    }
    page += ".SH OPTIONS\n" + itemsOf(family, true);
    return page + examplesOf(family) + commonSections(table) + seeAlso(table, family);
}

} // namespace manual
