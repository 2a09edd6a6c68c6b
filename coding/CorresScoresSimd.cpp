// Fast search-area scoring for CCorresTable::BuildTable.
//
// Both windows are copied once into zero-padded 16-bit buffers (pixels outside a or b become
// 0), so every score is a full-window dot product: the zeros stand exactly for the offsets
// that the clipped window leaves out. Each dot product is an integer; while a running sum
// of non-negative integers stays at or below 2^24 every float addition of the plain score is
// exact, so the float sum equals the integer total. Only past 2^24 are the remaining
// products added one by one in float, in the plain scan order (adding a padded 0.0 changes
// nothing). The number of terms follows from the clipping, which is separable.
#undef HWY_TARGET_INCLUDE
#define HWY_TARGET_INCLUDE "coding/CorresScoresSimd.cpp"
#include "hwy/foreach_target.h"  // IWYU pragma: keep
#include "hwy/highway.h"

#include <algorithm>
#include <cstdint>
#include <cstring>
#include <vector>

#include "coding/CorresTableInternal.h"

HWY_BEFORE_NAMESPACE();
namespace varnoth::coding::HWY_NAMESPACE {
namespace hn = hwy::HWY_NAMESPACE;

// At most 16 lanes: the usual 15-pixel window fills one such vector per row, while wider
// vectors would mostly multiply padding.
using WindowTag = hn::CappedTag<int16_t, 16>;

size_t Int16Lanes() { return hn::Lanes(WindowTag()); }

// Dot product of the padded window (rows of `paddedWidth`, a multiple of the lane count)
// with the area block whose top-left is `block`. Fits in int32 for windows up to 181 wide.
HWY_INLINE int32_t WindowDot(const int16_t* HWY_RESTRICT window, size_t paddedWidth, int height,
                             const int16_t* HWY_RESTRICT block, size_t areaStride) {
    const WindowTag d16;
    const hn::Repartition<int32_t, decltype(d16)> d32;
    const size_t lanes = hn::Lanes(d16);
    auto sum0 = hn::Zero(d32);
    auto sum1 = hn::Zero(d32);
    for (int row = 0; row < height; ++row) {
        const int16_t* w = window + row * paddedWidth;
        const int16_t* x = block + row * areaStride;
        for (size_t k = 0; k < paddedWidth; k += lanes)
            sum0 = hn::ReorderWidenMulAccumulate(d32, hn::Load(d16, w + k), hn::LoadU(d16, x + k), sum0, sum1);
    }
    return hn::GetLane(hn::SumOfLanes(d32, hn::Add(sum0, sum1)));
}

// WindowDot for four neighbouring blocks at once: each window vector is loaded once and the
// four independent sums keep the multipliers busy.
HWY_INLINE void FourWindowDots(const int16_t* HWY_RESTRICT window, size_t paddedWidth, int height,
                               const int16_t* HWY_RESTRICT block, size_t areaStride, int32_t* dots) {
    const WindowTag d16;
    const hn::Repartition<int32_t, decltype(d16)> d32;
    const size_t lanes = hn::Lanes(d16);
    auto sum0 = hn::Zero(d32), sum1 = hn::Zero(d32), sum2 = hn::Zero(d32), sum3 = hn::Zero(d32);
    auto odd0 = hn::Zero(d32), odd1 = hn::Zero(d32), odd2 = hn::Zero(d32), odd3 = hn::Zero(d32);
    for (int row = 0; row < height; ++row) {
        const int16_t* w = window + row * paddedWidth;
        const int16_t* x = block + row * areaStride;
        for (size_t k = 0; k < paddedWidth; k += lanes) {
            const auto weights = hn::Load(d16, w + k);
            sum0 = hn::ReorderWidenMulAccumulate(d32, weights, hn::LoadU(d16, x + k), sum0, odd0);
            sum1 = hn::ReorderWidenMulAccumulate(d32, weights, hn::LoadU(d16, x + k + 1), sum1, odd1);
            sum2 = hn::ReorderWidenMulAccumulate(d32, weights, hn::LoadU(d16, x + k + 2), sum2, odd2);
            sum3 = hn::ReorderWidenMulAccumulate(d32, weights, hn::LoadU(d16, x + k + 3), sum3, odd3);
        }
    }
    dots[0] = hn::GetLane(hn::SumOfLanes(d32, hn::Add(sum0, odd0)));
    dots[1] = hn::GetLane(hn::SumOfLanes(d32, hn::Add(sum1, odd1)));
    dots[2] = hn::GetLane(hn::SumOfLanes(d32, hn::Add(sum2, odd2)));
    dots[3] = hn::GetLane(hn::SumOfLanes(d32, hn::Add(sum3, odd3)));
}

// Window dot products for `count` consecutive block positions along one area row.
void RowOfWindowDots(const int16_t* window, size_t paddedWidth, int height, const int16_t* areaRow,
                     size_t areaStride, int count, int32_t* dots) {
    int j = 0;
    for (; j + 4 <= count; j += 4) FourWindowDots(window, paddedWidth, height, areaRow + j, areaStride, dots + j);
    for (; j < count; ++j) dots[j] = WindowDot(window, paddedWidth, height, areaRow + j, areaStride);
}

// Dot product of each window row with the matching block row.
void WindowRowDots(const int16_t* window, size_t paddedWidth, int height, const int16_t* block,
                   size_t areaStride, int32_t* rowDots) {
    for (int row = 0; row < height; ++row)
        rowDots[row] = WindowDot(window + row * paddedWidth, paddedWidth, 1, block + row * areaStride, areaStride);
}

}  // namespace varnoth::coding::HWY_NAMESPACE
HWY_AFTER_NAMESPACE();

