#pragma once

#include "frame/VarnothExport.h"

// Empty exception classes, thrown by value.
class VARNOTH_API CSafeArrayErrorT {};    // CSafeArray could not allocate
class VARNOTH_API OutOfRangeT {};         // an index outside a table (Huffman codes)
class VARNOTH_API CCheatIRCreateErrT {};  // a CCheatIR could not be created from its planes
class VARNOTH_API CCorresTableInitErrT {};  // a CCorresTable could not be sized
