#pragma once

#include <cmath>

namespace imagelib {

// The image library's float-to-int rounding: nearest integer, halves away from zero.
inline int round(float v) { return static_cast<int>(std::lround(v)); }
inline int round(double v) { return static_cast<int>(std::lround(v)); }

}  // namespace imagelib
