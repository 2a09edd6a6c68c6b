#pragma once

// Shared helpers of the geometry operations and the plain reference kernels that the tests
// compare the fast ones against. Not exported.

#include <cmath>
#include <cstddef>
#include <cstdint>

#include "imagelib/CImage.h"
#include "imagelib/Types.h"

namespace geometry {

// Float-to-int truncation toward zero as the scanner's x86 code does it: a value that does not
// fit (or NaN) gives INT32_MIN instead of undefined behaviour.
inline int32_t truncToInt(double v) {
    if (!(v > -2147483649.0 && v < 2147483648.0)) return INT32_MIN;
    return static_cast<int32_t>(v);
}

// Signed 32-bit arithmetic that wraps like the hardware does; used where extreme maps or
// coefficients can overflow, so results stay defined (and equal to the wrapped ones).
inline int32_t wrap32(int64_t v) { return static_cast<int32_t>(static_cast<uint32_t>(static_cast<uint64_t>(v))); }
inline int32_t wrapAdd(int32_t a, int32_t b) { return wrap32(static_cast<int64_t>(a) + b); }
inline int32_t wrapMul(int32_t a, int32_t b) { return wrap32(static_cast<int64_t>(a) * b); }

inline bool isGreyOrColour(const CImage& img) { return img.GetBitCount() == 8 || img.GetBitCount() == 24; }

// The source to read from: src itself, or a copy kept in `keep` when the caller passed the
// same image as source and destination (writing dst would otherwise change or free it).
inline const CImage& distinctSource(const CImage& src, const CImage& dst, CImage& keep) {
    if (&src != &dst) return src;
    keep = src;
    return keep;
}

// Pixel addressing without a call per pixel: rows are stored bottom-up, so row y + 1 lies
// one span lower in memory. Only valid for a non-empty image.
struct PixelGrid {
    unsigned char* row0 = nullptr;  // pixel (0, 0)
    ptrdiff_t rowStep = 0;          // bytes from row y to row y + 1 (negative)
    int bpp = 0;                    // bytes per pixel

    static PixelGrid of(const CImage& img) {
        PixelGrid grid;
        grid.row0 = const_cast<unsigned char*>(img.GetPtrXY(0, 0));
        grid.rowStep = -static_cast<ptrdiff_t>(img.GetSpan());
        grid.bpp = img.GetBitCount() / 8;
        return grid;
    }
    unsigned char* row(int y) const { return row0 + y * rowStep; }
    unsigned char* at(int x, int y) const { return row(y) + static_cast<ptrdiff_t>(x) * bpp; }
};

// ---- WarpAffine -----------------------------------------------------------------------

// Which inner loop samples the output: the plain one is the definition, the fast one runs
// rows in parallel with unrolled per-depth kernels. Both give the same bytes.
enum class Kernel { Plain, Fast };

// One warp's processing window in 16.16 source positions.
struct AffineSampling {
    int32_t startX = 0, startY = 0;  // source position of the first processed pixel
    int32_t colStepX = 0, colStepY = 0;
    int32_t rowStepX = 0, rowStepY = 0;
    int firstOutCol = 0, firstOutRow = 0;
    int cols = 0, rows = 0;
};

bool warpAffineWith(const float* m, const CImage& src, CImage& dst, bool fit, const SPoint* shift,
                    CPoint* corners, Kernel kernel);
void sampleAffinePlain(const CImage& src, CImage& dst, const AffineSampling& s);
void sampleAffineFast(const CImage& src, CImage& dst, const AffineSampling& s);

// ---- WarpRadialAndScale ---------------------------------------------------------------

bool warpRadialAndScaleWith(const float* p, const CImage& src, CImage& dst, Kernel kernel);

}  // namespace geometry
