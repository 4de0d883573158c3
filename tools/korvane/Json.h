#pragma once

#include "AtomicOutput.h"

#include <CLI/CLI.hpp>
#include <nlohmann/json.hpp>

/// Members keep the order in which they were added.
using Json = nlohmann::ordered_json;

/// Gives a reading command its `--json`.
inline void addJsonFlag(CLI::App& command, bool& json)
{
    command.add_flag("--json", json, "Print JSON");
}

/// Prints a document with a newline. Text that is not UTF-8 gets U+FFFD in its place.
inline void printJson(Json const& document)
{
    printOutput(document.dump(2, ' ', false, Json::error_handler_t::replace) + "\n");
}
