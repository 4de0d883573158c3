#pragma once

#include <initializer_list>

namespace CLI {
class App;
}

/// The commands of the tool, each family in a file of its own. A family adds its subcommands,
/// with their options and help, to the program, which knows from them what it can do:
/// help, manual pages and completions come from that one table.
///
/// A command's work is its callback. It throws ToolError to end with a message and an exit code.
using AddCommands = void (*)(CLI::App& program);

/// Puts command lines into the help of the program or a family, and into the EXAMPLES of its manual
/// page. A test runs them over examples/data.
void addExamples(CLI::App& command, std::initializer_list<char const*> lines);

void addBlendCommands(CLI::App& program);
void addCaptionsCommands(CLI::App& program);
void addLutCommands(CLI::App& program);
void addMatrixCommands(CLI::App& program);
void addMediaCommands(CLI::App& program);
void addRangesCommands(CLI::App& program);
void addReportCommands(CLI::App& program);
void addSceneCommands(CLI::App& program);
void addTimeCommands(CLI::App& program);

/// The families, in the order in which `korvane --help` lists them.
inline constexpr AddCommands commandFamilies[] = {
    addSceneCommands, addTimeCommands,  addRangesCommands, addCaptionsCommands, addMatrixCommands,
    addLutCommands,   addBlendCommands, addMediaCommands,  addReportCommands,
};
