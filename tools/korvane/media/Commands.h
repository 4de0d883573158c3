#pragma once

namespace CLI {
class App;
}

// The commands of `korvane media`, each in the file of its name.

void addMediaTree(CLI::App& media);
void addMediaInfo(CLI::App& media);
void addMediaSet(CLI::App& media);
void addMediaStrip(CLI::App& media);
