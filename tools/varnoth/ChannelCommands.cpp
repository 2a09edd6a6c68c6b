#include "varnoth/Commands.h"

void RegisterChannelCommands(CLI::App&) {}
