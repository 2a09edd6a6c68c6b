// The combining steps of CFusion, level by level on the detail bytes (128 + difference).
// Pixel loops stop at the last whole pixel of a row: a 24-bit row whose span is not a
// multiple of 3 ends in padding bytes that belong to no pixel.
#include <algorithm>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <cwchar>

#include "imagelib/DumpPath.h"
#include "pyramid/Fusion.h"

namespace {

int BytesPerPixel(const CImage& image) { return image.GetBitCount() / 8; }

bool SameGeometry(const CImage& a, const CImage& b) {
    return a.GetWidth() == b.GetWidth() && a.GetHeight() == b.GetHeight() && a.GetBitCount() == b.GetBitCount();
}

// Rows y - 1, y and y + 1 of an image.
struct RowTriple {
    RowTriple(const CImage& image, int y)
        : up(image.GetPtrXY(0, y - 1)), row(image.GetPtrXY(0, y)), down(image.GetPtrXY(0, y + 1)) {}
    // |4c - l - r - u - d| on byte i (the test byte of a pixel; neighbours ch bytes away).
    int DetailMeasure(int i, int ch) const {
        return std::abs(4 * row[i] - row[i - ch] - row[i + ch] - up[i] - down[i]);
    }
    const unsigned char* up;
    const unsigned char* row;
    const unsigned char* down;
};

// Copies `count` pixels from src row srcY (from pixel srcX) to dst row dstY (from pixel dstX),
// dropping the pixels that fall outside either row.
void CopyRun(const CImage& src, int srcY, int srcX, CImage& dst, int dstY, int dstX, int count) {
    const int ch = BytesPerPixel(dst);
    if (srcX < 0) {
        dstX -= srcX;
        count += srcX;
        srcX = 0;
    }
    if (dstX < 0) {
        srcX -= dstX;
        count += dstX;
        dstX = 0;
    }
    count = std::min({count, src.GetWidth() - srcX, dst.GetWidth() - dstX});
    if (count <= 0) return;
    std::memcpy(dst.GetPtrXY(dstX, dstY), src.GetPtrXY(srcX, srcY), static_cast<size_t>(count) * ch);
}

}  // namespace

void CFusion::FusePyramids() {
    if (m_nAdded < m_nImages) return;
    CPyramid& first = m_pPyramids[0];
    CPyramid& second = m_pPyramids[1];
    const int n = first.GetLevelsNum();
    if (n == 0 || second.GetLevelsNum() != n) return;
    if (m_pMap == nullptr) {
        // Coarsest level: the pixel whose channels spread wider; ties take the mean.
        CImage& a = first.GetLevel(n - 1);
        const CImage& b = second.GetLevel(n - 1);
        if (!SameGeometry(a, b)) return;
        const int ch = BytesPerPixel(a), rowBytes = a.GetWidth() * ch;
        for (int y = 0; y < a.GetHeight(); ++y) {
            unsigned char* pa = a.GetPtrXY(0, y);
            const unsigned char* pb = b.GetPtrXY(0, y);
            for (int x = 0; x < rowBytes; x += ch) {
                int minA = 1000, maxA = 0, minB = 1000, maxB = 0;
                for (int c = 0; c < ch; ++c) {
                    minA = std::min<int>(minA, pa[x + c]);
                    maxA = std::max<int>(maxA, pa[x + c]);
                    minB = std::min<int>(minB, pb[x + c]);
                    maxB = std::max<int>(maxB, pb[x + c]);
                }
                const int spreadA = maxA - minA, spreadB = maxB - minB;
                if (spreadB > spreadA) {
                    std::memcpy(pa + x, pb + x, ch);
                } else if (spreadB == spreadA) {
                    for (int c = 0; c < ch; ++c) pa[x + c] = static_cast<unsigned char>((pa[x + c] + pb[x + c]) >> 1);
                }
            }
        }
    }
    const bool masked = MapApplies();
    for (int k = m_pMap != nullptr ? n - 1 : n - 2; k >= 0; --k) {
        masked ? FuseLevelMasked(k) : FuseLevelNonMasked(k);
    }
}

void CFusion::FuseLevelNonMasked(int level) {
    CImage& a = m_pPyramids[0].GetLevel(level);
    const CImage& b = m_pPyramids[1].GetLevel(level);
    if (!SameGeometry(a, b)) return;
    const int ch = BytesPerPixel(a);
    const int test = ch != 1 ? 1 : 0;  // green, or the grey byte
    const int lastX = (a.GetWidth() - 2) * ch;  // the right neighbour stays in the row
    // Raster order, in place: the measure on A sees the pixels already taken from B to the
    // left and in the row before.
    for (int y = 1; y <= a.GetHeight() - 2; ++y) {
        unsigned char* pa = a.GetPtrXY(0, y);
        const RowTriple rowsA(a, y), rowsB(b, y);
        for (int x = ch; x <= lastX; x += ch) {
            if (rowsA.DetailMeasure(x + test, ch) > rowsB.DetailMeasure(x + test, ch)) continue;
            std::memcpy(pa + x, rowsB.row + x, ch);
        }
    }
}

