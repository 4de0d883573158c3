// Writes the manual pages and the shells' completions of the tool into a folder, laid out as they
// are installed. Run by the build.
#include "../korvane/App.h"
#include "Writers.h"

#include <cstdlib>
#include <ctime>
#include <exception>
#include <filesystem>
#include <fstream>
#include <iostream>

namespace {

/// The day that SOURCE_DATE_EPOCH names, else none: the pages depend on nothing but the table.
std::string date()
{
    char const* const seconds = std::getenv("SOURCE_DATE_EPOCH");
    if (!seconds || !*seconds)
        return "";
    std::time_t const time = std::strtoll(seconds, nullptr, 10);
    std::tm fields{};
    char text[16] = "";
    if (gmtime_r(&time, &fields))
        std::strftime(text, sizeof text, "%Y-%m-%d", &fields);
    return text;
}

void write(std::filesystem::path const& path, std::string const& text)
{
    std::filesystem::create_directories(path.parent_path());
    std::ofstream file(path, std::ios::binary);
    file.exceptions(std::ios::failbit | std::ios::badbit);
    file << text;
    file.close();
}

void writeManual(std::filesystem::path const& folder)
{
    auto const app = makeApp();
    manual::Table const table = manual::tableOf(*app);
    std::string const day = date();
    write(folder / "man/man1/korvane.1", programPage(table, day));
    for (manual::Command const& family : table.program.commands)
        write(folder / "man/man1" / ("korvane-" + family.name + ".1"),
              familyPage(table, family, day));
    write(folder / "bash-completion/completions/korvane", bashCompletion(table));
    write(folder / "zsh/site-functions/_korvane", zshCompletion(table));
    write(folder / "fish/vendor_completions.d/korvane.fish", fishCompletion(table));
}

} // namespace

int main(int count, char** arguments)
{
    if (count != 2) {
        std::cerr << "korvane_manual: FOLDER\n";
        return 2;
    }
    try {
        writeManual(arguments[1]);
        return 0;
    } catch (std::exception const& error) {
        std::cerr << "korvane_manual: " << arguments[1] << ": " << error.what() << '\n';
        return 4;
    }
}
