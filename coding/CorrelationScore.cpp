// The definition of the correlation score, kept plain: the fast search-area scorer is
// checked against it bit for bit.
#include <algorithm>
#include <cstdint>

#include "coding/CorresTableInternal.h"

namespace varnoth::coding {

float CorrelationScore(const CImage& a, const CImage& b, CPoint pa, CPoint pb, int n) {
    // 64-bit bounds: points and windows far outside the images must not overflow.
    const int64_t ax = pa.x, ay = pa.y, bx = pb.x, by = pb.y;
    const int64_t dyMin = std::max(std::max(by - n, int64_t{0}) - by, std::max(ay - n, int64_t{0}) - ay);
    const int64_t dyMax = std::min(std::min(by + n, int64_t{b.GetHeight()} - 1) - by,
                                   std::min(ay + n, int64_t{a.GetHeight()} - 1) - ay);
    const int64_t dxMin = std::max(std::max(bx - n, int64_t{0}) - bx, std::max(ax - n, int64_t{0}) - ax);
    const int64_t dxMax = std::min(std::min(bx + n, int64_t{b.GetWidth()} - 1) - bx,
                                   std::min(ax + n, int64_t{a.GetWidth()} - 1) - ax);
    // No offset keeps both points inside: no term, score 0.
    if (dyMin > dyMax || dxMin > dxMax) return 0.0f;

    const int64_t length = dxMax - dxMin + 1;
    float sum = 0.0f;
    int64_t count = 0;
    for (int64_t dy = dyMin; dy <= dyMax; ++dy) {
        const uint8_t* rowA = a.GetPtrXY(0, static_cast<int>(ay + dy)) + (ax + dxMin);
        const uint8_t* rowB = b.GetPtrXY(0, static_cast<int>(by + dy)) + (bx + dxMin);
        int64_t k = 0;
        // Unrolled by four; the products are added one at a time, in scan order.
        for (; k + 4 <= length; k += 4) {
            sum += static_cast<float>(rowA[k] * rowB[k]);
            sum += static_cast<float>(rowA[k + 1] * rowB[k + 1]);
            sum += static_cast<float>(rowA[k + 2] * rowB[k + 2]);
            sum += static_cast<float>(rowA[k + 3] * rowB[k + 3]);
        }
        for (; k < length; ++k) sum += static_cast<float>(rowA[k] * rowB[k]);
        count += length;
    }
    return sum / static_cast<float>(count);
}

void ScoreSearchAreaPlain(const CImage& a, const CImage& b, CPoint p, const SearchArea& area, int n,
                          float* scores) {
    for (int v = area.vLo; v <= area.vHi; ++v)
        for (int u = area.uLo; u <= area.uHi; ++u) *scores++ = CorrelationScore(a, b, p, CPoint(u, v), n);
}

}  // namespace varnoth::coding
