// WarpRadialAndScale: backward radial mapping in Q14 with bilinear sampling. All arithmetic
// is signed 32-bit and wraps on overflow (wild coefficients); shifts are arithmetic.
// warpPlain is the definition. Every output pixel is computed on its own, so the fast path
// splits output rows among threads, takes the per-column terms from a table, and runs the
// same integer steps on Highway vectors (32-bit lanes wrap like the scalar code).
#undef HWY_TARGET_INCLUDE
#define HWY_TARGET_INCLUDE "geometry/WarpRadialAndScale.cpp"
#include <hwy/foreach_target.h>  // IWYU pragma: keep
#include <hwy/highway.h>

#include "geometry/PixelPairs-inl.h"

#include <algorithm>
#include <cstring>
#include <vector>

#include "geometry/Geometry.h"
#include "geometry/GeometryInternal.h"
#include "imagelib/Parallel.h"
#include "imagelib/Trace.h"

#ifndef VARNOTH_GEOMETRY_RADIAL_SCALAR
#define VARNOTH_GEOMETRY_RADIAL_SCALAR
namespace geometry {

struct RadialQ14 {
    int32_t halfW = 0, halfH = 0;    // source half sizes, rounded
    int32_t stepX = 0, stepY = 0;    // output pixel pitch in Q14 of the -1 … +1 range
    int32_t K1 = 0, K2 = 0, K3 = 0;  // coefficients in Q13
    int32_t CX = 0, CY = 0;          // centre in Q14
};

// Offset from the centre along one axis in Q13, and its square in Q14.
struct AxisTerm {
    int32_t offset = 0, square = 0;
};

inline AxisTerm axisTerm(int index, int32_t step, int32_t centre) {
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
    const int32_t f = wrapAdd(wrap32(poly) >> 13, 8192);  // 8192 is 1.0
    xs = wrapMul(wrap32(static_cast<int64_t>(wrapMul(f, tx.offset) >> 12) + c.CX + 16384), c.halfW);
    ys = wrapMul(wrap32(static_cast<int64_t>(wrapMul(f, ty.offset) >> 12) + c.CY + 16384), c.halfH);
}

// Writes one output pixel from Q14 source position (xs, ys); 255 outside the source.
template <int BPP>
inline void sampleRadialPixel(const PixelGrid& in, int W, int H, int32_t xs, int32_t ys, unsigned char* out) {
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

// What a row kernel needs: the constants, src, and the per-column terms.
struct RadialRowJob {
    RadialQ14 c;
    PixelGrid in;
    const uint8_t* bits = nullptr;  // src's lowest address, base of the vector byte offsets
    int32_t span = 0, width = 0, height = 0;
    bool vectorOffsets = false;  // every byte offset of src fits 32 bits
    const int32_t* columnOffsets = nullptr;
    const int32_t* columnSquares = nullptr;
    int outWidth = 0;
};

}  // namespace geometry
#endif  // VARNOTH_GEOMETRY_RADIAL_SCALAR

HWY_BEFORE_NAMESPACE();
namespace geometry {
namespace HWY_NAMESPACE {
namespace hn = hwy::HWY_NAMESPACE;

template <int BPP>
HWY_INLINE void radialPixelsScalar(const RadialRowJob& job, const AxisTerm& row, int first, int end, uint8_t* out) {
    for (int i = first; i < end; ++i, out += BPP) {
        int32_t xs = 0, ys = 0;
        radialSource(job.c, AxisTerm{job.columnOffsets[i], job.columnSquares[i]}, row, xs, ys);
        sampleRadialPixel<BPP>(job.in, job.width, job.height, xs, ys, out);
    }
}

#if HWY_TARGET != HWY_SCALAR
// (s00·w00 + s10·w10 + s01·w01 + s11·w11 + 8192) >> 14 per lane.
HWY_INLINE V32 blendQ14(const ChannelQuad& s, V32 w00, V32 w10, V32 w01, V32 w11) {
    const D32 d;
    const V32 sum = hn::Add(hn::Add(hn::Mul(s.s00, w00), hn::Mul(s.s10, w10)), hn::Add(hn::Mul(s.s01, w01), hn::Mul(s.s11, w11)));
    return hn::ShiftRight<14>(hn::Add(sum, hn::Set(d, 8192)));
}

// radialSource on every lane.
HWY_INLINE void radialSourceLanes(const RadialQ14& c, V32 dx, V32 dxSquare, V32 dy, V32 dySquare, V32& xs, V32& ys) {
    const D32 d;
    const V32 r2 = hn::ShiftRight<1>(hn::Add(dxSquare, dySquare));
    const V32 r4 = hn::ShiftRight<13>(hn::Mul(r2, r2));
    const V32 r6 = hn::ShiftRight<13>(hn::Mul(r4, r2));
    const V32 poly = hn::Add(hn::Add(hn::Mul(r6, hn::Set(d, c.K3)), hn::Mul(r4, hn::Set(d, c.K2))), hn::Mul(r2, hn::Set(d, c.K1)));
    const V32 f = hn::Add(hn::ShiftRight<13>(poly), hn::Set(d, 8192));
    const V32 originX = hn::Add(hn::Set(d, c.CX), hn::Set(d, 16384));
    const V32 originY = hn::Add(hn::Set(d, c.CY), hn::Set(d, 16384));
    xs = hn::Mul(hn::Add(hn::ShiftRight<12>(hn::Mul(f, dx)), originX), hn::Set(d, c.halfW));
    ys = hn::Mul(hn::Add(hn::ShiftRight<12>(hn::Mul(f, dy)), originY), hn::Set(d, c.halfH));
}
#endif

// One output row. Vector groups whose lanes are each either fully inside src (and, for
// colour, not in its first column) or outside it are sampled in vector form; other groups
// fall back to the scalar rule pixel by pixel.
template <int BPP>
void warpRadialRow(const RadialRowJob& job, int j, uint8_t* out) {
    const AxisTerm row = axisTerm(j, job.c.stepY, job.c.CY);
    int i = 0;
#if HWY_TARGET != HWY_SCALAR
    const D32 d;
    const hn::RebindToUnsigned<D32> du;
    const int lanes = static_cast<int>(hn::Lanes(d));
    if (job.vectorOffsets && job.width >= 4 && job.height >= 2) {
        const V32 dy = hn::Set(d, row.offset), dySquare = hn::Set(d, row.square);
        const int firstX = BPP == 3 ? 1 : 0;  // colour pairs are read from two bytes before the pixel
        const auto xRange = hn::Set(du, static_cast<uint32_t>(job.width - 1 - firstX));
        const auto yRange = hn::Set(du, static_cast<uint32_t>(job.height - 1));
        const V32 lastRow = hn::Set(d, job.height - 1), span = hn::Set(d, job.span), kLow = hn::Set(d, 16383);
        const V32 k16384 = hn::Set(d, 16384), white = hn::Set(d, BPP == 3 ? 0xFFFFFF : 0xFF);
        const V32 safeOffset = hn::Set(d, BPP == 3 ? 2 : 0);
        for (; i + lanes <= job.outWidth; i += lanes, out += lanes * BPP) {
            V32 xs, ys;
            radialSourceLanes(job.c, hn::LoadU(d, job.columnOffsets + i), hn::LoadU(d, job.columnSquares + i), dy, dySquare,
                              xs, ys);
            const V32 ix = hn::ShiftRight<14>(xs), iy = hn::ShiftRight<14>(ys);
            const auto xInside = hn::Lt(hn::BitCast(du, ix), hn::Set(du, static_cast<uint32_t>(job.width - 1)));
            const auto yInside = hn::Lt(hn::BitCast(du, iy), yRange);
            const M32 inside = hn::RebindMask(d, hn::And(xInside, yInside));
            const M32 usable = hn::RebindMask(
                d, hn::And(hn::Lt(hn::BitCast(du, hn::Sub(ix, hn::Set(d, firstX))), xRange), yInside));
            // Lanes inside src but not usable (colour, first column) need the scalar rule.
            if (!hn::AllFalse(d, hn::AndNot(usable, inside))) {
                radialPixelsScalar<BPP>(job, row, i, i + lanes, out);
                continue;
            }
            if (hn::AllFalse(d, usable)) {
                storePixels<BPP>(white, out);
                continue;
            }
            const V32 u = hn::And(xs, kLow), v = hn::And(ys, kLow);
            const V32 left = hn::ShiftRight<1>(hn::Sub(k16384, u)), right = hn::ShiftRight<1>(u);
            const V32 top = hn::ShiftRight<1>(hn::Sub(k16384, v)), bottom = hn::ShiftRight<1>(v);
            const V32 w00 = hn::ShiftRight<12>(hn::Mul(left, top)), w10 = hn::ShiftRight<12>(hn::Mul(right, top));
            const V32 w01 = hn::ShiftRight<12>(hn::Mul(left, bottom)), w11 = hn::ShiftRight<12>(hn::Mul(right, bottom));
            const V32 at00 = hn::IfThenElse(
                usable, hn::Add(hn::Mul(hn::Sub(lastRow, iy), span), hn::Mul(ix, hn::Set(d, BPP))), safeOffset);
            const V32 at01 = hn::IfThenElse(usable, hn::Sub(at00, span), safeOffset);
            V32 low00, high00, low01, high01;
            loadNeighbourPairs<BPP>(job.bits, at00, low00, high00);
            loadNeighbourPairs<BPP>(job.bits, at01, low01, high01);
            V32 result = hn::Zero(d);
            for (int ch = 0; ch < BPP; ++ch) {
                const V32 channel = blendQ14(channelOf<BPP>(low00, high00, low01, high01, ch), w00, w10, w01, w11);
                result = hn::Or(result, hn::ShiftLeftSame(channel, 8 * ch));
            }
            storePixels<BPP>(hn::IfThenElse(usable, result, white), out);
        }
    }
#endif
    radialPixelsScalar<BPP>(job, row, i, job.outWidth, out);
}

void WarpRadialRowGrey(const RadialRowJob& job, int j, uint8_t* out) { warpRadialRow<1>(job, j, out); }
void WarpRadialRowColour(const RadialRowJob& job, int j, uint8_t* out) { warpRadialRow<3>(job, j, out); }

}  // namespace HWY_NAMESPACE
}  // namespace geometry
HWY_AFTER_NAMESPACE();

#if HWY_ONCE
namespace geometry {
namespace {

HWY_EXPORT(WarpRadialRowGrey);
HWY_EXPORT(WarpRadialRowColour);

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

template <int BPP>
void warpPlain(const RadialQ14& c, const CImage& src, CImage& dst) {
    const PixelGrid in = PixelGrid::of(src);
    const int W = src.GetWidth(), H = src.GetHeight();
    for (int j = 0; j < dst.GetHeight(); ++j) {
        for (int i = 0; i < dst.GetWidth(); ++i) {
            int32_t xs = 0, ys = 0;
            radialSource(c, axisTerm(i, c.stepX, c.CX), axisTerm(j, c.stepY, c.CY), xs, ys);
            sampleRadialPixel<BPP>(in, W, H, xs, ys, dst.GetPtrXY(i, j));
        }
    }
}

void warpFast(const RadialQ14& c, const CImage& src, CImage& dst) {
    const int outW = dst.GetWidth();
    std::vector<int32_t> offsets(static_cast<size_t>(outW)), squares(static_cast<size_t>(outW));
    for (int i = 0; i < outW; ++i) {
        const AxisTerm t = axisTerm(i, c.stepX, c.CX);
        offsets[static_cast<size_t>(i)] = t.offset;
        squares[static_cast<size_t>(i)] = t.square;
    }
    RadialRowJob job;
    job.c = c;
    job.in = PixelGrid::of(src);
    job.bits = src.GetBits();
    job.span = src.GetSpan();
    job.width = src.GetWidth();
    job.height = src.GetHeight();
    job.vectorOffsets = src.GetSize() < (static_cast<size_t>(1) << 31) - 64;
    job.columnOffsets = offsets.data();
    job.columnSquares = squares.data();
    job.outWidth = outW;
    const PixelGrid out = PixelGrid::of(dst);
    const bool grey = src.GetBitCount() == 8;
    imagelib::ParallelFor(
        0, dst.GetHeight(),
        [&](int begin, int end) {
            for (int j = begin; j < end; ++j) {
                if (grey)
                    HWY_DYNAMIC_DISPATCH(WarpRadialRowGrey)(job, j, out.row(j));
                else
                    HWY_DYNAMIC_DISPATCH(WarpRadialRowColour)(job, j, out.row(j));
            }
        },
        std::max(1, 16384 / outW));
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
    if (kernel == Kernel::Fast)
        warpFast(c, source, dst);
    else if (grey)
        warpPlain<1>(c, source, dst);
    else
        warpPlain<3>(c, source, dst);
    return true;
}

}  // namespace geometry

bool WarpRadialAndScale(const float* p, const CImage& src, CImage& dst) {
    return geometry::warpRadialAndScaleWith(p, src, dst, geometry::Kernel::Fast);
}
#endif  // HWY_ONCE
