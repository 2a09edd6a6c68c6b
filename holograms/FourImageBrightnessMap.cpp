// Four-image glare removal without pyramids: one raster pass that rebuilds each pixel from
// its finished left and upper neighbours plus the smoothest unsaturated gradients, then
// takes the unsaturated shot whose colour proportions match the rebuilt pixel best.
#include <algorithm>
#include <cmath>
#include <cstdlib>
#include <cstring>
#include <vector>

#include "holograms/FourImageBrightnessMapInternal.h"
#include "holograms/FourImageInternal.h"
#include "holograms/HologramsRemove.h"
#include "imagelib/Parallel.h"
#include "imagelib/Trace.h"

using holo4::CopyPixel;
using holo4::MaxChannel;

namespace holo4 {

// Colour proportions B / m, G / m, R / m with m the largest channel; a black pixel has
// none, and all three are taken as 0.
void Proportions(const unsigned char* p, float out[3]) {
    const int m = MaxChannel(p);
    for (int c = 0; c < 3; ++c) out[c] = m == 0 ? 0.0f : static_cast<float>(p[c]) / static_cast<float>(m);
}

void AnalysePixel(const unsigned char* const at[4], const unsigned char* const leftOf[4],
                  const unsigned char* const above[4], PixelAnalysis& a) {
    int bestH = kMaxUsableDifference, bestV = kMaxUsableDifference;
    a.flags = 0;
    for (int c = 0; c < 3; ++c) a.hd[c] = a.vd[c] = 0;
    for (int i = 0; i < 4; ++i) {
        const bool saturated = MaxChannel(at[i]) > kBrightMapSaturation;
        if (saturated) {
            a.flags |= static_cast<unsigned char>(1u << (4 + i));
            continue;
        }
        int hd[3], vd[3], hmax = 0, vmax = 0;
        for (int c = 0; c < 3; ++c) {
            hd[c] = at[i][c] - leftOf[i][c];
            vd[c] = at[i][c] - above[i][c];
            hmax = std::max(hmax, std::abs(hd[c]));
            vmax = std::max(vmax, std::abs(vd[c]));
        }
        if (hmax < bestH) {
            bestH = hmax;
            for (int c = 0; c < 3; ++c) a.hd[c] = static_cast<int16_t>(hd[c]);
        }
        if (vmax < bestV) {
            bestV = vmax;
            for (int c = 0; c < 3; ++c) a.vd[c] = static_cast<int16_t>(vd[c]);
        }
        Proportions(at[i], a.proportion[i]);
    }
}

void FinishPixel(const PixelAnalysis& a, const unsigned char* const at[4], const unsigned char* resultLeft,
                 const unsigned char* resultAbove, unsigned char* out) {
    for (int c = 0; c < 3; ++c) {
        const int left = std::clamp(resultLeft[c] + a.hd[c], 0, 255);
        const int up = std::clamp(resultAbove[c] + a.vd[c], 0, 255);
        out[c] = static_cast<unsigned char>((left + up) >> 1);
    }
    float rebuilt[3];
    Proportions(out, rebuilt);
    float bestDistance = kStartDistance;
    int closest = -1;
    for (int i = 0; i < 4; ++i) {
        if (a.flags & (1u << (4 + i))) continue;
        float distance = 0.0f;
        for (int c = 0; c < 3; ++c) distance = std::max(distance, std::fabs(a.proportion[i][c] - rebuilt[c]));
        if (distance < bestDistance) {
            bestDistance = distance;
            closest = i;
        }
    }
    if (closest >= 0) CopyPixel(out, at[closest]);
}

void RebuildPixel(const unsigned char* const at[4], const unsigned char* const leftOf[4],
                  const unsigned char* const above[4], const unsigned char* resultLeft,
                  const unsigned char* resultAbove, unsigned char* out, unsigned char* flags) {
    PixelAnalysis a;
    AnalysePixel(at, leftOf, above, a);
    *flags = a.flags;
    FinishPixel(a, at, resultLeft, resultAbove, out);
}

}  // namespace holo4

namespace {

void CopyRowBytes(const CImage& src, CImage& dst, int y) {
    std::memcpy(dst.GetPtrXY(0, y), src.GetPtrXY(0, y), static_cast<size_t>(src.GetSpan()));
}

// The darker of the edge source and the side shot supplies the two edge pixels.
void CopyEdgePair(const unsigned char* edgeRow, const unsigned char* sideRow, unsigned char* out, int testPixel,
                  int firstPixel) {
    const bool edgeDarkerOrEqual = MaxChannel(sideRow + 3 * testPixel) >= MaxChannel(edgeRow + 3 * testPixel);
    const unsigned char* src = edgeDarkerOrEqual ? edgeRow : sideRow;
    std::memcpy(out + 3 * firstPixel, src + 3 * firstPixel, 6);
}

// The four candidates' pixels at (x, y), their left neighbours and the pixels above.
struct CandidatePixels {
    const unsigned char* at[4];
    const unsigned char* leftOf[4];
    const unsigned char* up[4];
};

// Candidate rows y and y - 1.
struct CandidateRows {
    const unsigned char* row[4];
    const unsigned char* above[4];

    CandidateRows(const CImage* const in[4], int y) {
        for (int i = 0; i < 4; ++i) {
            row[i] = in[i]->GetPtrXY(0, y);
            above[i] = in[i]->GetPtrXY(0, y - 1);
        }
    }
    CandidatePixels At(int x) const {
        CandidatePixels p;
        for (int i = 0; i < 4; ++i) {
            p.at[i] = row[i] + 3 * x;
            p.leftOf[i] = p.at[i] - 3;
            p.up[i] = above[i] + 3 * x;
        }
        return p;
    }
};

// Result row y, the finished result row above it and brightness-map row y.
struct ResultRows {
    unsigned char* row;
    const unsigned char* above;
    unsigned char* map;

