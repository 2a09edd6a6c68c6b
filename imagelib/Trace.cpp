#include "imagelib/Trace.h"

#include <atomic>
#include <cstdarg>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <cwchar>

namespace {

std::atomic<TraceHandler> g_handler{nullptr};

// The default sink: standard error, only when VARNOTH_TRACE=1 (read at every line, so a
// host or a test can switch it on and off).
void DefaultSink(const wchar_t* line) {
    const char* setting = std::getenv("VARNOTH_TRACE");
    if (setting == nullptr || std::strcmp(setting, "1") != 0) return;
    std::fprintf(stderr, "%ls", line);
}

}  // namespace

void Trace(const wchar_t* format, ...) {
    TraceHandler handler = g_handler.load();
    if (handler == nullptr) {
        const char* setting = std::getenv("VARNOTH_TRACE");
        if (setting == nullptr || std::strcmp(setting, "1") != 0) return;  // silent: skip formatting
        handler = DefaultSink;
    }
    wchar_t line[1024];
    va_list args;
    va_start(args, format);
    const int n = std::vswprintf(line, sizeof line / sizeof line[0], format, args);
    va_end(args);
    if (n < 0) line[sizeof line / sizeof line[0] - 1] = L'\0';  // too long: keep what fitted
    handler(line);
}

TraceHandler SetTraceHandler(TraceHandler handler) { return g_handler.exchange(handler); }
