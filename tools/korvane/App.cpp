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

} // namespace

void addExamples(CLI::App& family, std::string const& lines)
{
    family.footer("Examples:\n" + lines + "\n\n" + family.get_footer());
}

std::unique_ptr<CLI::App> makeApp()
{
    auto app =
        std::make_unique<CLI::App>("Reads, checks and writes what the library handles.", "korvane");
    app->set_version_flag("--version", versionText(),
                          "Print the version and the binary interface's");
    app->set_help_all_flag("--help-all", "Print the help of every command");
    app->require_subcommand(1);
    app->footer(exitCodes);
    for (AddCommands add : commandFamilies)
        add(*app);
    return app;
}
