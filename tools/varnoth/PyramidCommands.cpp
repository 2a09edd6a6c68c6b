#include "varnoth/Commands.h"

void RegisterPyramidCommands(CLI::App&) {}
