#include "house/Floors.h"

#include <algorithm>
#include <fstream>
#include <istream>
#include <sstream>
#include <string_view>

namespace fs = std::filesystem;

namespace {

/// What a public header may bring in: the headers of the C++20 standard library, and that of
/// POSIX threads, which the locks hold.
constexpr std::string_view allowedHeaders =
    " algorithm any array atomic bit bitset cassert cctype cerrno cfloat charconv chrono "
    "cinttypes climits cmath compare complex concepts condition_variable cstdarg cstddef "
    "cstdint cstdio cstdlib cstring ctime deque exception filesystem functional "
    "initializer_list iosfwd iostream istream iterator limits list map memory mutex new "
    "numbers numeric optional ostream pthread.h queue random ranges ratio set "
    "shared_mutex span sstream stack stdexcept string string_view thread tuple "
    "type_traits typeindex typeinfo unordered_map unordered_set utility variant vector "
    "version ";

struct Include {
    std::size_t line = 0;
    std::string header; // without its brackets or quotes
};

std::vector<Include> includesOf(fs::path const& file)
{
    std::ifstream in(file);
    std::vector<Include> includes;
    std::string text;
    for (std::size_t line = 1; std::getline(in, text); ++line) {
        std::size_t const hash = text.find_first_not_of(" \t");
        if (hash == std::string::npos || text[hash] != '#')
            continue;
        std::size_t const word = text.find_first_not_of(" \t", hash + 1);
        if (word == std::string::npos || text.compare(word, 7, "include") != 0)
            continue;
        std::size_t const open = text.find_first_of("<\"", word);
        std::size_t const close =
            open == std::string::npos ? open : text.find_first_of(">\"", open + 1);
        if (close != std::string::npos)
            includes.push_back({line, text.substr(open + 1, close - open - 1)});
    }
    return includes;
}

bool isAllowed(std::string const& header)
{
    return allowedHeaders.find(" " + header + " ") != std::string_view::npos;
}

bool isPrivate(fs::path const& header)
{
    return header.stem().string().ends_with("_p");
}

bool isPublicHeader(fs::path const& file)
{
    return file.extension() == ".h" && !isPrivate(file);
}

bool exists(fs::path const& root, std::string const& header)
{
    return fs::exists(root / header) || fs::exists(root / (header + ".in"));
}

} // namespace

Floors Floors::read(std::istream& lines)
{
    Floors floors;
    std::string line;
    while (std::getline(lines, line)) {
        std::istringstream words(line);
        std::string kind, name, word;
        words >> kind >> name;
        if (kind == "floor")
            floors.below[name];
        while (words >> word)
            if (kind == "floor")
                floors.below[name].insert(word);
            else
                floors.floorOfFile[word] = name;
    }
    return floors;
}

std::string Floors::floorOf(fs::path const& file) const
{
    if (auto const named = floorOfFile.find(file.generic_string()); named != floorOfFile.end())
        return named->second;
    std::string stem = file.stem().string();
    if (stem.ends_with("_p"))
        stem.resize(stem.size() - 2);
    fs::path const source = file.parent_path() / (stem + ".cpp");
    if (auto const beside = floorOfFile.find(source.generic_string()); beside != floorOfFile.end())
        return beside->second;
    std::string const folder = file.parent_path().filename().string();
    return below.contains(folder) ? folder : "";
}

bool Floors::standsOn(std::string const& upper, std::string const& lower) const
{
    std::vector<std::string> open = {upper};
    std::set<std::string> seen;
    while (!open.empty()) {
        std::string const floor = open.back();
        open.pop_back();
        if (floor == lower)
            return true;
        auto const found = below.find(floor);
        if (seen.insert(floor).second && found != below.end())
            open.insert(open.end(), found->second.begin(), found->second.end());
    }
    return false;
}

std::vector<std::string> faultsOfTree(fs::path const& root, Floors const& floors)
{
    std::vector<fs::path> files;
    for (fs::directory_entry const& entry : fs::recursive_directory_iterator(root / "korvane")) {
        std::string const extension = entry.path().extension().string();
        if (entry.is_regular_file() && (extension == ".h" || extension == ".cpp"))
            files.push_back(entry.path().lexically_relative(root));
    }
    std::sort(files.begin(), files.end());

    std::vector<std::string> faults;
    for (auto const& [upper, belowIt] : floors.below)
        for (std::string const& lower : belowIt)
            if (floors.standsOn(lower, upper))
                faults.push_back(upper + " and " + lower + " stand on each other");

    for (fs::path const& file : files) {
        if (file.extension() == ".cpp" && !floors.floorOfFile.contains(file.generic_string()))
            faults.push_back(file.generic_string() + ": no floor names this source");
        std::string const floor = floors.floorOf(file);
        for (Include const& include : includesOf(root / file)) {
            auto const fault = [&](std::string const& text) {
                faults.push_back(file.generic_string() + ":" + std::to_string(include.line) + ": " +
                                 text + " " + include.header);
            };
            if (!include.header.starts_with("korvane/")) {
                if (isPublicHeader(file) && !isAllowed(include.header))
                    fault("a public header includes");
                continue;
            }
            if (!exists(root, include.header))
                fault("there is no");
            if (isPublicHeader(file) && isPrivate(include.header))
                fault("a public header includes the private");
            std::string const lower = floors.floorOf(include.header);
            if (!floor.empty() && !floors.standsOn(floor, lower))
                fault("goes up from " + floor + " to " + (lower.empty() ? "all" : lower) + ":");
        }
    }
    return faults;
}
