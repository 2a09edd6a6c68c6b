// WarpAffine's sampling: 16.16 bilinear with the 254 cap. sampleAffinePlain is the
// definition. The fast path splits output rows among threads; within a row, groups of
// pixels whose four source neighbours all lie inside src are sampled with Highway vectors
// (the same integer weights on 32-bit lanes), every other pixel by the scalar rule.
// Positions advance with wrapping 32-bit additions, so pixel i of row r sits at
// start + r·rowStep + i·colStep (mod 2^32), the value the plain loop reaches by additions.
#undef HWY_TARGET_INCLUDE
#define HWY_TARGET_INCLUDE "geometry/WarpAffineKernels.cpp"
#include <hwy/foreach_target.h>  // IWYU pragma: keep
#include <hwy/highway.h>

#include "geometry/PixelPairs-inl.h"

#include <algorithm>
#include <cstring>

#include "geometry/GeometryInternal.h"
#include "imagelib/Parallel.h"

#ifndef VARNOTH_GEOMETRY_AFFINE_SOURCE
#define VARNOTH_GEOMETRY_AFFINE_SOURCE
namespace geometry {

// What a row kernel needs of src.
struct AffineSource {
    const uint8_t* bits = nullptr;  // lowest address: the bottom row
    const uint8_t* row0 = nullptr;  // pixel (0, 0)
    ptrdiff_t down = 0;             // bytes from row y to row y + 1 (negative: rows are bottom-up)
    int32_t span = 0;
    int32_t width = 0, height = 0;
    bool vectorOffsets = false;  // every byte offset of src fits a 32-bit lane
};

// One output row: `cols` pixels from 16.16 position (x, y), stepping by (stepX, stepY).
struct AffineRow {
    uint8_t* out = nullptr;
    int cols = 0;
    uint32_t x = 0, y = 0, stepX = 0, stepY = 0;
};

}  // namespace geometry
#endif

