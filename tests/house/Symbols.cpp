#include "house/Symbols.h"

#include <cstdlib>
#include <cxxabi.h>
#include <memory>
#include <string_view>

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

} // namespace

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
