#pragma once

// Classes and functions of libvarnoth64 that hosts call carry VARNOTH_API; the rest of the
// library is hidden (built with -fvisibility=hidden).
#define VARNOTH_API __attribute__((visibility("default")))
