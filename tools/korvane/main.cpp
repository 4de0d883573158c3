#include "App.h"
#include "AtomicOutput.h"
#include "ToolError.h"

#include <algorithm>
#include <exception>
#include <iostream>
#include <sstream>
#include <string>
#include <vector>

namespace {

/// Help and version are asked for and go to standard output; what is wrong goes to the other.
ExitCode answerParseError(CLI::App const& app, CLI::ParseError const& error)
{
    std::ostringstream out;
    std::ostringstream messages;
    bool const asked = app.exit(error, out, messages) == 0;
    if (asked) {
        printOutput(out.str());
        return ExitCode::Done;
    }
    printMessage(error.what());
    std::cerr << "Run with --help for more information.\n";
    return ExitCode::Usage;
}

/// The words of the command line, last one first as the parser wants them. It would take "-.5"
/// for an option, and "-0.5" for a number.
std::vector<std::string> wordsOf(int count, char** arguments)
{
    std::vector<std::string> words(arguments + std::min(count, 1), arguments + count);
    for (std::string& word : words)
        if (word.size() > 2 && word.starts_with("-.") && word[2] >= '0' && word[2] <= '9')
            word.insert(1, "0");
    std::reverse(words.begin(), words.end());
    return words;
}

ExitCode run(int count, char** arguments)
{
    auto const app = makeApp();
    try {
        try {
            app->parse(wordsOf(count, arguments));
            return ExitCode::Done;
        } catch (CLI::ParseError const& error) {
            return answerParseError(*app, error);
        }
    } catch (ToolError const& error) {
        if (*error.what() != '\0')
            printMessage(error.what());
        return error.code();
    } catch (std::exception const& error) {
        printMessage(error.what());
        return ExitCode::Failed;
    }
}

} // namespace

int main(int count, char** arguments)
{
    prepareProcess();
    return static_cast<int>(run(count, arguments));
}
