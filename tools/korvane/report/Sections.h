#pragma once

#include "../Input.h"

#include <string>

// What a report tells of a file of each kind, as HTML. `id` begins the ids within it. Each throws
// ToolError, code 3 or 4, with the file's name for what it cannot show.

std::string sceneHtml(ReopenableFile const& file, std::string const& id);
std::string captionsHtml(ReopenableFile const& file, std::string const& id);
std::string lutHtml(ReopenableFile const& file, std::string const& id);
/// With the changes marked since `before`, a path or empty.
std::string movieHtml(ReopenableFile const& file, std::string const& id, std::string const& before);
std::string matrixHtml(ReopenableFile const& file, std::string const& id);