HWY_BEFORE_NAMESPACE();
namespace geometry {
namespace HWY_NAMESPACE {
namespace hn = hwy::HWY_NAMESPACE;

template <int BPP>
HWY_INLINE void samplePixelScalar(const AffineSource& s, uint32_t X, uint32_t Y, uint8_t* out) {
    const int32_t sx = static_cast<int32_t>(X) >> 16, sy = static_cast<int32_t>(Y) >> 16;
    // One unsigned compare per axis covers both "negative" and "beyond the last".
    if (static_cast<uint32_t>(sx) >= static_cast<uint32_t>(s.width) ||
        static_cast<uint32_t>(sy) >= static_cast<uint32_t>(s.height))
        return;
    const uint8_t* p00 = s.row0 + sy * s.down + sx * BPP;
    if (sx + 1 < s.width && sy + 1 < s.height) {
        const int32_t u = static_cast<int32_t>(X & 0xFFFF), v = static_cast<int32_t>(Y & 0xFFFF);
        const int32_t left = (65536 - u) >> 1, right = u >> 1, top = (65536 - v) >> 1, bottom = v >> 1;
        const int32_t w00 = (left * top) >> 14, w10 = (right * top) >> 14;
        const int32_t w01 = (left * bottom) >> 14, w11 = (right * bottom) >> 14;
        const uint8_t* p01 = p00 + s.down;
        for (int c = 0; c < BPP; ++c)
            out[c] = static_cast<uint8_t>(
                std::min(254, (p00[c] * w00 + p00[c + BPP] * w10 + p01[c] * w01 + p01[c + BPP] * w11) >> 16));
    } else {
        for (int c = 0; c < BPP; ++c) out[c] = std::min<uint8_t>(p00[c], 254);
    }
}

template <int BPP>
HWY_INLINE void sampleScalar(const AffineSource& s, uint8_t* out, int count, uint32_t X, uint32_t Y,
                             uint32_t stepX, uint32_t stepY) {
    for (int i = 0; i < count; ++i, out += BPP, X += stepX, Y += stepY) samplePixelScalar<BPP>(s, X, Y, out);
}

#if HWY_TARGET != HWY_SCALAR
// min(254, (s00·w00 + s10·w10 + s01·w01 + s11·w11) >> 16) per lane.
HWY_INLINE V32 blend(const ChannelQuad& s, V32 w00, V32 w10, V32 w01, V32 w11) {
    const D32 d;
    const V32 sum = hn::Add(hn::Add(hn::Mul(s.s00, w00), hn::Mul(s.s10, w10)), hn::Add(hn::Mul(s.s01, w01), hn::Mul(s.s11, w11)));
    return hn::Min(hn::ShiftRight<16>(sum), hn::Set(d, 254));
}

// Bilinear bytes of every lane, packed B | G << 8 | R << 16 (grey in the low byte). Lanes
// outside `usable` read the first source bytes instead and give meaningless values.
template <int BPP>
HWY_INLINE V32 sampleLanes(const AffineSource& s, V32 vx, V32 vy, M32 usable) {
    const D32 d;
    const V32 sx = hn::ShiftRight<16>(vx), sy = hn::ShiftRight<16>(vy);
    const V32 k65536 = hn::Set(d, 65536), kLow = hn::Set(d, 0xFFFF);
    const V32 u = hn::And(vx, kLow), v = hn::And(vy, kLow);
    const V32 left = hn::ShiftRight<1>(hn::Sub(k65536, u)), right = hn::ShiftRight<1>(u);
    const V32 top = hn::ShiftRight<1>(hn::Sub(k65536, v)), bottom = hn::ShiftRight<1>(v);
    const V32 w00 = hn::ShiftRight<14>(hn::Mul(left, top)), w10 = hn::ShiftRight<14>(hn::Mul(right, top));
    const V32 w01 = hn::ShiftRight<14>(hn::Mul(left, bottom)), w11 = hn::ShiftRight<14>(hn::Mul(right, bottom));
    const V32 span = hn::Set(d, s.span);
    const V32 firstByte = hn::Set(d, BPP == 3 ? 2 : 0);  // a safe place to read for unusable lanes
    const V32 at00 = hn::IfThenElse(
        usable, hn::Add(hn::Mul(hn::Sub(hn::Set(d, s.height - 1), sy), span), hn::Mul(sx, hn::Set(d, BPP))), firstByte);
    const V32 at01 = hn::IfThenElse(usable, hn::Sub(at00, span), firstByte);
    V32 low00, high00, low01, high01;
    loadNeighbourPairs<BPP>(s.bits, at00, low00, high00);
    loadNeighbourPairs<BPP>(s.bits, at01, low01, high01);
    V32 result = hn::Zero(d);
    for (int c = 0; c < BPP; ++c) {
        const V32 channel = blend(channelOf<BPP>(low00, high00, low01, high01, c), w00, w10, w01, w11);
        result = hn::Or(result, hn::ShiftLeftSame(channel, 8 * c));
    }
    return result;
}

// A group of pixels whose lanes are not all usable: usable lanes from the vector result,
// the others by the scalar rule (edges of src, outside src).
template <int BPP>
HWY_INLINE void storeMixedGroup(const AffineSource& s, V32 result, M32 usable, uint8_t* out, uint32_t X,
                                uint32_t Y, uint32_t stepX, uint32_t stepY) {
    const D32 d;
    HWY_ALIGN int32_t values[kMaxLanes], flags[kMaxLanes];
    hn::Store(result, d, values);
    hn::Store(hn::VecFromMask(d, usable), d, flags);
    const int lanes = static_cast<int>(hn::Lanes(d));
    for (int j = 0; j < lanes; ++j, out += BPP, X += stepX, Y += stepY) {
        if (flags[j] != 0)
            std::memcpy(out, &values[j], BPP);
        else
            samplePixelScalar<BPP>(s, X, Y, out);
    }
}

#endif

template <int BPP>
void sampleRow(const AffineSource& s, const AffineRow& row) {
    uint8_t* out = row.out;
    uint32_t X = row.x, Y = row.y;
    int i = 0;
#if HWY_TARGET != HWY_SCALAR
    const D32 d;
    const hn::RebindToUnsigned<D32> du;
    const int lanes = static_cast<int>(hn::Lanes(d));
    if (s.vectorOffsets && s.width >= 4 && s.height >= 2) {
        const V32 laneX = hn::Mul(hn::Iota(d, 0), hn::Set(d, static_cast<int32_t>(row.stepX)));
        const V32 laneY = hn::Mul(hn::Iota(d, 0), hn::Set(d, static_cast<int32_t>(row.stepY)));
        const uint32_t groupX = row.stepX * static_cast<uint32_t>(lanes), groupY = row.stepY * static_cast<uint32_t>(lanes);
        // Vector lanes need sx + 1 < W and sy + 1 < H; colour pixels are read from two bytes
        // before them, so they also need sx >= 1 to stay inside the row.
        const int firstX = BPP == 3 ? 1 : 0;
        const auto xRange = hn::Set(du, static_cast<uint32_t>(s.width - 1 - firstX));
        const auto yRange = hn::Set(du, static_cast<uint32_t>(s.height - 1));
        for (; i + lanes <= row.cols; i += lanes, X += groupX, Y += groupY, out += lanes * BPP) {
            const V32 vx = hn::Add(hn::Set(d, static_cast<int32_t>(X)), laneX);
            const V32 vy = hn::Add(hn::Set(d, static_cast<int32_t>(Y)), laneY);
            const V32 sx = hn::ShiftRight<16>(vx), sy = hn::ShiftRight<16>(vy);
            const auto usableU = hn::And(hn::Lt(hn::BitCast(du, hn::Sub(sx, hn::Set(d, firstX))), xRange),
                                         hn::Lt(hn::BitCast(du, sy), yRange));
            const M32 usable = hn::RebindMask(d, usableU);
            if (hn::AllFalse(d, usable)) {
                sampleScalar<BPP>(s, out, lanes, X, Y, row.stepX, row.stepY);
                continue;
            }
            const V32 result = sampleLanes<BPP>(s, vx, vy, usable);
            if (hn::AllTrue(d, usable))
                storePixels<BPP>(result, out);
            else
                storeMixedGroup<BPP>(s, result, usable, out, X, Y, row.stepX, row.stepY);
        }
    }
#endif
    sampleScalar<BPP>(s, out, row.cols - i, X, Y, row.stepX, row.stepY);
}

void SampleAffineRowGrey(const AffineSource& s, const AffineRow& row) { sampleRow<1>(s, row); }
void SampleAffineRowColour(const AffineSource& s, const AffineRow& row) { sampleRow<3>(s, row); }

}  // namespace HWY_NAMESPACE
}  // namespace geometry
HWY_AFTER_NAMESPACE();

