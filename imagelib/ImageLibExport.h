#pragma once

// Symbols of libcimage64 that a host may call. Everything else stays hidden.
#if defined(CIMAGE_BUILDING)
#define CIMAGE_API __attribute__((visibility("default")))
#else
#define CIMAGE_API __attribute__((visibility("default")))
#endif
