#pragma once

// One pixel of the brightness-map composition, exposed to the tests (not exported).
namespace holo4 {

constexpr int kBrightMapSaturation = 240;   // a candidate brighter than this is saturated
constexpr int kMaxUsableDifference = 100;   // neighbour differences must stay below this
constexpr float kStartDistance = 10000.0f;  // colour-proportion search start

// Colour proportions of a pixel (0, 0, 0 for black).
void Proportions(const unsigned char* p, float out[3]);

// Rebuilds one inner pixel: `at`, `leftOf` and `above` are the four candidates' pixels at
// (x, y), (x - 1, y) and (x, y - 1); `resultLeft` and `resultAbove` the finished result
// pixels there. Writes the pixel to `out` and the saturation flags (bit 4 + i) to `flags`.
void RebuildPixel(const unsigned char* const at[4], const unsigned char* const leftOf[4],
                  const unsigned char* const above[4], const unsigned char* resultLeft,
                  const unsigned char* resultAbove, unsigned char* out, unsigned char* flags);

}  // namespace holo4
