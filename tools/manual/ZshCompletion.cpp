// zsh: a function a command, each made of calls of _arguments and _describe (zshcompsys(1)).
#include "Writers.h"

#include <algorithm>

namespace manual {
namespace {

/// Inside single quotes, with the characters that _arguments reads for itself escaped.
std::string escaped(std::string const& text)
{
    std::string result;
    for (char c : text) {
        if (c == '\'')
            result += "'\\'";
        if (c == '[' || c == ']' || c == ':' || c == '\\')
            result += '\\';
        result += c;
    }
    return result;
}

std::string functionName(Command const& command)
{
    std::string name = "_" + command.path;
    std::replace_if(
        name.begin(), name.end(), [](char c) { return c == ' ' || c == '-'; }, '_');
    return name;
}

/// ":VALUE:(a b)", once for each value that it takes.
std::string actionOf(Argument const& argument)
{
    if (argument.placeholder.empty())
        return "";
    std::string action = ":" + escaped(argument.placeholder) + ":";
    if (!argument.values.empty())
        action += "(" + join(argument.values) + ")";
    else if (argument.isFile)
        action += "_files";
    else
        action += " ";
    std::string result;
    for (int i = 0; i < std::max(1, argument.most); ++i)
        result += action;
    return result;
}

std::string argumentRows(Command const& command)
{
    std::string rows;
    for (Argument const& option : command.options)
        for (std::string const& name : option.names) {
            bool const isLong = name.rfind("--", 0) == 0;
            rows += " \\\n    '" + name +
                    (option.placeholder.empty() ? ""
                     : isLong                   ? "="
                                                : "+") +
                    "[" + escaped(option.description) + "]" + actionOf(option) + "'";
        }
    for (Argument const& argument : command.positionals) {
        std::string const action =
            argument.values.empty() ? "_files" : "(" + join(argument.values) + ")";
        rows += std::string(" \\\n    '") + (argument.most == 1 ? "" : "*") + ":" +
                escaped(argument.names[0]) + ":" + action + "'";
    }
    return rows;
}

std::string functionOf(Command const& command)
{
    std::string text = functionName(command) + "() {\n";
    if (command.commands.empty())
        return text + "  _arguments -s" + argumentRows(command) + "\n}\n\n";
    text += "  local context state state_descr line curcontext=$curcontext\n"
            "  local -A opt_args\n  local -a commands=(\n";
    for (Command const& below : command.commands)
        text += "    '" + below.name + ":" + escaped(below.description) + "'\n";
    text += "  )\n  _arguments -C" + argumentRows(command) +
            " \\\n    '1:command:->command' \\\n    '*::argument:->argument' && return\n"
            "  case $state in\n    command) _describe command commands ;;\n"
            "    argument)\n      case $line[1] in\n";
    for (Command const& below : command.commands)
        text += "        " + below.name + ") " + functionName(below) + " ;;\n";
    return text + "      esac\n      ;;\n  esac\n}\n\n";
}

} // namespace

std::string zshCompletion(Table const& table)
{
    std::string text =
        "#compdef " + table.program.name + "\n# Made from the tool's own table of commands.\n\n";
    for (Command const* command : allCommands(table.program))
        text += functionOf(*command);
    return text + functionName(table.program) + " \"$@\"\n";
}

} // namespace manual
