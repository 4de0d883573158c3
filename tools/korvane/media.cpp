#include "commands.h"
void addMediaCommands(CLI::App&){}
