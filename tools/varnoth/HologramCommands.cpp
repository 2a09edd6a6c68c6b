#include "varnoth/Commands.h"

void RegisterHologramCommands(CLI::App&) {}
