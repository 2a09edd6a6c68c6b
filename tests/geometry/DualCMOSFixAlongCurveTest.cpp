#include <gtest/gtest.h>

#include <cmath>
#include <limits>

#include "geometry/Geometry.h"
#include "geometry/GeometryTestSupport.h"

using geometry_test::noiseImage;
using geometry_test::samePixels;

namespace {

// Rows of one value each, 10·y + 3, so a blend of two rows never lands on a whole number.
CImage rowRamp(int width, int height, int bits) {
    CImage img(width, height, bits);
    for (int y = 0; y < height; ++y)
        for (int i = 0; i < width * bits / 8; ++i) img.GetPtrXY(0, y)[i] = static_cast<unsigned char>(10 * y + 3);
    return img;
}

// The image as it was before the final quarter turn (angle 0 leaves Rotate a no-op).
CImage beforeTurn(const CImage& dst) {
    CImage img(dst);
    img.Rotate90ClockWise(3);
    return img;
}

int at(const CImage& img, int x, int y) { return *img.GetPtrXY(x, y); }

}  // namespace

TEST(DualCMOSFixAlongCurve, FlatSeamAtWholeRowOnlyTurnsTheImage) {
    const CImage src = noiseImage(15, 12, 24);
    const float q[3] = {0, 0, 4};
    CImage dst;
    DualCMOSFixAlongCurve(src, dst, 0.0f, 0.0f, q, SPoint(0, 14));
    CImage expected(src);
    expected.Rotate90ClockWise(1);
    EXPECT_TRUE(samePixels(dst, expected));
}

TEST(DualCMOSFixAlongCurve, FlatSeamAtFractionalRowBlendsTheRowsAbove) {
    const CImage src = rowRamp(6, 24, 8);
    const float q[3] = {0, 0, 8.25f};
    CImage dst;
    DualCMOSFixAlongCurve(src, dst, 0.0f, 0.0f, q, SPoint(0, 5));
    const CImage fixed = beforeTurn(dst);
    for (int x = 0; x < 6; ++x) {
        for (int y = 0; y < 8; ++y)  // row y reads source position y + 0.25
            EXPECT_EQ(at(fixed, x, y), 10 * y + 3 + 2) << x << "," << y;
        for (int y = 8; y < 24; ++y) EXPECT_EQ(at(fixed, x, y), 10 * y + 3) << x << "," << y;
    }
}

// A straight tilted seam (no band) starting exactly at H/2 counts as the upper half: the
// rows above it are resampled, those below kept. Starting just below H/2 flips the side.
TEST(DualCMOSFixAlongCurve, SeamStartingAtHalfHeightCorrectsTheUpperSide) {
    const CImage src = rowRamp(4, 24, 8);
    CImage dst;
    const float atHalf[3] = {0, 0.25f, 12};  // column 1: chord 12.25
    DualCMOSFixAlongCurve(src, dst, 0.0f, 0.0f, atHalf, SPoint(0, 3));
    CImage fixed = beforeTurn(dst);
    EXPECT_EQ(at(fixed, 1, 11), 10 * 11 + 3 + 2);
    EXPECT_EQ(at(fixed, 1, 14), 10 * 14 + 3);

    const float belowHalf[3] = {0, 0.25f, 12.25f};  // column 0: chord 12.25
    DualCMOSFixAlongCurve(src, dst, 0.0f, 0.0f, belowHalf, SPoint(0, 3));
    fixed = beforeTurn(dst);
    EXPECT_EQ(at(fixed, 0, 11), 10 * 11 + 3);
    EXPECT_EQ(at(fixed, 0, 13), 10 * 13 + 3 + 2);
}

TEST(DualCMOSFixAlongCurve, CurvedSeamMovesContentOntoTheChord) {
    // Seam through (0, 6), (10, 8.5), (20, 6): a bulge of 2.5 rows, band height 25.
    CImage src = rowRamp(21, 40, 8);
    const float q[3] = {-0.025f, 0.5f, 6};
    CImage dst;
    DualCMOSFixAlongCurve(src, dst, 0.0f, 0.0f, q, SPoint(0, 20));
    const CImage fixed = beforeTurn(dst);
    // End columns lie on the chord: untouched. In the middle the band ends (row 6 = chord)
    // reading 2.5 rows further down, and rows beyond the band keep the source.
    EXPECT_EQ(at(fixed, 0, 5), at(src, 0, 5));
    EXPECT_EQ(at(fixed, 10, 6), 10 * 8 + 3 + 5);
    EXPECT_EQ(at(fixed, 10, 35), at(src, 10, 35));
}

TEST(DualCMOSFixAlongCurve, RefusesBadInputAndSurvivesWildSeams) {
    const CImage src = noiseImage(12, 10, 8);
    CImage dst = noiseImage(3, 3, 8, 7);
    const CImage before(dst);
    const float q[3] = {0, 0, 4};
    DualCMOSFixAlongCurve(src, dst, 0.0f, 0.0f, q, SPoint(5, 5));  // x1 = x0
    DualCMOSFixAlongCurve(src, dst, 0.0f, 0.0f, q, SPoint(6, 2));  // x1 < x0
    DualCMOSFixAlongCurve(CImage(12, 10, 16), dst, 0.0f, 0.0f, q, SPoint(0, 11));
    const float nan = std::numeric_limits<float>::quiet_NaN();
    const float notANumber[3] = {0, nan, 4};
    DualCMOSFixAlongCurve(src, dst, 0.0f, 0.0f, notANumber, SPoint(0, 11));
    EXPECT_TRUE(samePixels(dst, before));

    // Seams far outside the image, steep or deep: nothing is read or written out of range.
    const float wild[][3] = {{3, -40, 5}, {0, 500, -900}, {-1e6f, 1e3f, 1e5f}, {0.5f, 0, -30}};
    for (const auto& w : wild) DualCMOSFixAlongCurve(src, dst, 10.0f, 0.0f, w, SPoint(-3, 40));
    EXPECT_EQ(dst.GetWidth(), 10);

    CImage empty, out;
    DualCMOSFixAlongCurve(empty, out, 5.0f, 0.0f, q, SPoint(0, 1));  // W = 0: only the rotation
    EXPECT_TRUE(out.IsEmpty());
}

TEST(DualCMOSFixAlongCurve, SourceMayBeTheDestination) {
    const CImage original = noiseImage(17, 30, 24, 8);
    const float q[3] = {0.01f, -0.1f, 9.3f};
    CImage expected;
    DualCMOSFixAlongCurve(original, expected, 2.0f, 0.0f, q, SPoint(0, 16));
    CImage img(original);
    DualCMOSFixAlongCurve(img, img, 2.0f, 0.0f, q, SPoint(0, 16));
    EXPECT_TRUE(samePixels(img, expected));
}
