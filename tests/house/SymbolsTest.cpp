#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <cstdio>
#include <cstdlib>
#include <cxxabi.h>
#include <dlfcn.h>
#include <functional>
#include <memory>
#include <sstream>

using ::testing::ElementsAre;
using ::testing::Gt;
using ::testing::IsEmpty;
using ::testing::SizeIs;

namespace {

/// How the demangled names of tables and guards begin, before the name that they are for.
constexpr std::string_view prefixes[] = {
    "typeinfo for ", "typeinfo name for ",       "vtable for ",       "guard variable for ",
    "VTT for ",      "construction vtable for ", "virtual thunk to ", "non-virtual thunk to "};

/// The namespaces of what the library is built with.
constexpr std::string_view foreignNamespaces[] = {
    "std::", "__gnu_cxx::", "icu",        "Imath", "half",      "hwy::",
    "zimg",  "CLI::",       "nlohmann::", "fmt::", "testing::", "benchmark::"};

/// How the C names of the library's own begin.
constexpr std::string_view ownPrefixes[] = {"KV",  "_KV", "kv",  "kKV", "CF", "kCF",   "CM",
                                            "kCM", "CG",  "kCG", "NS",  "AV", "vImage"};

std::string demangled(std::string const& symbol)
{
    int status = 0;
    std::unique_ptr<char, void (*)(void*)> const name(
        abi::__cxa_demangle(symbol.c_str(), nullptr, nullptr, &status), std::free);
    if (status != 0)
        return symbol;
    std::string_view text = name.get();
    for (std::string_view prefix : prefixes)
        if (text.starts_with(prefix))
            text.remove_prefix(prefix.size());
    return std::string(text);
}

bool beginsWithOneOf(std::string_view text, auto const& beginnings)
{
    for (std::string_view beginning : beginnings)
        if (text.starts_with(beginning))
            return true;
    return false;
}

/// Those of the symbols a shared library defines for others that are not its own: a name out of
/// another library's namespace, a C name without one of our prefixes, or a name that
/// `definedElsewhere` knows from the libraries that it stands on.
std::vector<std::string>
foreignSymbols(std::vector<std::string> const& symbols,
               std::function<bool(std::string const&)> const& definedElsewhere)
{
    std::vector<std::string> foreign;
    for (std::string const& symbol : symbols) {
        bool const own = symbol.starts_with("_Z")
                             ? !beginsWithOneOf(demangled(symbol), foreignNamespaces)
                             : beginsWithOneOf(symbol, ownPrefixes);
        if (!own || definedElsewhere(symbol))
            foreign.push_back(demangled(symbol));
    }
    return foreign;
}

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
