#pragma once

#include <cstdint>

#include "imagelib/CImage.h"

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

// What a pixel takes from the four shots, independent of the result: the best horizontal
// and vertical differences, the saturation flags and the colour proportions of the
// unsaturated candidates. RebuildPixel is AnalysePixel followed by FinishPixel.
struct PixelAnalysis {
    int16_t hd[3], vd[3];
    uint8_t flags;
    float proportion[4][3];
};
void AnalysePixel(const unsigned char* const at[4], const unsigned char* const leftOf[4],
                  const unsigned char* const above[4], PixelAnalysis& a);
void FinishPixel(const PixelAnalysis& a, const unsigned char* const at[4], const unsigned char* resultLeft,
                 const unsigned char* resultAbove, unsigned char* out);

// The whole composition into `out` (24-bit) and `brightMap` (8-bit), both of the inputs'
// size and zeroed; inputs in the order top, bottom, left, right, at least 4 pixels wide.
// The plain form is one raster pass; the fast form analyses bands of rows in parallel first.
void ComposeBrightnessMapPlain(const CImage* const in[4], CImage& out, CImage& brightMap);
void ComposeBrightnessMapFast(const CImage* const in[4], CImage& out, CImage& brightMap);

}  // namespace holo4
