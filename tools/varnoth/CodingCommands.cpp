#include "varnoth/Commands.h"

void RegisterCodingCommands(CLI::App&) {}
