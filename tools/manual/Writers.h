#pragma once

#include "Table.h"

namespace manual {

/// The manual page of the program, which leads to those of its families.
std::string programPage(Table const& table, std::string const& date);
/// The manual page of one family with all its commands. `date` may be empty.
std::string familyPage(Table const& table, Command const& family, std::string const& date);

std::string bashCompletion(Table const& table);
std::string zshCompletion(Table const& table);
std::string fishCompletion(Table const& table);

} // namespace manual