    ResultRows(CImage& out, CImage& brightMap, int y)
        : row(out.GetPtrXY(0, y)), above(out.GetPtrXY(0, y - 1)), map(brightMap.GetPtrXY(0, y)) {}
    unsigned char* At(int x) const { return row + 3 * x; }
    const unsigned char* LeftOf(int x) const { return row + 3 * x - 3; }
    const unsigned char* Above(int x) const { return above + 3 * x; }
};

// Inner row y: the two edge pairs, which depend on the inputs only.
void CopyEdges(const CImage* const in[4], CImage& out, int y) {
    const int w = in[0]->GetWidth(), h = in[0]->GetHeight();
    const CImage& edge = y <= h / 2 ? *in[1] : *in[0];  // bottom in the upper half, top below
    unsigned char* outRow = out.GetPtrXY(0, y);
    CopyEdgePair(edge.GetPtrXY(0, y), in[3]->GetPtrXY(0, y), outRow, 1, 0);      // right
    CopyEdgePair(edge.GetPtrXY(0, y), in[2]->GetPtrXY(0, y), outRow, w - 2, w - 2);  // left
}

// Rows 0 and 1 from bottom, then rows h - 2 and h - 1 from top (the later wins where they
// meet in images of fewer than four rows).
void CopyBorderRows(const CImage* const in[4], CImage& out) {
    const int h = in[0]->GetHeight();
    for (int y = 0; y < 2 && y < h; ++y) CopyRowBytes(*in[1], out, y);
    for (int y = h - 2; y < h; ++y)
        if (y >= 0) CopyRowBytes(*in[0], out, y);
}

}  // namespace

namespace holo4 {

void ComposeBrightnessMapPlain(const CImage* const in[4], CImage& out, CImage& brightMap) {
    const int w = in[0]->GetWidth(), h = in[0]->GetHeight();
    CopyBorderRows(in, out);
    for (int y = 2; y <= h - 3; ++y) {
        CopyEdges(in, out, y);
        const CandidateRows rows(in, y);
        const ResultRows result(out, brightMap, y);
        for (int x = 2; x <= w - 3; ++x) {
            const CandidatePixels p = rows.At(x);
            RebuildPixel(p.at, p.leftOf, p.up, result.LeftOf(x), result.Above(x), result.At(x), result.map + x);
        }
    }
}

void ComposeBrightnessMapFast(const CImage* const in[4], CImage& out, CImage& brightMap) {
    // What a pixel takes from the shots does not depend on the result, so it is worked out
    // for a band of rows in parallel; then the band is rebuilt in raster order, which the
    // dependence on the finished left and upper pixels requires.
    constexpr int kBandRows = 32;
    const int w = in[0]->GetWidth(), h = in[0]->GetHeight();
    const int inner = w - 4 > 0 ? w - 4 : 0;
    std::vector<PixelAnalysis> analysis(static_cast<size_t>(kBandRows) * inner);
    CopyBorderRows(in, out);
    for (int first = 2; first <= h - 3; first += kBandRows) {
        const int last = std::min(first + kBandRows, h - 2);  // exclusive
        imagelib::ParallelFor(first, last, [&](int begin, int end) {
            for (int y = begin; y < end; ++y) {
                CopyEdges(in, out, y);
                const CandidateRows rows(in, y);
                PixelAnalysis* a = analysis.data() + static_cast<size_t>(y - first) * inner;
                for (int x = 2; x <= w - 3; ++x) {
                    const CandidatePixels p = rows.At(x);
                    AnalysePixel(p.at, p.leftOf, p.up, a[x - 2]);
                }
            }
        }, 4);
        for (int y = first; y < last; ++y) {
            const CandidateRows rows(in, y);
            const ResultRows result(out, brightMap, y);
            const PixelAnalysis* a = analysis.data() + static_cast<size_t>(y - first) * inner;
            for (int x = 2; x <= w - 3; ++x) {
                result.map[x] = a[x - 2].flags;
                FinishPixel(a[x - 2], rows.At(x).at, result.LeftOf(x), result.Above(x), result.At(x));
            }
        }
    }
}

}  // namespace holo4

void CHologramsRemove::HologramsRemove4Img2(const CImage& top, const CImage& bottom, const CImage& left,
                                            const CImage& right, CImage& result) {
    if (!holo4::CheckFourInputs(top, bottom, left, right, L"HologramsRemove4Img2", false)) return;
    const int w = top.GetWidth(), h = top.GetHeight();
    if (w < 2) {  // the edge pairs read pixel 1 of every row
        Trace(L"HologramsRemove4Img2: %d column is too few (at least 2); result left unchanged\n", w);
        return;
    }
    // Built aside so that a result that is also one of the inputs is read intact.
    CImage brightMap(w, h, 8);
    CImage out(w, h, 24);
    top.ExportFile(L"\\results\\top.jpg");
    bottom.ExportFile(L"\\results\\bot.jpg");
    left.ExportFile(L"\\results\\left.jpg");
    right.ExportFile(L"\\results\\right.jpg");
    const CImage* const inputs[4] = {&top, &bottom, &left, &right};
    holo4::ComposeBrightnessMapFast(inputs, out, brightMap);
    brightMap.ExportFile(L"\\Results\\brightMap.bmp");
    result = std::move(out);
}
