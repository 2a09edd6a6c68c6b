// Cleaning of glare masks: removal of small 8-connected blobs and growth of the rest.

#include <cstdint>
#include <vector>

#include "holograms/HologramsRemove.h"
#include "holograms/PixelHelpersInternal.h"

using holo::Refuse;
using holo::Row;

namespace holo {
namespace {

// Removes the blobs smaller than `minimumSize` that start inside the border; a blob is found on
// a working copy, so the mask keeps every blob that is large enough. Returns the number of
// pixels removed.
template <typename Qualifies, typename ClearInCopy, typename ClearInMask>
int64_t RemoveSmallBlobs(CImage& mask, int minimumSize, int border, Qualifies qualifies, ClearInCopy clearInCopy,
                         ClearInMask clearInMask) {
    CImage copy(mask);
    const PixelGrid copyGrid(copy);
    const PixelGrid maskGrid(mask);
    std::vector<int32_t> queue(static_cast<size_t>(copyGrid.width) * copyGrid.height);
    int64_t removed = 0;
    for (int y = border; y < copyGrid.height - border; ++y) {
        for (int x = border; x < copyGrid.width - border; ++x) {
            if (!qualifies(copyGrid.At(x, y))) continue;
            const int size = FloodFill8(copyGrid, x, y, queue.data(), qualifies, clearInCopy, [](int, int) {});
            if (size >= minimumSize) continue;
            for (int i = 0; i < size; ++i)
                clearInMask(maskGrid.At(queue[i] % maskGrid.width, queue[i] / maskGrid.width));
            removed += size;
        }
    }
    return removed;
}

}  // namespace
}  // namespace holo

void CHologramsRemove::ClearHologramsDirth(CImage& mask, int minimumSize, int border) {
    if (!holo::HasDepth(mask, 8)) return;
    if (border < 0 && Refuse(L"ClearHologramsDirth", "negative border")) return;
    holo::RemoveSmallBlobs(
        mask, minimumSize, border, [](const unsigned char* p) { return *p > 200; },
        [](unsigned char* p) { *p = 0; }, [](unsigned char* p) { *p = 0; });
}

void CHologramsRemove::ClearHologramsDirth_24(CImage& mask, int minimumSize, int border, int& count) {
    if (!holo::HasDepth(mask, 24)) return;
    if (border < 0 && Refuse(L"ClearHologramsDirth_24", "negative border")) return;
    const int64_t removed = holo::RemoveSmallBlobs(
        mask, minimumSize, border, [](const unsigned char* p) { return p[0] != 0; },
        [](unsigned char* p) { p[0] = 0; }, [](unsigned char* p) { p[0] = p[1] = p[2] = 0; });
    count -= static_cast<int>(removed);
}

void CHologramsRemove::ExpandHologramsBolbs(CImage& mask, int value, int border) {
    if (!holo::HasDepth(mask, 8) && Refuse(L"ExpandHologramsBolbs", "the mask is not 8-bit")) return;
    if (border < 0 && Refuse(L"ExpandHologramsBolbs", "negative border")) return;
    const int width = mask.GetWidth();
    const int height = mask.GetHeight();
    const unsigned char grown = static_cast<unsigned char>(value - 1);
    // In place, row by row: grown pixels hold value - 1 and so never grow further. Neighbours
    // outside the image count as absent.
    for (int y = border; y < height - border; ++y) {
        unsigned char* row = Row(mask, y);
        const unsigned char* above = y > 0 ? Row(mask, y - 1) : nullptr;
        const unsigned char* below = y + 1 < height ? Row(mask, y + 1) : nullptr;
        for (int x = border; x < width - border; ++x) {
            if (row[x] != 0) continue;
            const bool touches = (x > 0 && row[x - 1] == value) || (x + 1 < width && row[x + 1] == value) ||
                                 (above && above[x] == value) || (below && below[x] == value);
            if (touches) row[x] = grown;
        }
    }
}

void CHologramsRemove::ExpandHologramsBolbsN(CImage& mask, int border, int iterations) {
    if (!holo::HasDepth(mask, 24) && Refuse(L"ExpandHologramsBolbsN", "the mask is not 24-bit")) return;
    if (border < 0 && Refuse(L"ExpandHologramsBolbsN", "negative border")) return;
    const int width = mask.GetWidth();
    const int height = mask.GetHeight();

    // A non-zero first byte alone marks a pixel from here on.
    for (int y = border; y < height - border; ++y) {
        unsigned char* row = Row(mask, y);
        for (int x = border; x < width - border; ++x) {
            unsigned char* p = row + 3 * x;
            if (p[0] == 0 && (p[1] != 0 || p[2] != 0)) p[0] = 3;
        }
    }

    // Each pass reads the mask as it was before the pass. Neighbours outside the image are absent.
    for (int pass = 0; pass < iterations; ++pass) {
        const CImage before(mask);
        for (int y = border; y < height - border; ++y) {
            const unsigned char* above = y > 0 ? Row(before, y - 1) : nullptr;
            const unsigned char* row = Row(before, y);
            const unsigned char* below = y + 1 < height ? Row(before, y + 1) : nullptr;
            unsigned char* out = Row(mask, y);
            for (int x = border; x < width - border; ++x) {
                const int at = 3 * x;
                if (row[at] != 0) continue;
                const unsigned char* marked[4];
                int count = 0;
                if (x > 0 && row[at - 3] != 0) marked[count++] = row + at - 3;
                if (x + 1 < width && row[at + 3] != 0) marked[count++] = row + at + 3;
                if (above != nullptr && above[at] != 0) marked[count++] = above + at;
                if (below != nullptr && below[at] != 0) marked[count++] = below + at;
                if (count == 0) continue;
                for (int c = 0; c < 3; ++c) {
                    int sum = 0;
                    for (int k = 0; k < count; ++k) sum += marked[k][c];
                    out[at + c] = static_cast<unsigned char>(sum / count);
                }
            }
        }
    }
}
