#pragma once

#include <cstdint>

// Pieces of the HSV composition, exposed to the tests (not exported).
namespace holo4 {

constexpr int kHsvSaturation = 246;        // a Gaussian pixel this bright is saturated
constexpr int kSaturationSimilarity = 5;   // S within this of the lowest counts as alike

// `brightness`: the largest channel of the candidate's Gaussian pixel.
inline bool IsHsvSaturated(int brightness) { return brightness >= kHsvSaturation; }

// One pixel in place: B, G, R <-> H, S, V bytes (H 0..255 for the full circle).
void RgbToHsv(unsigned char* pixel);
void HsvToRgb(unsigned char* pixel);

// RgbToHsv of n pixels from src into dst (3 bytes each), with vectors.
void RgbToHsvRowFast(const unsigned char* src, unsigned char* dst, int n);

// Largest s such that at least n pixels have a spread of s or more; 0 when n is 0 or the
// sum reaches n only with bin 0.
int SpreadThreshold(const uint32_t histogram[256], int64_t n);

// Coarsest level: the mean of the two least bright candidates (the later of equals first).
void AverageOfTwoDarkest(const unsigned char* const lap[4], unsigned char* out);

struct Spreads {
    bool any = false;  // some candidate unsaturated
    int dS = 0, dV = 0;
};
Spreads SpreadsOf(const unsigned char* const hsv[4], const bool saturated[4]);

// Second-pass decision for one pixel of levels 5..0; `maskedIn` flags saturated candidates.
void DecidePixel(const unsigned char* const lap[4], const unsigned char* const hsv[4], const bool maskedIn[4],
                 int thresholdS, int thresholdV, unsigned char* out);

}  // namespace holo4