#if HWY_ONCE
#include "hwy/aligned_allocator.h"

namespace varnoth::coding {

HWY_EXPORT(Int16Lanes);
HWY_EXPORT(RowOfWindowDots);
HWY_EXPORT(WindowRowDots);

namespace {

// Widest window whose products (at most 255 * 255 each) still total below 2^31.
constexpr int kMaxFastWindow = 181;
// Float sums of non-negative integers are exact up to here.
constexpr int64_t kExactFloatLimit = int64_t{1} << 24;

// Number of offsets d in [-n, n] that keep both pa + d in [0, sizeA) and pb + d in [0, sizeB).
int64_t ClippedSpan(int64_t pa, int64_t sizeA, int64_t pb, int64_t sizeB, int n) {
    const int64_t lo = std::max({int64_t{-n}, -pa, -pb});
    const int64_t hi = std::min({int64_t{n}, sizeA - 1 - pa, sizeB - 1 - pb});
    return hi >= lo ? hi - lo + 1 : 0;
}

// Copies the `rows` x `columns` block of `image` whose top-left is (x0, y0) into `out`
// (row stride `stride`), with 0 wherever the block leaves the image.
void CopyPadded(const CImage& image, int64_t x0, int64_t y0, int rows, int columns, int16_t* out,
                size_t stride) {
    const int64_t xFirst = std::max<int64_t>(x0, 0);
    const int64_t xLast = std::min<int64_t>(x0 + columns, image.GetWidth()) - 1;
    for (int i = 0; i < rows; ++i) {
        const int64_t y = y0 + i;
        if (y < 0 || y >= image.GetHeight() || xFirst > xLast) continue;
        const uint8_t* src = image.GetPtrXY(0, static_cast<int>(y));
        int16_t* dst = out + i * stride + (xFirst - x0);
        for (int64_t x = xFirst; x <= xLast; ++x) *dst++ = src[x];
    }
}

// The plain float sum of one score, resumed exactly from the integer row dots.
float ExactProductSum(const int16_t* window, size_t paddedWidth, int width, const int16_t* block,
                      size_t areaStride, std::vector<int32_t>& rowDots) {
    HWY_DYNAMIC_DISPATCH(WindowRowDots)(window, paddedWidth, width, block, areaStride, rowDots.data());
    int64_t exact = 0;
    int row = 0;
    while (row < width && exact + rowDots[row] <= kExactFloatLimit) exact += rowDots[row++];
    float sum = static_cast<float>(exact);
    for (; row < width; ++row) {
        const int16_t* w = window + row * paddedWidth;
        const int16_t* x = block + row * areaStride;
        for (int k = 0; k < width; ++k) sum += static_cast<float>(w[k] * x[k]);
    }
    return sum;
}

}  // namespace

void ScoreSearchArea(const CImage& a, const CImage& b, CPoint p, const SearchArea& area, int n,
                     float* scores) {
    if (n < 0 || 2 * static_cast<int64_t>(n) + 1 > kMaxFastWindow) {
        ScoreSearchAreaPlain(a, b, p, area, n, scores);
        return;
    }
    const int width = 2 * n + 1;
    const size_t lanes = HWY_DYNAMIC_DISPATCH(Int16Lanes)();
    const size_t paddedWidth = (static_cast<size_t>(width) + lanes - 1) / lanes * lanes;
    const int rows = area.Rows();
    const int columns = area.Columns();

    auto window = hwy::AllocateAligned<int16_t>(static_cast<size_t>(width) * paddedWidth);
    std::memset(window.get(), 0, sizeof(int16_t) * width * paddedWidth);
    CopyPadded(a, int64_t{p.x} - n, int64_t{p.y} - n, width, width, window.get(), paddedWidth);

    // Block (i, j) of the area buffer is the window around (uLo + j, vLo + i) in b.
    const size_t areaStride = static_cast<size_t>(columns) - 1 + paddedWidth;
    const int areaRows = rows + 2 * n;
    std::vector<int16_t> areaPixels(areaStride * areaRows, 0);
    CopyPadded(b, int64_t{area.uLo} - n, int64_t{area.vLo} - n, areaRows, columns + 2 * n, areaPixels.data(),
               areaStride);

    std::vector<int64_t> columnTerms(columns);
    for (int j = 0; j < columns; ++j)
        columnTerms[j] = ClippedSpan(p.x, a.GetWidth(), area.uLo + j, b.GetWidth(), n);

    std::vector<int32_t> dots(columns);
    std::vector<int32_t> rowDots(width);
    for (int i = 0; i < rows; ++i) {
        const int16_t* areaRow = areaPixels.data() + i * areaStride;
        HWY_DYNAMIC_DISPATCH(RowOfWindowDots)(window.get(), paddedWidth, width, areaRow, areaStride, columns,
                                              dots.data());
        const int64_t rowTerms = ClippedSpan(p.y, a.GetHeight(), area.vLo + i, b.GetHeight(), n);
        for (int j = 0; j < columns; ++j) {
            const int64_t terms = rowTerms * columnTerms[j];
            float score = 0.0f;
            if (terms > 0) {
                const float sum = dots[j] <= kExactFloatLimit
                                      ? static_cast<float>(dots[j])
                                      : ExactProductSum(window.get(), paddedWidth, width, areaRow + j,
                                                        areaStride, rowDots);
                score = sum / static_cast<float>(terms);
            }
            *scores++ = score;
        }
    }
}

}  // namespace varnoth::coding
#endif  // HWY_ONCE
