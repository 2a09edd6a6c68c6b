// HillsVallysThreshold: three-level rendering of an 8-bit image from the strong edges of each
// row. Derivatives come from a copy, so painted rows never feed later ones.

#include <cstdlib>

#include "frame/SafeArray.h"
#include "geometry/Geometry.h"
#include "geometry/GeometryInternal.h"

namespace geometry {
namespace {

struct RowEdge {
    int32_t position;
    unsigned char rising;  // derivative positive
    int32_t strength;      // the derivative
};
static_assert(sizeof(RowEdge) == 12);

// d(i) = p(i+2) + 2·p(i+1) - 2·p(i-1) - p(i-2) for i = 2 … W-3; the two entries at each end stay 0.
void rowDerivative(const unsigned char* p, int width, CSafeArray<int32_t>& d) {
    for (int i = 2; i <= width - 3; ++i) d[i] = p[i + 2] + 2 * p[i + 1] - 2 * p[i - 1] - p[i - 2];
}

bool isRisingPeak(const CSafeArray<int32_t>& d, int i) {
    return d[i] > d[i - 2] && d[i] > d[i + 2] && d[i] >= d[i - 1] && d[i] >= d[i + 1];
}

bool isFallingPeak(const CSafeArray<int32_t>& d, int i) {
    return d[i] < d[i - 2] && d[i] < d[i + 2] && d[i] <= d[i - 1] && d[i] <= d[i + 1];
}

// Strong edges of one row in column order. A run of edges of one direction keeps only its
// strongest (the first of equals), at that edge's position. Returns the edge count.
//
// `edges` has room for one edge per candidate column (W - 4): peaks can sit one column
// apart, so a fixed share of W/3 per row could overflow on noisy rows.
int findRowEdges(const CSafeArray<int32_t>& d, int width, int threshold, CSafeArray<RowEdge>& edges) {
    int count = 0;
    for (int i = 2; i <= width - 3; ++i) {
        if (std::abs(d[i]) <= threshold) continue;
        const bool rising = d[i] > 0;
        if (rising ? !isRisingPeak(d, i) : !isFallingPeak(d, i)) continue;
        if (count > 0 && (edges[count - 1].rising != 0) == rising) {
            RowEdge& last = edges[count - 1];
            if (std::abs(d[i]) > std::abs(last.strength)) {
                last.position = i;
                last.strength = d[i];
            }
            continue;
        }
        edges[count++] = RowEdge{i, static_cast<unsigned char>(rising), d[i]};
    }
    return count;
}

// 100 before the first edge, 200 after a rising and 0 after a falling edge, 100 from the last.
void paintRow(unsigned char* row, int width, const CSafeArray<RowEdge>& edges, int count) {
    unsigned char value = 100;
    int next = 0;
    for (int x = 0; x < width; ++x) {
        if (next < count && x == edges[next].position) {
            value = next == count - 1 ? 100 : (edges[next].rising ? 200 : 0);
            ++next;
        }
        row[x] = value;
    }
}

}  // namespace
}  // namespace geometry

void HillsVallysThreshold(CImage& img, int threshold) {
    using namespace geometry;
    if (img.GetBitCount() != 8) return;
    const int W = img.GetWidth(), H = img.GetHeight();
    if (H <= 4 || W < 5) return;  // no row or no column has the two neighbours each side
    const CImage copy(img);
    const PixelGrid in = PixelGrid::of(copy), out = PixelGrid::of(img);
    CSafeArray<int32_t> derivative(static_cast<uint32_t>(W));
    CSafeArray<RowEdge> edges(static_cast<uint32_t>(W - 4));
    for (int r = 2; r <= H - 3; ++r) {
        rowDerivative(in.row(r), W, derivative);
        const int count = findRowEdges(derivative, W, threshold, edges);
        if (count > 0) paintRow(out.row(r), W, edges, count);
    }
}
