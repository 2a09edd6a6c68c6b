// Four-image glare removal without pyramids: one raster pass that rebuilds each pixel from
// its finished left and upper neighbours plus the smoothest unsaturated gradients, then
// takes the unsaturated shot whose colour proportions match the rebuilt pixel best.
#include <algorithm>
#include <cmath>
#include <cstdlib>
#include <cstring>

#include "holograms/FourImageBrightnessMapInternal.h"
#include "holograms/FourImageInternal.h"
#include "holograms/HologramsRemove.h"
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

void RebuildPixel(const unsigned char* const at[4], const unsigned char* const leftOf[4],
                  const unsigned char* const above[4], const unsigned char* resultLeft,
                  const unsigned char* resultAbove, unsigned char* out, unsigned char* flags) {
    int bestHd[3] = {0, 0, 0}, bestVd[3] = {0, 0, 0};
    int bestH = kMaxUsableDifference, bestV = kMaxUsableDifference;
    bool saturated[4];
    unsigned char map = 0;
    for (int i = 0; i < 4; ++i) {
        saturated[i] = MaxChannel(at[i]) > kBrightMapSaturation;
        if (saturated[i]) map |= static_cast<unsigned char>(1u << (4 + i));
        int hd[3], vd[3], hmax = 0, vmax = 0;
        for (int c = 0; c < 3; ++c) {
            hd[c] = at[i][c] - leftOf[i][c];
            vd[c] = at[i][c] - above[i][c];
            hmax = std::max(hmax, std::abs(hd[c]));
            vmax = std::max(vmax, std::abs(vd[c]));
        }
        if (saturated[i]) continue;
        if (hmax < bestH) {
            bestH = hmax;
            std::memcpy(bestHd, hd, sizeof hd);
        }
        if (vmax < bestV) {
            bestV = vmax;
            std::memcpy(bestVd, vd, sizeof vd);
        }
    }
    *flags = map;

    for (int c = 0; c < 3; ++c) {
        const int a = std::clamp(resultLeft[c] + bestHd[c], 0, 255);
        const int b = std::clamp(resultAbove[c] + bestVd[c], 0, 255);
        out[c] = static_cast<unsigned char>((a + b) >> 1);
    }

    float rebuilt[3];
    Proportions(out, rebuilt);
    float bestDistance = kStartDistance;
    int closest = -1;
    for (int i = 0; i < 4; ++i) {
        if (saturated[i]) continue;
        float own[3];
        Proportions(at[i], own);
        float distance = 0.0f;
        for (int c = 0; c < 3; ++c) distance = std::max(distance, std::fabs(own[c] - rebuilt[c]));
        if (distance < bestDistance) {
            bestDistance = distance;
            closest = i;
        }
    }
    if (closest >= 0) CopyPixel(out, at[closest]);
}

}  // namespace holo4

namespace {

void CopyRowBytes(const CImage& src, CImage& dst, int y) {
    std::memcpy(dst.GetPtrXY(0, y), src.GetPtrXY(0, y), static_cast<size_t>(src.GetSpan()));
}

// Rows 0 and 1 from bottom, then rows h - 2 and h - 1 from top (the later wins where they
// meet in images of fewer than four rows).
void CopyBorderRows(const CImage& top, const CImage& bottom, CImage& result) {
    const int h = top.GetHeight();
    for (int y = 0; y < 2 && y < h; ++y) CopyRowBytes(bottom, result, y);
    for (int y = h - 2; y < h; ++y)
        if (y >= 0) CopyRowBytes(top, result, y);
}

// The darker of the edge source and the side shot supplies the two edge pixels.
void CopyEdgePair(const unsigned char* edgeRow, const unsigned char* sideRow, unsigned char* out, int testPixel,
                  int firstPixel) {
    const bool edgeDarkerOrEqual = MaxChannel(sideRow + 3 * testPixel) >= MaxChannel(edgeRow + 3 * testPixel);
    const unsigned char* src = edgeDarkerOrEqual ? edgeRow : sideRow;
    std::memcpy(out + 3 * firstPixel, src + 3 * firstPixel, 6);
}

}  // namespace

void CHologramsRemove::HologramsRemove4Img2(const CImage& top, const CImage& bottom, const CImage& left,
                                            const CImage& right, CImage& result) {
    if (!holo4::CheckFourInputs(top, bottom, left, right, L"HologramsRemove4Img2", false)) return;
    const int w = top.GetWidth(), h = top.GetHeight();
    if (w < 4) {
        Trace(L"HologramsRemove4Img2: %d columns are too few (at least 4); result left unchanged\n", w);
        return;
    }
    // Built aside so that a result that is also one of the inputs is read intact.
    CImage brightMap(w, h, 8);
    CImage out(w, h, 24);
    top.ExportFile(L"\\results\\top.jpg");
    bottom.ExportFile(L"\\results\\bot.jpg");
    left.ExportFile(L"\\results\\left.jpg");
    right.ExportFile(L"\\results\\right.jpg");
    CopyBorderRows(top, bottom, out);

    const CImage* const inputs[4] = {&top, &bottom, &left, &right};
    for (int y = 2; y <= h - 3; ++y) {
        const CImage& edge = y <= h / 2 ? bottom : top;
        unsigned char* outRow = out.GetPtrXY(0, y);
        const unsigned char* outAbove = out.GetPtrXY(0, y - 1);
        CopyEdgePair(edge.GetPtrXY(0, y), right.GetPtrXY(0, y), outRow, 1, 0);
        CopyEdgePair(edge.GetPtrXY(0, y), left.GetPtrXY(0, y), outRow, w - 2, w - 2);

        const unsigned char* rows[4];
        const unsigned char* above[4];
        for (int i = 0; i < 4; ++i) {
            rows[i] = inputs[i]->GetPtrXY(0, y);
            above[i] = inputs[i]->GetPtrXY(0, y - 1);
        }
        unsigned char* mapRow = brightMap.GetPtrXY(0, y);
        for (int x = 2; x <= w - 3; ++x) {
            const int o = 3 * x;
            const unsigned char* at[4] = {rows[0] + o, rows[1] + o, rows[2] + o, rows[3] + o};
            const unsigned char* leftOf[4] = {at[0] - 3, at[1] - 3, at[2] - 3, at[3] - 3};
            const unsigned char* up[4] = {above[0] + o, above[1] + o, above[2] + o, above[3] + o};
            holo4::RebuildPixel(at, leftOf, up, outRow + o - 3, outAbove + o, outRow + o, mapRow + x);
        }
    }
    brightMap.ExportFile(L"\\Results\\brightMap.bmp");
    result = std::move(out);
}
