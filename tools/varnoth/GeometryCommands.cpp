#include "varnoth/Commands.h"

void RegisterGeometryCommands(CLI::App&) {}
