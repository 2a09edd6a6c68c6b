#pragma once

#include <algorithm>

#include "imagelib/CImage.h"

// Helpers shared by the four-image compositions (not exported).
namespace holo4 {

// Every four-image pyramid composition works on seven levels.
constexpr int kLevels = 7;

// Brightness of a 24-bit pixel (its largest channel) and its smallest channel.
inline int MaxChannel(const unsigned char* p) { return std::max(p[0], std::max(p[1], p[2])); }
inline int MinChannel(const unsigned char* p) { return std::min(p[0], std::min(p[1], p[2])); }

inline void CopyPixel(unsigned char* dst, const unsigned char* src) {
    dst[0] = src[0];
    dst[1] = src[1];
    dst[2] = src[2];
}

// Rounds half away from zero in float: add 0.5 to a positive value, subtract it otherwise,
// then truncate toward zero.
inline int RoundHalfAway(float v) { return v > 0.0f ? static_cast<int>(v + 0.5f) : static_cast<int>(v - 0.5f); }

// True when a width x height image keeps at least 3 x 3 pixels on every level that is
// reduced into a coarser one, so that a pyramid of `levels` levels is fully built.
bool ReducibleToLevels(int width, int height, int levels);

// True when all four images are 24-bit, of top's width and height, and large enough for a
// seven-level pyramid. Otherwise traces one line naming `operation` and the reason.
bool CheckFourInputs(const CImage& top, const CImage& bottom, const CImage& left, const CImage& right,
                     const wchar_t* operation, bool needPyramid = true);

}  // namespace holo4
