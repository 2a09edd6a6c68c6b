// Fast reduce and expand. Both filters are linear with a single truncating shift at the end,
// so the vertical sum may be formed before the horizontal one without changing a byte: each
// destination row is made in one sweep, first the weighted sum of the two to five source rows
// it depends on (a uniform byte-wise kernel, any depth), then the horizontal step on that
// 16-bit row. Destination rows are split into bands, one band per task, each band with its
// own slice of the pyramid's work buffer; nothing is allocated per call.
//
// Sums stay below 2^16: a reduced value reaches 16 * 16 * 255 = 65280 before the shift by 8,
// an expanded one 8 * 8 * 255 = 16320 before the shift by 6.
#undef HWY_TARGET_INCLUDE
#define HWY_TARGET_INCLUDE "pyramid/PyramidFiltersFast.cpp"
#include <hwy/foreach_target.h>  // IWYU pragma: keep
#include <hwy/highway.h>

#include <algorithm>
#include <cstring>

#include "frame/ArithmeticInternal.h"
#include "imagelib/Parallel.h"
#include "pyramid/FiltersInternal.h"

HWY_BEFORE_NAMESPACE();
namespace varnoth {
namespace HWY_NAMESPACE {
namespace hn = hwy::HWY_NAMESPACE;

using D16 = hn::ScalableTag<uint16_t>;

// sum[e] = w0 * r0[e] + w1 * r1[e] + w2 * r2[e]
void WeightRows3(const uint8_t* r0, const uint8_t* r1, const uint8_t* r2, uint16_t w0, uint16_t w1, uint16_t w2,
                 uint16_t* sum, size_t n) {
    const D16 d;
    const hn::Rebind<uint8_t, D16> d8;
    const size_t lanes = hn::Lanes(d);
    const auto k0 = hn::Set(d, w0), k1 = hn::Set(d, w1), k2 = hn::Set(d, w2);
    size_t e = 0;
    for (; e + lanes <= n; e += lanes) {
        const auto a = hn::PromoteTo(d, hn::LoadU(d8, r0 + e));
        const auto b = hn::PromoteTo(d, hn::LoadU(d8, r1 + e));
        const auto c = hn::PromoteTo(d, hn::LoadU(d8, r2 + e));
        hn::StoreU(hn::Add(hn::Add(hn::Mul(a, k0), hn::Mul(b, k1)), hn::Mul(c, k2)), d, sum + e);
    }
    for (; e < n; ++e) sum[e] = static_cast<uint16_t>(w0 * r0[e] + w1 * r1[e] + w2 * r2[e]);
}

// sum[e] = r0[e] + 4 r1[e] + 6 r2[e] + 4 r3[e] + r4[e]
void WeightRows5(const uint8_t* const* r, uint16_t* sum, size_t n) {
    const D16 d;
    const hn::Rebind<uint8_t, D16> d8;
    const size_t lanes = hn::Lanes(d);
    const auto six = hn::Set(d, 6);
    size_t e = 0;
    for (; e + lanes <= n; e += lanes) {
        auto rowAt = [&](int k) { return hn::PromoteTo(d, hn::LoadU(d8, r[k] + e)); };
        const auto outer = hn::Add(rowAt(0), rowAt(4));
        const auto inner = hn::Add(rowAt(1), rowAt(3));
        const auto centre = rowAt(2);
        hn::StoreU(hn::Add(hn::Add(outer, hn::ShiftLeft<2>(inner)), hn::Mul(centre, six)), d, sum + e);
    }
    for (; e < n; ++e)
        sum[e] = static_cast<uint16_t>(r[0][e] + 4 * r[1][e] + 6 * r[2][e] + 4 * r[3][e] + r[4][e]);
}

template <class V>
HWY_INLINE auto NarrowToBytes(V v) {
    const hn::Rebind<uint8_t, D16> d8;
    const hn::RebindToSigned<D16> di;
    return hn::DemoteTo(d8, hn::BitCast(di, v));
}

// Grey interior outputs 1 .. dw-2 of a vertically summed row v of sw values.
void ReduceRowGrey(const uint16_t* v, [[maybe_unused]] int sw, int dw, uint8_t* out) {
    int j = 1;
#if HWY_TARGET != HWY_SCALAR  // single-lane vectors have no even/odd split
    const D16 d;
    const hn::Rebind<uint8_t, D16> d8;
    const int lanes = static_cast<int>(hn::Lanes(d));
    const auto six = hn::Set(d, 6);
    for (; 2 * j + 2 * lanes + 2 <= sw; j += lanes) {
        // Even and odd source positions around 2j - 2, 2j and 2j + 2.
        const auto lo0 = hn::LoadU(d, v + 2 * j - 2), hi0 = hn::LoadU(d, v + 2 * j - 2 + lanes);
        const auto lo1 = hn::LoadU(d, v + 2 * j), hi1 = hn::LoadU(d, v + 2 * j + lanes);
        const auto lo2 = hn::LoadU(d, v + 2 * j + 2), hi2 = hn::LoadU(d, v + 2 * j + 2 + lanes);
        const auto outer = hn::Add(hn::ConcatEven(d, hi0, lo0), hn::ConcatEven(d, hi2, lo2));
        const auto inner = hn::Add(hn::ConcatOdd(d, hi0, lo0), hn::ConcatOdd(d, hi1, lo1));
        const auto sum = hn::Add(hn::Add(outer, hn::ShiftLeft<2>(inner)), hn::Mul(hn::ConcatEven(d, hi1, lo1), six));
        hn::StoreU(NarrowToBytes(hn::ShiftRight<8>(sum)), d8, out + j);
    }
#endif
    for (; j <= dw - 2; ++j) {
        const uint16_t* p = v + 2 * j;
        out[j] = static_cast<uint8_t>((p[-2] + 4 * p[-1] + 6 * p[0] + 4 * p[1] + p[2]) >> 8);
    }
}

// Splits an interleaved colour row of sw pixels into B, G and R planes `stride` apart.
void SplitPlanes(const uint16_t* v, int sw, size_t stride, uint16_t* planes) {
    const D16 d;
    uint16_t* plane[3] = {planes, planes + stride, planes + 2 * stride};
    const int lanes = static_cast<int>(hn::Lanes(d));
    int i = 0;
    for (; i + lanes <= sw; i += lanes) {
        hn::Vec<D16> b, g, r;
        hn::LoadInterleaved3(d, v + 3 * i, b, g, r);
        hn::StoreU(b, d, plane[0] + i);
        hn::StoreU(g, d, plane[1] + i);
        hn::StoreU(r, d, plane[2] + i);
    }
    for (; i < sw; ++i)
        for (int c = 0; c < 3; ++c) plane[c][i] = v[3 * i + c];
}

// Joins pixels first .. last (inclusive) of three byte planes `stride` apart into B, G, R.
void JoinPlanes(const uint8_t* planeBytes, size_t stride, int first, int last, uint8_t* out) {
    const hn::ScalableTag<uint8_t> d8;
    const uint8_t* bytes[3] = {planeBytes, planeBytes + stride, planeBytes + 2 * stride};
    const int lanes = static_cast<int>(hn::Lanes(d8));
    int x = first;
    for (; x + lanes <= last + 1; x += lanes) {
        hn::StoreInterleaved3(hn::LoadU(d8, bytes[0] + x), hn::LoadU(d8, bytes[1] + x), hn::LoadU(d8, bytes[2] + x), d8,
                              out + 3 * x);
    }
    for (; x <= last; ++x)
        for (int c = 0; c < 3; ++c) out[3 * x + c] = bytes[c][x];
}

// Colour interior outputs 1 .. dw-2: each plane is reduced as a grey row.
void ReduceRowColour(const uint16_t* v, int sw, int dw, size_t stride, uint16_t* planes, uint8_t* planeBytes,
                     uint8_t* out) {
    SplitPlanes(v, sw, stride, planes);
    for (int c = 0; c < 3; ++c) ReduceRowGrey(planes + c * stride, sw, dw, planeBytes + 2 * c * stride);
    JoinPlanes(planeBytes, 2 * stride, 1, dw - 2, out);
}

// Grey interior positions 2 .. 2sw-3: even ones on a source pixel, odd ones between two.
void ExpandRowGrey(const uint16_t* v, int sw, uint8_t* out) {
    int i = 1;
#if HWY_TARGET != HWY_SCALAR  // a single lane cannot hold a byte pair
    const D16 d;
    const hn::Repartition<uint8_t, D16> d8;
    const int lanes = static_cast<int>(hn::Lanes(d));
    const auto six = hn::Set(d, 6);
    for (; i + lanes + 1 <= sw; i += lanes) {
        const auto left = hn::LoadU(d, v + i - 1), centre = hn::LoadU(d, v + i), right = hn::LoadU(d, v + i + 1);
        const auto on = hn::ShiftRight<6>(hn::Add(hn::Add(left, right), hn::Mul(centre, six)));
        const auto between = hn::ShiftRight<4>(hn::Add(centre, right));  // 4 (c + r) >> 6
        hn::StoreU(hn::BitCast(d8, hn::Or(on, hn::ShiftLeft<8>(between))), d8, out + 2 * i);
    }
#endif
    for (; i <= sw - 2; ++i) {
        out[2 * i] = static_cast<uint8_t>((v[i - 1] + 6 * v[i] + v[i + 1]) >> 6);
        out[2 * i + 1] = static_cast<uint8_t>((4 * (v[i] + v[i + 1])) >> 6);
    }
}

// Colour interior positions 2 .. 2sw-3: each plane is expanded as a grey row.
void ExpandRowColour(const uint16_t* v, int sw, size_t stride, uint16_t* planes, uint8_t* planeBytes, uint8_t* out) {
    SplitPlanes(v, sw, stride, planes);
    for (int c = 0; c < 3; ++c) ExpandRowGrey(planes + c * stride, sw, planeBytes + 2 * c * stride);
    JoinPlanes(planeBytes, 2 * stride, 2, 2 * sw - 3, out);
}

}  // namespace HWY_NAMESPACE
}  // namespace varnoth
HWY_AFTER_NAMESPACE();

