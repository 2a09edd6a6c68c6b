#pragma once

#include "frame/VarnothExport.h"

// The library's module object, built when the library is loaded and destroyed when it is
// unloaded. It stands in for the host framework's extension-module registration and holds
// no state that operations use.
class VARNOTH_API CVarnothApp {
public:
    CVarnothApp();
    ~CVarnothApp();
    // True while the library is loaded (the module object exists).
    static bool IsRegistered();
};
