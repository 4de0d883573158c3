#include "house/Symbols.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <cstdio>
#include <dlfcn.h>
#include <sstream>

using ::testing::ElementsAre;
using ::testing::Gt;
using ::testing::IsEmpty;
using ::testing::SizeIs;

namespace {

/// The last word of each line that a command prints.
std::vector<std::string> lastWords(std::string const& command)
{
    std::vector<std::string> words;
    std::FILE* const pipe = popen(command.c_str(), "r");
    if (pipe == nullptr)
        return words;
    char line[65536];
    while (std::fgets(line, sizeof line, pipe) != nullptr) {
        std::istringstream in(line);
        std::string word, last;
        while (in >> word)
            last = word;
        if (!last.empty())
            words.push_back(last);
    }
    return pclose(pipe) == 0 ? words : std::vector<std::string>();
}

/// The libraries that ours names as needed, opened to look for their symbols.
std::vector<void*> neededLibraries()
{
    std::vector<void*> handles;
    for (std::string const& name :
         lastWords("readelf --dynamic --wide '" KORVANE_LIBRARY "' | grep '(NEEDED)'")) {
        std::string const file = name.substr(1, name.size() - 2); // [libc.so.6]
        if (void* const handle = dlopen(file.c_str(), RTLD_LAZY | RTLD_LOCAL))
            handles.push_back(handle);
    }
    return handles;
}

} // namespace

TEST(Symbols, TheLibraryExportsItsOwnAlone)
{
    std::vector<std::string> const symbols =
        lastWords("nm --dynamic --defined-only '" KORVANE_LIBRARY "'");
    std::vector<void*> const needed = neededLibraries();
    ASSERT_THAT(symbols, SizeIs(Gt(100u)));
    ASSERT_THAT(needed, SizeIs(Gt(2u)));
    auto const inNeeded = [&](std::string const& symbol) {
        for (void* handle : needed)
            if (dlsym(handle, symbol.c_str()) != nullptr)
                return true;
        return false;
    };
    EXPECT_THAT(foreignSymbols(symbols, inNeeded), IsEmpty());
}

TEST(Symbols, NothingIsLeftUndefined)
{
    void* const library = dlopen(KORVANE_LIBRARY, RTLD_NOW | RTLD_LOCAL);
    EXPECT_NE(library, nullptr) << dlerror();
}

TEST(Symbols, ForeignOnesAreTold)
{
    std::vector<std::string> const symbols = {
        "_ZNK8KVString5emptyEv", // KVString::empty() const
        "_ZlsRSoRK8KVString",    // operator<<(std::ostream&, KVString const&)
        "_ZTI8KVString",         // typeinfo for KVString
        "KVVersion",
        "_ZNSt6vectorIiSaIiEE5clearEv",
        "_ZTVN6icu_7213UnicodeStringE",
        "u_strlen_72",
        "KVTaken",
    };
    auto const elsewhere = [](std::string const& symbol) { return symbol == "KVTaken"; };
    EXPECT_THAT(foreignSymbols(symbols, elsewhere),
                ElementsAre("std::vector<int, std::allocator<int> >::clear()",
                            "icu_72::UnicodeString", "u_strlen_72", "KVTaken"));
}