#if HWY_ONCE
namespace varnoth {

HWY_EXPORT(WeightRows3);
HWY_EXPORT(WeightRows5);
HWY_EXPORT(ReduceRowGrey);
HWY_EXPORT(ReduceRowColour);
HWY_EXPORT(ExpandRowGrey);
HWY_EXPORT(ExpandRowColour);

namespace {

constexpr size_t kSliceAlign = 64;  // elements

size_t AlignUp(size_t n) { return (n + kSliceAlign - 1) / kSliceAlign * kSliceAlign; }

// Splits `rows` destination rows into bands that each get `slice` work elements, and runs
// them in parallel. False when not even one slice fits.
template <class BandBody>
bool RunBands(int rows, size_t slice, int16_t* work, size_t capacity, const BandBody& body) {
    const size_t fitting = capacity / slice;
    if (fitting == 0) return false;
    constexpr int kMinRowsPerBand = 8;
    const int threads = std::max(1, imagelib::GetThreadLimit());
    int bands = std::min(std::max(1, rows / kMinRowsPerBand), 8 * threads);
    bands = static_cast<int>(std::min<size_t>(static_cast<size_t>(bands), fitting));
    // The task body captures one pointer, so handing it to the parallel-for allocates nothing.
    struct Bands {
        int rows, count;
        size_t slice;
        int16_t* work;
        const BandBody* body;
    } bandsOf{rows, bands, slice, work, &body};
    const Bands* plan = &bandsOf;
    imagelib::ParallelFor(0, bands, [plan](int first, int end) {
        for (int b = first; b < end; ++b) {
            const int begin = static_cast<int>(static_cast<int64_t>(plan->rows) * b / plan->count);
            const int stop = static_cast<int>(static_cast<int64_t>(plan->rows) * (b + 1) / plan->count);
            (*plan->body)(begin, stop, plan->work + static_cast<size_t>(b) * plan->slice);
        }
    });
    return true;
}

}  // namespace

void FastReduce(const CImage& src, CImage& dst, int16_t* work, size_t capacity) {
    const int ch = src.GetBitCount() / 8;
    const int sw = src.GetWidth(), sh = src.GetHeight(), dw = dst.GetWidth(), dh = dst.GetHeight();
    const size_t n = static_cast<size_t>(sw) * ch, sspan = src.GetSpan(), dspan = dst.GetSpan();
    const uint8_t* srcBits = src.GetBits();
    uint8_t* dstBits = dst.GetBits();
    // Vertical sums, then (colour) three planes of sums and three planes of reduced bytes.
    const size_t stride = AlignUp(static_cast<size_t>(sw) + 8);
    const size_t slice = AlignUp(n) + 6 * stride;

    auto reduceRows = [&](int begin, int end, int16_t* scratch) {
        uint16_t* sum = reinterpret_cast<uint16_t*>(scratch);
        uint16_t* planes = reinterpret_cast<uint16_t*>(scratch + AlignUp(n));
        uint8_t* planeBytes = reinterpret_cast<uint8_t*>(scratch + AlignUp(n) + 3 * stride);
        auto row = [&](int m) { return srcBits + static_cast<size_t>(m) * sspan; };
        for (int r = begin; r < end; ++r) {
            // Rows in memory order; the first and last destination rows mirror about the
            // first and last source rows.
            if (r == 0) {
                HWY_DYNAMIC_DISPATCH(WeightRows3)(row(0), row(1), row(2), 6, 8, 2, sum, n);
            } else if (r == dh - 1) {
                HWY_DYNAMIC_DISPATCH(WeightRows3)(row(sh - 1), row(sh - 2), row(sh - 3), 6, 8, 2, sum, n);
            } else {
                const uint8_t* rows[5] = {row(2 * r - 2), row(2 * r - 1), row(2 * r), row(2 * r + 1), row(2 * r + 2)};
                HWY_DYNAMIC_DISPATCH(WeightRows5)(rows, sum, n);
            }
            uint8_t* out = dstBits + static_cast<size_t>(r) * dspan;
            if (ch == 1) {
                HWY_DYNAMIC_DISPATCH(ReduceRowGrey)(sum, sw, dw, out);
            } else {
                HWY_DYNAMIC_DISPATCH(ReduceRowColour)(sum, sw, dw, stride, planes, planeBytes, out);
            }
            for (int c = 0; c < ch; ++c) {
                auto v = [&](int i) { return static_cast<int>(sum[i * ch + c]); };
                out[c] = static_cast<uint8_t>((6 * v(0) + 8 * v(1) + 2 * v(2)) >> 8);
                out[(dw - 1) * ch + c] = static_cast<uint8_t>((6 * v(sw - 1) + 8 * v(sw - 2) + 2 * v(sw - 3)) >> 8);
            }
        }
    };
    if (!RunBands(dh, slice, work, capacity, reduceRows)) PlainReduce(src, dst, work);
}

namespace {

// The horizontal expand value (weight 8) at destination position x for the border positions,
// as the last of the overlapping writes leaves it: interior, then dw-1, 1, dw-2, 0.
int ExpandEdge(const uint16_t* sum, int ch, int c, int sw, int dw, int x) {
    auto v = [&](int i) { return static_cast<int>(sum[i * ch + c]); };
    if (x == dw - 1) return 4 * (v(sw - 1) + v(sw - 2));
    if (x == 1) return 4 * (v(0) + v(1));
    if (x == dw - 2) return 2 * (3 * v(sw - 1) + v(sw - 2));
    return 2 * (3 * v(0) + v(1));
}

// Scratch of one band of expanded rows: vertical sums, (colour) three planes of sums and three
// planes of expanded bytes, then (when combining) the expanded row itself.
struct ExpandScratch {
    ExpandScratch(const CImage& src, size_t rowBytes)
        : sumSize(AlignUp(static_cast<size_t>(src.GetWidth()) * (src.GetBitCount() / 8))),
          stride(AlignUp(static_cast<size_t>(src.GetWidth()) + 8)),
          rowSize(AlignUp(rowBytes / 2 + 8)) {}
    size_t Slice(bool withRow) const { return sumSize + 6 * stride + (withRow ? rowSize : 0); }
    uint16_t* Sum(int16_t* s) const { return reinterpret_cast<uint16_t*>(s); }
    uint16_t* Planes(int16_t* s) const { return reinterpret_cast<uint16_t*>(s + sumSize); }
    uint8_t* PlaneBytes(int16_t* s) const { return reinterpret_cast<uint8_t*>(s + sumSize + 3 * stride); }
    uint8_t* Row(int16_t* s) const { return reinterpret_cast<uint8_t*>(s + sumSize + 6 * stride); }
    size_t sumSize, stride, rowSize;
};

// Destination row t (GetPtrXY order) of the expand of src into a dw x dh image, written to
// `out`: dw * ch bytes, then 0 up to `span`.
void ExpandRow(const CImage& src, int dw, int dh, int t, const ExpandScratch& layout, int16_t* scratch,
               uint8_t* out, size_t span) {
    const int ch = src.GetBitCount() / 8;
    const int sw = src.GetWidth(), sh = src.GetHeight();
    const size_t n = static_cast<size_t>(sw) * ch;
    uint16_t* sum = layout.Sum(scratch);
    auto row = [&](int y) { return src.GetPtrXY(0, y); };
    // The border rows are the last writes of the definition, in the order 0, 1, dh-2, dh-1,
    // so the later ones win.
    const uint8_t *r0, *r1, *r2;
    uint16_t w0, w1, w2 = 0;
    if (t == dh - 1) {
        r0 = row(sh - 1), r1 = r2 = row(sh - 2), w0 = 6, w1 = 2;
    } else if (t == dh - 2) {
        r0 = row(sh - 2), r1 = r2 = row(sh - 1), w0 = 4, w1 = 4;
    } else if (t == 1) {
        r0 = row(0), r1 = r2 = row(1), w0 = 4, w1 = 4;
    } else if (t == 0) {
        r0 = row(0), r1 = r2 = row(1), w0 = 6, w1 = 2;
    } else if (t % 2 == 0) {
        const int k = (t - 2) / 2;
        r0 = row(k), r1 = row(k + 1), r2 = row(k + 2), w0 = 1, w1 = 6, w2 = 1;
    } else {
        const int k = (t - 3) / 2;
        r0 = row(k + 1), r1 = r2 = row(k + 2), w0 = 4, w1 = 4;
    }
    HWY_DYNAMIC_DISPATCH(WeightRows3)(r0, r1, r2, w0, w1, w2, sum, n);

    if (ch == 1) {
        HWY_DYNAMIC_DISPATCH(ExpandRowGrey)(sum, sw, out);
    } else {
        HWY_DYNAMIC_DISPATCH(ExpandRowColour)(sum, sw, layout.stride, layout.Planes(scratch),
                                              layout.PlaneBytes(scratch), out);
    }
    for (int x : {0, 1}) {
        for (int c = 0; c < ch; ++c) out[x * ch + c] = static_cast<uint8_t>(ExpandEdge(sum, ch, c, sw, dw, x) >> 6);
    }
    for (int x = std::max(2, 2 * sw - 2); x < dw; ++x) {
        for (int c = 0; c < ch; ++c) out[x * ch + c] = static_cast<uint8_t>(ExpandEdge(sum, ch, c, sw, dw, x) >> 6);
    }
    std::memset(out + static_cast<size_t>(dw) * ch, 0, span - static_cast<size_t>(dw) * ch);
}

}  // namespace

void FastExpand(const CImage& src, CImage& dst, int16_t* work, size_t capacity) {
    const int dw = dst.GetWidth(), dh = dst.GetHeight();
    const ExpandScratch layout(src, dst.GetSpan());
    auto expandRows = [&](int begin, int end, int16_t* scratch) {
        for (int t = begin; t < end; ++t) ExpandRow(src, dw, dh, t, layout, scratch, dst.GetPtrXY(0, t), dst.GetSpan());
    };
    if (!RunBands(dh, layout.Slice(false), work, capacity, expandRows)) PlainExpand(src, dst, work);
}

bool FastExpandCombine(const CImage& coarse, CImage& target, bool add, int16_t* work, size_t capacity) {
    const int dw = target.GetWidth(), dh = target.GetHeight();
    const size_t span = target.GetSpan();
    const ExpandScratch layout(coarse, span);
    auto combineRows = [&](int begin, int end, int16_t* scratch) {
        uint8_t* expanded = layout.Row(scratch);
        for (int t = begin; t < end; ++t) {
            ExpandRow(coarse, dw, dh, t, layout, scratch, expanded, span);
            uint8_t* row = target.GetPtrXY(0, t);
            add ? FastAddBytes(row, expanded, row, span) : FastSubtractBytes(row, expanded, row, span);
        }
    };
    return RunBands(dh, layout.Slice(true), work, capacity, combineRows);
}

}  // namespace varnoth
#endif  // HWY_ONCE
