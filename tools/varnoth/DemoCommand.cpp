#include "varnoth/Commands.h"

void RegisterDemoCommand(CLI::App&) {}
