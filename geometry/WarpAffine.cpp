// WarpAffine: the map's set-up (near-identity shortcut, fitted window, shift, 16.16 steps).
// The per-pixel sampling lives in WarpAffineKernels.cpp.

#include <algorithm>
#include <cmath>

#include "frame/Matrix.h"
#include "geometry/Geometry.h"
#include "geometry/GeometryInternal.h"
#include "imagelib/Round.h"
#include "imagelib/Trace.h"

namespace geometry {
namespace {

// Differences are formed in float and compared in double.
bool isNearIdentity(const float* m) {
    return std::fabs(static_cast<double>(m[0] - 1.0f)) < 0.0002 && std::fabs(static_cast<double>(m[1])) < 0.0002 &&
           std::fabs(static_cast<double>(m[3])) < 0.0002 && std::fabs(static_cast<double>(m[4] - 1.0f)) < 0.0002 &&
           std::fabs(static_cast<double>(m[2])) < 0.2 && std::fabs(static_cast<double>(m[5])) < 0.2;
}

void copyCapped(const CImage& src, CImage& dst) {
    dst = src;
    unsigned char* bytes = dst.GetBits();
    const size_t size = dst.GetSize();
    for (size_t i = 0; i < size; ++i) bytes[i] = std::min<unsigned char>(bytes[i], 254);
}

struct Window {
    int minX = 0, minY = 0, maxX = 0, maxY = 0;
};

struct LandedPoint {
    float X = 0.0f, Y = 0.0f;
};

// Where the source corners (0, 0), (W-1, 0), (W-1, H-1), (0, H-1) land under the inverse
// map. False when the linear part is singular.
bool landSourceCorners(const float* m, int width, int height, LandedPoint landed[4]) {
    ZentMatrix::CMatrix<float> linear(2, 2);
    linear(0, 0) = m[0];
    linear(0, 1) = m[1];
    linear(1, 0) = m[3];
    linear(1, 1) = m[4];
    ZentMatrix::CMatrix<float> inv(2, 2);
    if (!linear.inverse(inv)) return false;
    const float i00 = inv(0, 0), i01 = inv(0, 1), i10 = inv(1, 0), i11 = inv(1, 1);
    const float tx = -i00 * m[2] - i01 * m[5];
    const float ty = -i10 * m[2] - i11 * m[5];
    const float xs[4] = {0.0f, static_cast<float>(width - 1), static_cast<float>(width - 1), 0.0f};
    const float ys[4] = {0.0f, 0.0f, static_cast<float>(height - 1), static_cast<float>(height - 1)};
    for (int k = 0; k < 4; ++k) {
        landed[k].X = i00 * xs[k] + i01 * ys[k] + tx;
        landed[k].Y = i10 * xs[k] + i11 * ys[k] + ty;
    }
    return true;
}

// The bounding box compares only the corner pairs that bound it for a map without mirroring.
// False (nothing traced) when the box cannot be held by an image.
bool boundingWindow(const LandedPoint p[4], Window& win) {
    const double lowX = std::min(p[0].X, p[3].X), lowY = std::min(p[0].Y, p[1].Y);
    const double highX = static_cast<double>(std::max(p[1].X, p[2].X)) + 0.5;
    const double highY = static_cast<double>(std::max(p[2].Y, p[3].Y)) + 0.5;
    constexpr double kLimit = 1 << 28;  // far beyond any scan; keeps sizes and steps in int range
    for (double v : {lowX, lowY, highX, highY})
        if (!(std::fabs(v) < kLimit)) return false;
    win.minX = static_cast<int>(lowX);
    win.minY = static_cast<int>(lowY);
    win.maxX = static_cast<int>(highX);
    win.maxY = static_cast<int>(highY);
    return true;
}

int clampTo(int v, int high) { return v < 0 ? 0 : (v > high ? high : v); }

void reportCorners(const LandedPoint p[4], const Window& win, CPoint corners[4]) {
    for (int k = 0; k < 4; ++k) {
        const int x = static_cast<int>(static_cast<double>(p[k].X - static_cast<float>(win.minX)) + 0.5);
        const int y = static_cast<int>(static_cast<double>(p[k].Y - static_cast<float>(win.minY)) + 0.5);
        corners[k] = CPoint(clampTo(x, win.maxX - win.minX), clampTo(y, win.maxY - win.minY));
    }
}

int32_t fixed16(double v) { return truncToInt(v * 65536 + 0.5); }

}  // namespace

bool warpAffineWith(const float* m, const CImage& src, CImage& dst, bool fit, const SPoint* shift,
                    CPoint* corners, Kernel kernel) {
    if (isNearIdentity(m)) {
        copyCapped(src, dst);
        return true;
    }
    CImage keep;
    const CImage& source = distinctSource(src, dst, keep);
    const int width = source.GetWidth(), height = source.GetHeight(), bits = source.GetBitCount();

    Window win{0, 0, dst.GetWidth() - 1, dst.GetHeight() - 1};
    if (fit) {
        LandedPoint landed[4];
        if (!landSourceCorners(m, width, height, landed)) return false;
        if (!boundingWindow(landed, win)) {
            Trace(L"WarpAffine: fitted output too large\n");
            return false;
        }
        dst.Reallocate(win.maxX - win.minX + 1, win.maxY - win.minY + 1, bits, 0);
        if (corners != nullptr) reportCorners(landed, win, corners);
    }
    if (bits != 8 && bits != 24) return false;

    float fracX = 0.0f, fracY = 0.0f;
    int offX = 0, offY = 0;  // whole-pixel shift; only a negative one moves the content
    if (shift != nullptr) {
        const int roundX = imagelib::round(shift->x), roundY = imagelib::round(shift->y);
        fracX = shift->x - static_cast<float>(roundX);
        fracY = shift->y - static_cast<float>(roundY);
        offX = std::min(roundX, 0);
        offY = std::min(roundY, 0);
    }
    const int64_t firstCol = static_cast<int64_t>(win.minX) - offX;
    const int64_t firstRow = static_cast<int64_t>(win.minY) - offY;
    if (firstCol >= win.maxX || firstRow >= win.maxY) {
        Trace(L"WarpAffine: out of range\n");
        return false;
    }
    // A destination of another depth would be written past its rows.
    if (dst.GetBitCount() != bits) {
        Trace(L"WarpAffine: destination depth differs from source\n");
        return false;
    }

    AffineSampling s;
    s.colStepX = fixed16(m[0]);
    s.colStepY = fixed16(m[3]);
    s.rowStepX = fixed16(m[1]);
    s.rowStepY = fixed16(m[4]);
    const float minX = static_cast<float>(win.minX), minY = static_cast<float>(win.minY);
    s.startX = fixed16(m[1] * minY + m[0] * minX + m[2] + fracX);
    s.startY = fixed16(m[4] * minY + m[3] * minX + m[5] + fracY);
    s.firstOutCol = -offX;
    s.firstOutRow = static_cast<int>(firstRow - win.minY);
    s.cols = static_cast<int>(win.maxX - firstCol + 1);
    s.rows = static_cast<int>(win.maxY - firstRow + 1);
    if (width <= 0 || height <= 0) return true;  // no source pixel to sample
    if (kernel == Kernel::Plain)
        sampleAffinePlain(source, dst, s);
    else
        sampleAffineFast(source, dst, s);
    return true;
}

}  // namespace geometry

bool WarpAffine(const float* m, const CImage& src, CImage& dst, bool fit, const SPoint* shift, CPoint* corners) {
    return geometry::warpAffineWith(m, src, dst, fit, shift, corners, geometry::Kernel::Fast);
}
