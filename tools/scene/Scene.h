#pragma once

#include <cstdint>

#include "imagelib/CImage.h"

// Synthetic identity-card-like documents photographed under four directional lights, with
// the ground truth under even diffuse light. Used by the demo, the tests and the benchmarks
// of the glare removal; deterministic from the seed on every platform (own random
// generator, no library distributions).
namespace scene {

struct SceneOptions {
    int width = 1240;  // A4 ratio at 150 dpi; 2480 x 3508 is an A4 page at 300 dpi
    int height = 1754;
    uint32_t seed = 1;
};

// Light directions in the order the four-image operations take them.
enum Light { LightTop = 0, LightBottom = 1, LightLeft = 2, LightRight = 3 };

struct Scene {
    CImage shots[4];   // 24-bit, indexed by Light
    CImage truth;      // 24-bit: the document under even, diffuse light
    CImage glare;      // 8-bit: bit k set where shot k shows glare (specular or foil shine)
    CImage document;   // 8-bit: 255 on the card, 0 on the table around it
};

// Builds the scene; sizes below 16 x 16 are raised to 16.
Scene GenerateScene(const SceneOptions& options);

// Quality of a glare-free composite against the scene.
struct Quality {
    double psnr = 0.0;            // dB over the document pixels (luma-independent: all channels)
    double glareRemaining = 0.0;  // share of the pixels glaring in some shot that still glare
    int glarePixels = 0;          // pixels glaring in some shot (document only)
};

// A pixel still glares when its brightest channel is at least 40 above the truth's or it
// is near white (250 or more in every channel) where the truth is not.
bool IsGlare(const unsigned char* pixel, const unsigned char* truthPixel);

Quality Evaluate(const Scene& scene, const CImage& result);

// Share of the document's glare pixels that glare in `image` (a shot or a result).
double GlareShare(const Scene& scene, const CImage& image);

}  // namespace scene
