#include "App.h"

#include "commands.h"

#include <korvane/foundation/KVVersion.h>

#include <string>

namespace {

char const* const exitCodes = R"(Exit codes:
  0  done
  1  failed: the work was done and its answer is no
  2  usage: the command line is wrong
  3  bad input: a file was read and is not what it should be
  4  input/output: a file could not be read or written

Data goes to standard output, messages to standard error. A FILE of "-" is standard
input or output.)";

std::string versionText()
{
    unsigned int const version = KVVersion();
    return "korvane " + std::to_string(version >> 16) + "." + std::to_string(version >> 8 & 0xFF) +
           "." + std::to_string(version & 0xFF) + " (ABI " + std::to_string(KORVANE_ABI) + ")";
}

/// Puts a paragraph behind what a command's help says so far.
void addParagraph(CLI::App& command, std::string const& text)
{
    std::string const before = command.get_footer();
    command.footer(before.empty() ? text : before + "\n\n" + text);
}

/// What the help of every command has in common: the exit codes, and arguments that are told by
/// their names alone.
void finish(CLI::App& command)
{
    addParagraph(command, exitCodes);
    for (CLI::Option* argument :
         command.get_options([](CLI::Option* option) { return option->get_positional(); }))
        argument->type_name("");
    for (CLI::App* below : command.get_subcommands([](CLI::App*) { return true; }))
        finish(*below);
}

} // namespace

void addExamples(CLI::App& command, std::initializer_list<char const*> lines)
{
    std::string text = "Examples:";
    for (char const* line : lines)
        text += std::string("\n  ") + line;
    addParagraph(command, text);
}

std::unique_ptr<CLI::App> makeApp()
{
    auto app =
        std::make_unique<CLI::App>("Read, check and write what the library handles", "korvane");
    app->set_version_flag("--version", versionText(),
                          "Print the version and the binary interface's");
    app->set_help_all_flag("--help-all", "Print the help of every command");
    app->require_subcommand(1);
    for (AddCommands add : commandFamilies)
        add(*app);
    addExamples(*app, {"korvane scene show showreel.vzml",
                       "korvane report showreel.vzml lighthouse.srt -o report.html"});
    finish(*app);
    return app;
}
