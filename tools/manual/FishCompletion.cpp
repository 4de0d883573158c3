// fish: one line for each thing that may be offered, with the command at which it may.
#include "Writers.h"

namespace manual {
namespace {

std::string quoted(std::string const& text)
{
    std::string result = "'";
    for (char c : text) {
        if (c == '\'' || c == '\\')
            result += '\\';
        result += c;
    }
    return result + "'";
}

char const* const head =
    R"fish(# fish completion for korvane, made from the tool's own table of commands.

# Whether the words before the cursor name this command and none below it.
function __korvane_at
    set -l words (commandline -opc)
    set -l command korvane
    for word in $words[2..]
        if contains -- "$command $word" $__korvane_commands
            set command "$command $word"
        end
    end
    test "$command" = "$argv[1]"
end

complete -c korvane -f
)fish";

std::string optionLine(std::string const& start, Argument const& option)
{
    std::string line = start;
    for (std::string const& name : option.names)
        line += name.rfind("--", 0) == 0 ? " -l " + name.substr(2) : " -s " + name.substr(1);
    if (!option.values.empty())
        line += " -x -a " + quoted(join(option.values));
    else if (option.isFile)
        line += " -r -F";
    else if (!option.placeholder.empty())
        line += " -x";
    return line + " -d " + quoted(option.description) + "\n";
}

std::string linesOf(Command const& command)
{
    std::string const start =
        "complete -c korvane -n " + quoted("__korvane_at " + quoted(command.path));
    std::string lines;
    for (Command const& below : command.commands)
        lines += start + " -a " + below.name + " -d " + quoted(below.description) + "\n";
    for (Argument const& option : command.options)
        lines += optionLine(start, option);
    for (Argument const& argument : command.positionals)
        lines += start +
                 (argument.values.empty() ? " -F" : " -a " + quoted(join(argument.values))) + "\n";
    return lines;
}

} // namespace

std::string fishCompletion(Table const& table)
{
    std::string text = head;
    std::string names;
    for (Command const* command : allCommands(table.program)) {
        names += " " + quoted(command->path);
        text += linesOf(*command);
    }
    return text + "\nset -g __korvane_commands" + names + "\n";
}

} // namespace manual
