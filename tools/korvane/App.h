#pragma once

#include <CLI/CLI.hpp>

#include <memory>

/// The whole command line: every command with its options and help.
std::unique_ptr<CLI::App> makeApp();
