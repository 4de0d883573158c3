#pragma once

#include <functional>
#include <string>
#include <vector>

/// Those of the symbols a shared library defines for others that are not its own: a name out of
/// another library's namespace, a C name without one of our prefixes, or a name that
/// `definedElsewhere` knows from the libraries that it stands on.
std::vector<std::string>
foreignSymbols(std::vector<std::string> const& symbols,
               std::function<bool(std::string const&)> const& definedElsewhere);
