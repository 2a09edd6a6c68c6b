// WarpRadial: forward radial mapping in float, one source pixel copied to where it lands.
// Sequential on purpose: where two source pixels land on the same output pixel, the later
// one in row order wins.

#include <cmath>
#include <cstring>

#include "geometry/Geometry.h"
#include "geometry/GeometryInternal.h"
#include "imagelib/Round.h"
#include "imagelib/Trace.h"

bool WarpRadial(const float* p, const CImage& src, CImage& dst) {
    using namespace geometry;
    if (src.GetWidth() != dst.GetWidth() || src.GetHeight() != dst.GetHeight() ||
        src.GetBitCount() != dst.GetBitCount())
        return false;
    if (!isGreyOrColour(src)) {
        Trace(L"WarpRadial: only 8- and 24-bit images\n");
        return false;
    }
    CImage keep;
    const CImage& source = distinctSource(src, dst, keep);
    dst.Set(255);
    const int w = source.GetWidth(), h = source.GetHeight();
    if (w <= 0 || h <= 0) return true;

    const float k1 = p[0], k2 = p[1], k3 = p[2], cx = p[3], cy = p[4];
    const int halfW = w / 2, halfH = h / 2;
    constexpr float kFarOutside = 1e9f;
    const PixelGrid in = PixelGrid::of(source), out = PixelGrid::of(dst);
    for (int y = 0; y < h; ++y) {
        const float yn = static_cast<float>(y - halfH) * 2 / static_cast<float>(h);
        const float dy = yn - cy;
        for (int x = 0; x < w; ++x) {
            const float xn = static_cast<float>(x - halfW) * 2 / static_cast<float>(w);
            const float dx = xn - cx;
            const float r2 = dx * dx + dy * dy;
            const float k = r2 * k1 + r2 * k2 * r2 + r2 * k3 * r2 * r2;
            const float offX = (k * dx + xn) * static_cast<float>(halfW);
            const float offY = (k * dy + yn) * static_cast<float>(halfH);
            // A wild coefficient lands far outside (or on NaN); never round such a value.
            if (!(std::fabs(offX) < kFarOutside && std::fabs(offY) < kFarOutside)) continue;
            const int X = halfW + imagelib::round(offX), Y = halfH + imagelib::round(offY);
            if (X >= 0 && X < w && Y >= 0 && Y < h) std::memcpy(out.at(X, Y), in.at(x, y), in.bpp);
        }
    }
    return true;
}