void CFusion::FuseLevelMasked(int level) {
    if (m_pMap == nullptr || m_pMap->GetStatus() != CPyramid::PyrGaussian) return;
    CImage& a = m_pPyramids[0].GetLevel(level);
    const CImage& b = m_pPyramids[1].GetLevel(level);
    const CImage& map = m_pMap->GetLevel(level);
    if (!SameGeometry(a, b) || map.GetWidth() != a.GetWidth() || map.GetHeight() != a.GetHeight()) return;
    const int ch = BytesPerPixel(a), width = a.GetWidth();
    for (int y = 0; y < a.GetHeight(); ++y) {
        unsigned char* pa = a.GetPtrXY(0, y);
        const unsigned char* pb = b.GetPtrXY(0, y);
        const unsigned char* pm = map.GetPtrXY(0, y);
        for (int x = 0; x < width; ++x) {
            const int m = pm[x];
            for (int c = x * ch; c < x * ch + ch; ++c)
                pa[c] = static_cast<unsigned char>((pa[c] * (255 - m) + pb[c] * m) >> 8);
        }
    }
}

void CFusion::Fuse4Pyramids() {
    if (m_nAdded < m_nImages || m_nImages < 4) return;
    CPyramid& result = *m_pResult;
    int base = 150;
    for (int k = 0; k < result.GetLevelsNum(); ++k) {
        CImage& r = result.GetLevel(k);
        const CImage& level0 = m_pPyramids[0].GetLevel(k);
        const int w = level0.GetWidth(), h = level0.GetHeight();
        r.Set(255);
        // Upper half: image 3 left of the middle, image 1 from the middle; lower half: image 2
        // and image 0. A run is cut where the result row (2w - 1 wide at some levels) ends.
        auto paste = [&](int left, int right, int s) {
            const CPoint& pl = m_pOffsets[left];
            const CPoint& pr = m_pOffsets[right];
            const int tl = s + base - pl.y;
            if (tl >= 0 && tl < h && tl < r.GetHeight()) {
                const int start = std::max(w - pl.x - 1, 0);
                CopyRun(m_pPyramids[left].GetLevel(k), s, 0, r, tl, start, w - start);
            }
            const int tr = s + base - pr.y;
            if (tr >= 0 && tr < h && tr < r.GetHeight())
                CopyRun(m_pPyramids[right].GetLevel(k), s, pr.x, r, tr, w, w - pr.x);
        };
        for (int s = 0; s < h / 2; ++s) paste(3, 1, s);
        for (int s = h / 2; s < h; ++s) paste(2, 0, s);
        for (int i = 0; i < 4; ++i) {
            m_pOffsets[i].x /= 2;
            m_pOffsets[i].y /= 2;
        }
        base /= 2;
        if (imagelib::DumpsEnabled()) {
            wchar_t path[64];
            std::swprintf(path, 64, L"c:\\ZentLogDir\\fusionLevel%d.jpg", k);
            r.ExportFile(path);
        }
    }
}

void CFusion::NegatePyramids() {
    if (m_nAdded < 2) return;
    CPyramid& first = m_pPyramids[0];
    const CPyramid& second = m_pPyramids[1];
    const int n = first.GetLevelsNum();
    if (n == 0 || second.GetLevelsNum() != n) return;
    first.GetLevel(n - 1).Set(0);  // no low-pass content in the reconstruction
    for (int k = n - 2; k >= 0; --k) {
        CImage& a = first.GetLevel(k);
        const CImage& b = second.GetLevel(k);
        if (!SameGeometry(a, b)) continue;
        const int ch = BytesPerPixel(a), lastX = (a.GetWidth() - 2) * ch;
        for (int y = 1; y <= a.GetHeight() - 2; ++y) {
            unsigned char* pa = a.GetPtrXY(0, y);
            const unsigned char* pb = b.GetPtrXY(0, y);
            for (int x = ch; x <= lastX; x += ch) {
                const int aMax = *std::max_element(pa + x, pa + x + ch);
                const int bMax = *std::max_element(pb + x, pb + x + ch);
                if (std::abs(bMax - 127) <= 3 || std::abs(aMax - 127) >= 20) {
                    std::memset(pa + x, 127, ch);
                } else {
                    std::memcpy(pa + x, pb + x, ch);
                }
            }
        }
    }
}
