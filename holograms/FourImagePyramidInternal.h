#pragma once

#include <functional>

#include "holograms/FourImageInternal.h"
#include "imagelib/CImage.h"
#include "pyramid/Pyramid.h"

// Pieces of the pyramid compositions, exposed to the tests (not exported).
namespace holo4 {

constexpr int kSaturatedBrightness = 240;  // a Gaussian pixel this bright is saturated
constexpr int kPeakSpread = 7;             // detail peaks closer than this count as alike
constexpr int kBrightLimit3 = 250;         // HologramsRemove4Img3 takes candidates below this

// The seven-level Laplacian pyramid of each candidate and the brightness (largest channel,
// 8-bit) of every pixel of the Gaussian levels it was built from.
struct CandidatePyramids {
    CPyramid laplacian[4];
    CImage brightness[4][kLevels];
};
void BuildCandidatePyramids(const CImage* const images[4], CandidatePyramids& pyramids);

// Row y of one level of the four candidates: the Laplacian rows and the brightness rows.
struct CandidateLevelRows {
    const unsigned char* lap[4];
    const unsigned char* bright[4];

    CandidateLevelRows(const CandidatePyramids& c, int level, int y) {
        for (int i = 0; i < 4; ++i) {
            lap[i] = c.laplacian[i].GetLevel(level).GetPtrXY(0, y);
            bright[i] = c.brightness[i][level].GetPtrXY(0, y);
        }
    }
};

// out[x] = largest channel of 24-bit pixel x; plain [begin, end) and fast whole-row forms.
void BrightnessRow(const unsigned char* pixels, unsigned char* out, int begin, int end);
void BrightnessRowFast(const unsigned char* pixels, unsigned char* out, int width);

// Collapses a Laplacian result pyramid and moves its level 0 into `out`; the pyramid is
// not to be used afterwards.
void CollapseInto(CPyramid& result, CImage& out);

// Splits [0, height) into row bands over the worker threads; returns when all are done.
void ForEachRowBand(int height, const std::function<void(int, int)>& body);

// One pixel of levels 5..0 of HologramsRemove4Img from the candidates' detail pixels and
// brightness values (candidate order top, bottom, right, left). Row rules below take the
// candidates' detail rows (3 bytes a pixel) and brightness rows (1 byte a pixel).
void ComposePixel(const unsigned char* const detail[4], const int bright[4], unsigned char* out);

// Row rules of the two compositions. The plain forms take the pixels [begin, end) of rows
// given by their start; they define the bytes. The fast forms do whole rows with vectors.
void DarkerOfFirstTwoRow(const unsigned char* const lap[4], unsigned char* out, int width);
void ComposePixels(const unsigned char* const lap[4], const unsigned char* const bright[4], unsigned char* out,
                   int begin, int end);
void FlattestUnsaturatedPixels(const unsigned char* const lap[4], const unsigned char* const bright[4],
                               unsigned char* out, int begin, int end);
void ComposeRowFast(const unsigned char* const lap[4], const unsigned char* const bright[4], unsigned char* out,
                    int width);
void FlattestUnsaturatedRowFast(const unsigned char* const lap[4], const unsigned char* const bright[4],
                                unsigned char* out, int width);

}  // namespace holo4
