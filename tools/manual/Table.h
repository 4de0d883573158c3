#pragma once

#include <string>
#include <vector>

namespace CLI {
class App;
}

/// The tool's command line as plain values: what the manual pages and the completions are made of.
namespace manual {

/// An option, a flag or an argument without a name.
struct Argument {
    std::vector<std::string> names; ///< "-h", "--help"; for an argument without one its placeholder
    std::string placeholder;        ///< what stands for its value, "N"; empty for a flag
    std::vector<std::string> values; ///< all that it may be, where that is a list
    std::string range;               ///< "-180 to 180", or what else is said of its value
    std::string fallback;            ///< its value where it is left out
    std::string description;
    bool isFile = false;
    bool isRequired = false;
    int most = 1; ///< how many values it takes; -1 where there is no end
};

struct Command {
    std::string name;
    std::string path; ///< with the commands that it belongs to: "korvane scene show"
    std::string description;
    std::vector<std::string> notes;    ///< paragraphs of its own
    std::vector<std::string> examples; ///< command lines
    std::vector<Argument> options;
    std::vector<Argument> positionals;
    std::vector<Command> commands;
};

struct ExitStatus {
    std::string code, meaning;
};

struct Table {
    Command program;
    std::string version; ///< "korvane 0.1.0"
    std::vector<ExitStatus> exitStatuses;
};

Table tableOf(CLI::App const& program);

/// The command and all below it, each before its own.
std::vector<Command const*> allCommands(Command const& command);

/// "a b c".
std::string join(std::vector<std::string> const& words, char const* between = " ");

} // namespace manual
