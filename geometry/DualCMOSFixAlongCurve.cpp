// DualCMOSFixAlongCurve: straightens the join of a two-sensor scan column by column, then
// rotates the result with the image library.

#include <algorithm>
#include <cmath>
#include <cstdint>

#include "geometry/Geometry.h"
#include "geometry/GeometryInternal.h"
#include "imagelib/Round.h"
#include "imagelib/Trace.h"

namespace geometry {
namespace {

struct Seam {
    float q0, q1, q2;
    float x0, x1;  // measured columns
    float yA, yB;  // seam heights at x0 and x1

    float curve(float x) const { return q0 * x * x + q1 * x + q2; }
    float chord(float x) const {
        const float t = (x - x0) / (x1 - x0);
        return (1 - t) * yA + t * yB;
    }
};

// Far beyond any image row: columns whose chord or deviation exceed it cannot touch the
// image, and the rounding and truncation below stay within int range.
constexpr double kFar = 1e8;

// Largest deviation of the curve from its chord over the measured columns.
double largestDeviation(const Seam& seam) {
    double dev = 0.0;
    for (int x = imagelib::round(seam.x0); static_cast<float>(x) < seam.x1; ++x) {
        const float xf = static_cast<float>(x);
        dev = std::max(dev, std::fabs(static_cast<double>(seam.curve(xf)) - static_cast<double>(seam.chord(xf))));
    }
    return dev;
}

// One column of the correction: reads src's column x, writes dst's.
class ColumnShift {
public:
    ColumnShift(const CImage& src, CImage& dst, int x)
        : m_in(PixelGrid::of(src)), m_out(PixelGrid::of(dst)), m_x(x), m_height(src.GetHeight()) {}

    // Output row round(yo) from source position ys, blending rows trunc(ys) and the one below.
    // Rows outside the image are skipped. For ys in (-1, 0) the blend extrapolates; its bytes
    // are clamped instead of wrapping.
    void write(double yo, double ys) const {
        const int row = imagelib::round(yo);
        const int iy = static_cast<int>(ys);
        if (row < 0 || row >= m_height || iy < 0 || iy + 1 > m_height - 1) return;
        const double f = ys - iy;
        const unsigned char* upper = m_in.at(m_x, iy);
        const unsigned char* lower = upper + m_in.rowStep;
        unsigned char* out = m_out.at(m_x, row);
        for (int b = 0; b < m_in.bpp; ++b) {
            const int v = static_cast<int>(upper[b] * (1 - f) + lower[b] * f);
            out[b] = static_cast<unsigned char>(std::clamp(v, 0, 255));
        }
    }

private:
    PixelGrid m_in, m_out;
    int m_x, m_height;
};

int64_t floorOf(double v) { return static_cast<int64_t>(std::floor(v)); }
int64_t ceilOf(double v) { return static_cast<int64_t>(std::ceil(v)); }

// Rows of column x. k counts rows away from the far end of the band; only the k whose
// output row can fall inside the image are visited (the others write nothing), which keeps
// a tall band or a chord far outside the image cheap.
void correctColumn(const CImage& src, CImage& dst, const Seam& seam, int x, int dir, int bandHeight) {
    const int H = src.GetHeight();
    const float xf = static_cast<float>(x);
    const double c = seam.chord(xf);
    const double d = seam.curve(xf) - c;
    if (!(std::fabs(c) < kFar && std::fabs(d) < kFar)) return;
    const double base = dir * bandHeight + c;
    const ColumnShift column(src, dst, x);

    // Band: the shift grows from d/N to d. Output rows within [-1, H] need k·dir in [base - H, base + 1].
    const int64_t bandFirst = std::max<int64_t>(1, dir > 0 ? floorOf(base - H) : floorOf(-base - 1));
    const int64_t bandLast = std::min<int64_t>(bandHeight, dir > 0 ? ceilOf(base + 1) : ceilOf(H - base));
    for (int64_t k = bandFirst; k <= bandLast; ++k) {
        const double yo = base - static_cast<double>(k * dir);
        const double ys = static_cast<float>(k) / static_cast<float>(bandHeight) * d + yo;
        column.write(yo, ys);
    }

    // Beyond the band: the full shift, walking away from the band until a row leaves the
    // image. Rows that start beyond the far side of the image can neither stop the walk nor
    // be written, and are passed over.
    const double nearer = dir > 0 ? std::min(base, base + d) - H - 1 : -2 - std::max(base, base + d);
    for (int64_t k = std::max<int64_t>(bandHeight + 1, floorOf(nearer));; ++k) {
        const double yo = base - static_cast<double>(k * dir);
        const double ys = yo + d;
        const int rowOut = imagelib::round(yo), rowIn = imagelib::round(ys);
        if (dir < 0 && (rowIn >= H - 1 || rowOut >= H - 1)) break;
        if (dir > 0 && (rowIn < 0 || rowOut < 0)) break;
        column.write(yo, ys);
    }
}

bool isUsableSeam(const float* q, SPoint range) {
    constexpr float kColumnLimit = 1 << 24;  // columns are exact in float below this
    for (float v : {q[0], q[1], q[2]})
        if (!std::isfinite(v)) return false;
    return std::fabs(range.x) < kColumnLimit && std::fabs(range.y) < kColumnLimit && range.y > range.x;
}

}  // namespace
}  // namespace geometry

void DualCMOSFixAlongCurve(const CImage& src, CImage& dst, float angle, float second, const float* q,
                           SPoint range) {
    using namespace geometry;
    if (!isGreyOrColour(src)) {
        Trace(L"DualCMOSFixAlongCurve: only 8- and 24-bit images\n");
        return;
    }
    if (!isUsableSeam(q, range)) {
        Trace(L"DualCMOSFixAlongCurve: the seam needs finite coefficients and columns x0 < x1\n");
        return;
    }
    Seam seam{q[0], q[1], q[2], range.x, range.y, 0.0f, 0.0f};
    seam.yA = seam.curve(seam.x0);
    seam.yB = seam.curve(seam.x1);
    const double bandScaled = 10 * largestDeviation(seam);
    if (!(std::isfinite(seam.yA) && std::isfinite(seam.yB) && bandScaled < kFar)) {
        Trace(L"DualCMOSFixAlongCurve: the seam leaves the image far behind\n");
        return;
    }

    CImage keep;
    const CImage& source = distinctSource(src, dst, keep);
    dst = source;
    const int bandHeight = imagelib::round(bandScaled);
    const int H = source.GetHeight();
    // The seam lies in the upper half (its upper side is corrected) unless it starts below the middle.
    const int dir = seam.yA > static_cast<float>(H / 2) ? -1 : 1;
    if (!dst.IsEmpty())
        for (int x = 0; x < source.GetWidth(); ++x) correctColumn(source, dst, seam, x, dir, bandHeight);

    dst.Rotate(angle, 255, second);
    dst.Rotate90ClockWise(1);
}
