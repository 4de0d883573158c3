// The pages of the manual show what the build compiles and runs.
#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <filesystem>
#include <fstream>
#include <set>
#include <string>

namespace {

namespace fs = std::filesystem;

fs::path const root = KORVANE_SOURCE_DIR;

std::string contents(fs::path const& path)
{
    std::ifstream file(path);
    return {std::istreambuf_iterator<char>(file), {}};
}

/// The example without the comment in front of it.
std::string shown(std::string text)
{
    while (text.rfind("//", 0) == 0 || text.rfind('\n', 0) == 0)
        text.erase(0, text.find('\n') + 1);
    return text;
}

std::string between(std::string const& text, std::string const& from, std::string const& to)
{
    std::size_t const begin = text.find(from);
    if (begin == text.npos)
        return "";
    std::size_t const start = begin + from.size();
    return text.substr(start, text.find(to, start) - start);
}

} // namespace

TEST(Pages, ShowTheExamplesThatTheBuildRuns)
{
    std::set<fs::path> pages{root / "README.md"}, shownFiles;
    for (auto const& entry : fs::directory_iterator(root / "docs"))
        if (entry.path().extension() == ".md")
            pages.insert(entry.path());
    for (fs::path const& page : pages) {
        std::string const text = contents(page);
        std::size_t const block = text.find("```cpp\n");
        if (block == text.npos)
            continue;
        // "[`examples/...`](...):" stands above it.
        std::size_t const paragraph = text.rfind("\n\n", block - 3);
        std::string const name =
            between(text.substr(paragraph, block - paragraph), "[`examples/", "`]");
        ASSERT_NE(name, "") << page << ": the first example names no file";
        fs::path const example = root / "examples" / name;
        EXPECT_EQ(between(text, "```cpp\n", "```"), shown(contents(example)))
            << page << " and " << example;
        shownFiles.insert(example);
    }
    for (auto const& entry : fs::directory_iterator(root / "examples/manual"))
        if (entry.path().extension() == ".cpp") {
            EXPECT_TRUE(shownFiles.count(entry.path())) << entry.path() << " is on no page";
        }
}

TEST(Pages, LeadToFilesThatAreThere)
{
    for (auto const& entry : fs::directory_iterator(root / "docs")) {
        if (entry.is_directory())
            continue;
        std::string const text = contents(entry.path());
        for (std::size_t at = 0; (at = text.find("](", at)) != text.npos; ++at) {
            std::string target = text.substr(at + 2, text.find(')', at) - at - 2);
            target = target.substr(0, target.find('#'));
            if (target.find(" ") == target.npos && target.find("://") == target.npos) {
                EXPECT_TRUE(target.empty() || fs::exists(root / "docs" / target))
                    << entry.path() << ": " << target;
            }
        }
    }
    // Each page is in the index.
    std::string const index = contents(root / "docs/README.md");
    for (auto const& entry : fs::directory_iterator(root / "docs"))
        if (std::string const name = entry.path().filename();
            name.ends_with(".md") && name != "README.md") {
            EXPECT_NE(index.find("(" + name), index.npos) << name;
        }
}

TEST(Pages, TheMapHasTheFloorsThatAreThere)
{
    std::multiset<std::string> floors, told;
    std::ifstream list(KORVANE_FLOORS);
    for (std::string line; std::getline(list, line);)
        if (line.rfind("floor ", 0) == 0)
            floors.insert(line.substr(6, line.find(' ', 6) - 6));
    std::string const map = contents(root / "docs/map.md");
    std::string const table = between(map, "| Floor | Stands on | For |\n|---|---|---|\n", "\n\n");
    for (std::size_t at = 0; (at = table.find("| `", at)) != table.npos; at += 3)
        if (at == 0 || table[at - 1] == '\n')
            told.insert(table.substr(at + 3, table.find('`', at + 3) - at - 3));
    EXPECT_EQ(told, floors);
}