#if HWY_ONCE
namespace geometry {

HWY_EXPORT(SampleAffineRowGrey);
HWY_EXPORT(SampleAffineRowColour);

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
                    const int u = X & 0xFFFF, v = Y & 0xFFFF;
                    const int w00 = ((65536 - u) >> 1) * ((65536 - v) >> 1) >> 14;
                    const int w10 = (u >> 1) * ((65536 - v) >> 1) >> 14;
                    const int w01 = ((65536 - u) >> 1) * (v >> 1) >> 14;
                    const int w11 = (u >> 1) * (v >> 1) >> 14;
                    for (int c = 0; c < bpp; ++c)
                        out[c] = static_cast<unsigned char>(
                            std::min(254, (p00[c] * w00 + p10[c] * w10 + p01[c] * w01 + p11[c] * w11) >> 16));
                } else {
                    for (int c = 0; c < bpp; ++c) out[c] = std::min<unsigned char>(p00[c], 254);
                }
            }
            X = wrapAdd(X, s.colStepX);
            Y = wrapAdd(Y, s.colStepY);
        }
        rowX = wrapAdd(rowX, s.rowStepX);
        rowY = wrapAdd(rowY, s.rowStepY);
    }
}

void sampleAffineFast(const CImage& src, CImage& dst, const AffineSampling& s) {
    AffineSource source;
    source.bits = src.GetBits();
    source.row0 = src.GetPtrXY(0, 0);
    source.down = -static_cast<ptrdiff_t>(src.GetSpan());
    source.span = src.GetSpan();
    source.width = src.GetWidth();
    source.height = src.GetHeight();
    source.vectorOffsets = src.GetSize() < (static_cast<size_t>(1) << 31) - 64;
    const PixelGrid out = PixelGrid::of(dst);
    const bool grey = src.GetBitCount() == 8;
    const uint32_t startX = static_cast<uint32_t>(s.startX), startY = static_cast<uint32_t>(s.startY);
    const uint32_t rowStepX = static_cast<uint32_t>(s.rowStepX), rowStepY = static_cast<uint32_t>(s.rowStepY);
    const int rowsPerTask = std::max(1, 16384 / std::max(1, s.cols));
    imagelib::ParallelFor(
        0, s.rows,
        [&](int begin, int end) {
            for (int r = begin; r < end; ++r) {
                AffineRow row;
                row.out = out.at(s.firstOutCol, s.firstOutRow + r);
                row.cols = s.cols;
                row.x = startX + static_cast<uint32_t>(r) * rowStepX;
                row.y = startY + static_cast<uint32_t>(r) * rowStepY;
                row.stepX = static_cast<uint32_t>(s.colStepX);
                row.stepY = static_cast<uint32_t>(s.colStepY);
                if (grey)
                    HWY_DYNAMIC_DISPATCH(SampleAffineRowGrey)(source, row);
                else
                    HWY_DYNAMIC_DISPATCH(SampleAffineRowColour)(source, row);
            }
        },
        rowsPerTask);
}

}  // namespace geometry
#endif  // HWY_ONCE
