// WarpRadialAndScale: backward radial mapping in Q14 with bilinear sampling. Every output
// pixel is computed on its own, so the fast path splits output rows among threads and takes
// the per-column terms from a table; the arithmetic itself is shared with the plain path.
// All arithmetic is signed 32-bit and wraps on overflow (wild coefficients), as the shifts
// are arithmetic.

#include <algorithm>
#include <cstring>
#include <vector>

#include "geometry/Geometry.h"
#include "geometry/GeometryInternal.h"
#include "imagelib/Parallel.h"
#include "imagelib/Trace.h"

namespace geometry {
namespace {

struct RadialQ14 {
    int32_t halfW = 0, halfH = 0;  // source half sizes, rounded
    int32_t stepX = 0, stepY = 0;  // output pixel pitch in Q14 of the -1 … +1 range
    int32_t K1 = 0, K2 = 0, K3 = 0;  // coefficients in Q13
    int32_t CX = 0, CY = 0;          // centre in Q14
};

RadialQ14 radialConstants(const float* p, const CImage& src, const CImage& dst) {
    RadialQ14 c;
    c.halfW = truncToInt(src.GetWidth() * 0.5 + 0.5);
    c.halfH = truncToInt(src.GetHeight() * 0.5 + 0.5);
    c.stepX = 32768 / dst.GetWidth();
    c.stepY = 32768 / dst.GetHeight();
    c.K1 = truncToInt(p[0] * 16384) >> 1;
    c.K2 = truncToInt(p[1] * 16384) >> 1;
    c.K3 = truncToInt(p[2] * 16384) >> 1;
    c.CX = truncToInt(p[3] * 16384);
    c.CY = truncToInt(p[4] * 16384);
    return c;
}

// Offset from the centre along one axis in Q13, and its square in Q14.
struct AxisTerm {
    int32_t offset = 0, square = 0;
};

AxisTerm axisTerm(int index, int32_t step, int32_t centre) {
    const int32_t q = -16384 + index * step;
    AxisTerm t;
    t.offset = wrap32(static_cast<int64_t>(q) - centre) >> 1;
    t.square = wrapMul(t.offset, t.offset) >> 12;
    return t;
}

// Source position in Q14 pixels of the output pixel with the given axis terms.
inline void radialSource(const RadialQ14& c, const AxisTerm& tx, const AxisTerm& ty, int32_t& xs, int32_t& ys) {
    const int32_t r2 = wrapAdd(tx.square, ty.square) >> 1;
    const int32_t r4 = wrapMul(r2, r2) >> 13;
    const int32_t r6 = wrapMul(r4, r2) >> 13;
    const int64_t poly = static_cast<int64_t>(wrapMul(r6, c.K3)) + wrapMul(r4, c.K2) + wrapMul(r2, c.K1);
    const int32_t f = wrapAdd(wrap32(poly) >> 13, 8192);
    xs = wrapMul(wrap32(static_cast<int64_t>(wrapMul(f, tx.offset) >> 12) + c.CX + 16384), c.halfW);
    ys = wrapMul(wrap32(static_cast<int64_t>(wrapMul(f, ty.offset) >> 12) + c.CY + 16384), c.halfH);
}

// Writes one output pixel from Q14 source position (xs, ys); 255 outside the source.
template <int BPP>
inline void samplePixel(const PixelGrid& in, int W, int H, int32_t xs, int32_t ys, unsigned char* out) {
    const int32_t ix = xs >> 14, iy = ys >> 14;
    if (ix < 0 || ix >= W - 1 || iy < 0 || iy >= H - 1) {
        std::memset(out, 255, BPP);
        return;
    }
    const int32_t u = xs & 16383, v = ys & 16383;
    const int32_t left = (16384 - u) >> 1, right = u >> 1, top = (16384 - v) >> 1, bottom = v >> 1;
    const int32_t w00 = (left * top) >> 12, w10 = (right * top) >> 12;
    const int32_t w01 = (left * bottom) >> 12, w11 = (right * bottom) >> 12;
    const unsigned char* p00 = in.at(ix, iy);
    const unsigned char* p01 = p00 + in.rowStep;
    for (int b = 0; b < BPP; ++b)
        out[b] = static_cast<unsigned char>(
            (p00[b] * w00 + p00[b + BPP] * w10 + p01[b] * w01 + p01[b + BPP] * w11 + 8192) >> 14);
}

template <int BPP>
void warpPlain(const RadialQ14& c, const CImage& src, CImage& dst) {
    const PixelGrid in = PixelGrid::of(src);
    const int W = src.GetWidth(), H = src.GetHeight();
    for (int j = 0; j < dst.GetHeight(); ++j) {
        for (int i = 0; i < dst.GetWidth(); ++i) {
            int32_t xs = 0, ys = 0;
            radialSource(c, axisTerm(i, c.stepX, c.CX), axisTerm(j, c.stepY, c.CY), xs, ys);
            samplePixel<BPP>(in, W, H, xs, ys, dst.GetPtrXY(i, j));
        }
    }
}

template <int BPP>
void warpFast(const RadialQ14& c, const CImage& src, CImage& dst) {
    const PixelGrid in = PixelGrid::of(src), out = PixelGrid::of(dst);
    const int W = src.GetWidth(), H = src.GetHeight(), outW = dst.GetWidth();
    std::vector<AxisTerm> columns(static_cast<size_t>(outW));
    for (int i = 0; i < outW; ++i) columns[static_cast<size_t>(i)] = axisTerm(i, c.stepX, c.CX);
    const int rowsPerTask = std::max(1, 16384 / outW);
    imagelib::ParallelFor(
        0, dst.GetHeight(),
        [&](int begin, int end) {
            for (int j = begin; j < end; ++j) {
                const AxisTerm row = axisTerm(j, c.stepY, c.CY);
                unsigned char* o = out.row(j);
                for (int i = 0; i < outW; ++i, o += BPP) {
                    int32_t xs = 0, ys = 0;
                    radialSource(c, columns[static_cast<size_t>(i)], row, xs, ys);
                    samplePixel<BPP>(in, W, H, xs, ys, o);
                }
            }
        },
        rowsPerTask);
}

}  // namespace

bool warpRadialAndScaleWith(const float* p, const CImage& src, CImage& dst, Kernel kernel) {
    if (src.GetBitCount() != dst.GetBitCount()) {
        Trace(L"WarpRadialAndScale - wrong dimensions\n");
        return false;
    }
    // The output pitch divides by dst's size; other depths are not pixels of bytes.
    if (dst.GetWidth() <= 0 || dst.GetHeight() <= 0 || !isGreyOrColour(src)) {
        Trace(L"WarpRadialAndScale - wrong dimensions\n");
        return false;
    }
    CImage keep;
    const CImage& source = distinctSource(src, dst, keep);
    const RadialQ14 c = radialConstants(p, source, dst);
    if (source.GetWidth() <= 0 || source.GetHeight() <= 0) {
        dst.Set(255);  // every output pixel lies outside an empty source
        return true;
    }
    const bool grey = source.GetBitCount() == 8;
    if (kernel == Kernel::Plain)
        grey ? warpPlain<1>(c, source, dst) : warpPlain<3>(c, source, dst);
    else
        grey ? warpFast<1>(c, source, dst) : warpFast<3>(c, source, dst);
    return true;
}

}  // namespace geometry

bool WarpRadialAndScale(const float* p, const CImage& src, CImage& dst) {
    return geometry::warpRadialAndScaleWith(p, src, dst, geometry::Kernel::Fast);
}
