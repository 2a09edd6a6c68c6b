#pragma once

#include "imagelib/ImageLibExport.h"

// Debug output. Silent unless VARNOTH_TRACE=1 (lines then go to standard error) or a host
// installs its own sink. Formats are wide printf formats: "%s" takes a narrow string and
// "%ls" a wide one.
using TraceHandler = void (*)(const wchar_t* line);

CIMAGE_API void Trace(const wchar_t* format, ...);
// Installs a sink for every trace line and returns the previous one; null restores the default.
CIMAGE_API TraceHandler SetTraceHandler(TraceHandler handler);
