// bash: one function, which follows the words to the command that they name and offers what may
// stand next: its commands, options and values, else files by readline itself.
#include "Writers.h"

namespace manual {
namespace {

char const* const head =
    R"bash(# bash completion for korvane, made from the tool's own table of commands.

_korvane() {
  local current=${COMP_WORDS[COMP_CWORD]} before=${COMP_WORDS[COMP_CWORD - 1]}
  local command=korvane commands='' options='' values='' files='' word
  COMPREPLY=()
  # "--to=text" comes as three words.
  if [[ $current == = ]]; then
    current=''
  elif [[ $before == = ]]; then
    before=${COMP_WORDS[COMP_CWORD - 2]}
  fi
  for word in "${COMP_WORDS[@]:1:COMP_CWORD-1}"; do
    case "$command $word" in
)bash";

char const* const tail = R"bash(  esac
  if [[ $current == -* ]]; then
    mapfile -t COMPREPLY < <(compgen -W "$options" -- "$current")
  elif [[ -n $commands$values ]]; then
    mapfile -t COMPREPLY < <(compgen -W "$commands $values" -- "$current")
  elif [[ -n $files ]]; then
    compopt -o default
  fi
}
complete -F _korvane korvane
)bash";

std::string quoted(std::string const& text)
{
    return "'" + text + "'";
}

/// The answer where an option waits for its value.
std::string valueRow(Command const& command, Argument const& option)
{
    std::string row = "    ";
    for (std::string const& name : option.names)
        row += (&name == &option.names.front() ? "" : " | ") + quoted(command.path + " " + name);
    if (!option.values.empty())
        return row + ")\n      mapfile -t COMPREPLY < <(compgen -W " + quoted(join(option.values)) +
               " -- \"$current\")\n      return\n      ;;\n";
    return row + ")\n" + (option.isFile ? "      compopt -o default\n" : "") +
           "      return\n      ;;\n";
}

std::string commandRow(Command const& command)
{
    std::vector<std::string> options, commands, values;
    bool takesFiles = false;
    for (Argument const& option : command.options)
        options.insert(options.end(), option.names.begin(), option.names.end());
    for (Command const& below : command.commands)
        commands.push_back(below.name);
    for (Argument const& argument : command.positionals) {
        values.insert(values.end(), argument.values.begin(), argument.values.end());
        takesFiles = takesFiles || argument.isFile;
    }
    std::string row = "    " + quoted(command.path) + ")\n";
    row += "      options=" + quoted(join(options)) + "\n";
    if (!commands.empty())
        row += "      commands=" + quoted(join(commands)) + "\n";
    if (!values.empty())
        row += "      values=" + quoted(join(values)) + "\n";
    if (takesFiles)
        row += "      files=yes\n";
    return row + "      ;;\n";
}

} // namespace

std::string bashCompletion(Table const& table)
{
    std::vector<Command const*> const commands = allCommands(table.program);
    std::string text = head;
    for (Command const* command : commands)
        if (command != &table.program)
            text += "      " + quoted(command->path) + ") command+=\" $word\" ;;\n";
    text += "    esac\n  done\n  case \"$command $before\" in\n";
    for (Command const* command : commands)
        for (Argument const& option : command->options)
            if (!option.placeholder.empty())
                text += valueRow(*command, option);
    text += "  esac\n  case $command in\n";
    for (Command const* command : commands)
        text += commandRow(*command);
    return text + tail;
}

} // namespace manual
