// WarpAffine's sampling: 16.16 bilinear with the 254 cap. The plain loop is the definition;
// the fast one splits output rows among threads and walks memory through row pointers.
// Positions advance with wrapping 32-bit additions, so row r of the fast loop starts at
// start + r·rowStep (mod 2^32), the same value the plain loop reaches by r additions.

#include <algorithm>

#include "geometry/GeometryInternal.h"
#include "imagelib/Parallel.h"

namespace geometry {
namespace {

struct BilinearWeights {
    int32_t w00, w10, w01, w11;
};

inline BilinearWeights weightsOf(int32_t X, int32_t Y) {
    const int32_t u = X & 0xFFFF, v = Y & 0xFFFF;
    const int32_t left = (65536 - u) >> 1, right = u >> 1;
    const int32_t top = (65536 - v) >> 1, bottom = v >> 1;
    return {(left * top) >> 14, (right * top) >> 14, (left * bottom) >> 14, (right * bottom) >> 14};
}

inline unsigned char blend(int s00, int s10, int s01, int s11, const BilinearWeights& w) {
    return static_cast<unsigned char>(std::min(254, (s00 * w.w00 + s10 * w.w10 + s01 * w.w01 + s11 * w.w11) >> 16));
}

inline unsigned char capped(unsigned char b) { return std::min<unsigned char>(b, 254); }

uint32_t asBits(int32_t v) { return static_cast<uint32_t>(v); }

}  // namespace

void sampleAffinePlain(const CImage& src, CImage& dst, const AffineSampling& s) {
    const int W = src.GetWidth(), H = src.GetHeight(), bpp = src.GetBitCount() / 8;
    int32_t rowX = s.startX, rowY = s.startY;
    for (int r = 0; r < s.rows; ++r) {
        int32_t X = rowX, Y = rowY;
        for (int i = 0; i < s.cols; ++i) {
            const int sx = X >> 16, sy = Y >> 16;
            if (sx >= 0 && sy >= 0 && sx < W && sy < H) {
                unsigned char* out = dst.GetPtrXY(s.firstOutCol + i, s.firstOutRow + r);
                const unsigned char* p00 = src.GetPtrXY(sx, sy);
                if (sx + 1 < W && sy + 1 < H) {
                    const unsigned char* p10 = src.GetPtrXY(sx + 1, sy);
                    const unsigned char* p01 = src.GetPtrXY(sx, sy + 1);
                    const unsigned char* p11 = src.GetPtrXY(sx + 1, sy + 1);
                    const BilinearWeights w = weightsOf(X, Y);
                    for (int c = 0; c < bpp; ++c) out[c] = blend(p00[c], p10[c], p01[c], p11[c], w);
                } else {
                    for (int c = 0; c < bpp; ++c) out[c] = capped(p00[c]);
                }
            }
            X = wrapAdd(X, s.colStepX);
            Y = wrapAdd(Y, s.colStepY);
        }
        rowX = wrapAdd(rowX, s.rowStepX);
        rowY = wrapAdd(rowY, s.rowStepY);
    }
}

namespace {

template <int BPP>
void sampleAffineRow(const PixelGrid& in, int W, int H, unsigned char* out, int cols, uint32_t X, uint32_t Y,
                     uint32_t stepX, uint32_t stepY) {
    const ptrdiff_t down = in.rowStep;
    for (int i = 0; i < cols; ++i, out += BPP, X += stepX, Y += stepY) {
        const int32_t sx = static_cast<int32_t>(X) >> 16, sy = static_cast<int32_t>(Y) >> 16;
        // One unsigned compare per axis covers both "negative" and "beyond the last".
        if (static_cast<uint32_t>(sx) >= static_cast<uint32_t>(W) || static_cast<uint32_t>(sy) >= static_cast<uint32_t>(H))
            continue;
        const unsigned char* p00 = in.row0 + sy * down + sx * BPP;
        if (sx + 1 < W && sy + 1 < H) {
            const BilinearWeights w = weightsOf(static_cast<int32_t>(X), static_cast<int32_t>(Y));
            const unsigned char* p01 = p00 + down;
            for (int c = 0; c < BPP; ++c) out[c] = blend(p00[c], p00[c + BPP], p01[c], p01[c + BPP], w);
        } else {
            for (int c = 0; c < BPP; ++c) out[c] = capped(p00[c]);
        }
    }
}

template <int BPP>
void sampleAffineRows(const CImage& src, CImage& dst, const AffineSampling& s) {
    const PixelGrid in = PixelGrid::of(src), out = PixelGrid::of(dst);
    const int W = src.GetWidth(), H = src.GetHeight();
    const int rowsPerTask = std::max(1, 16384 / std::max(1, s.cols));
    imagelib::ParallelFor(
        0, s.rows,
        [&](int begin, int end) {
            for (int r = begin; r < end; ++r) {
                const uint32_t X = asBits(s.startX) + asBits(r) * asBits(s.rowStepX);
                const uint32_t Y = asBits(s.startY) + asBits(r) * asBits(s.rowStepY);
                sampleAffineRow<BPP>(in, W, H, out.at(s.firstOutCol, s.firstOutRow + r), s.cols, X, Y,
                                     asBits(s.colStepX), asBits(s.colStepY));
            }
        },
        rowsPerTask);
}

}  // namespace

void sampleAffineFast(const CImage& src, CImage& dst, const AffineSampling& s) {
    if (src.GetBitCount() == 8)
        sampleAffineRows<1>(src, dst, s);
    else
        sampleAffineRows<3>(src, dst, s);
}

}  // namespace geometry
