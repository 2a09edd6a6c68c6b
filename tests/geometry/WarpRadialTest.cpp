#include <gtest/gtest.h>

#include "geometry/Geometry.h"
#include "geometry/GeometryInternal.h"
#include "geometry/GeometryTestSupport.h"
#include "imagelib/Parallel.h"

using geometry_test::noiseImage;
using geometry_test::samePixels;

namespace {
const float kNoDistortion[5] = {0, 0, 0, 0, 0};
}

TEST(WarpRadial, ZeroCoefficientsCopyAnEvenSizedImage) {
    for (int bits : {8, 24}) {
        const CImage src = noiseImage(16, 10, bits);
        CImage dst(16, 10, bits);
        ASSERT_TRUE(WarpRadial(kNoDistortion, src, dst));
        EXPECT_TRUE(samePixels(dst, src));
    }
}

TEST(WarpRadial, PositiveK1LeavesWhiteGapsAndKeepsTheCentre) {
    const CImage src = noiseImage(40, 30, 24, 2, 250);  // no 255 in the source
    CImage dst(40, 30, 24);
    const float barrel[5] = {0.3f, 0, 0, 0, 0};
    ASSERT_TRUE(WarpRadial(barrel, src, dst));
    int white = 0;
    for (int y = 0; y < 30; ++y)
        for (int x = 0; x < 40; ++x) white += dst.GetPtrXY(x, y)[0] == 255;
    EXPECT_GT(white, 0);
    for (int c = 0; c < 3; ++c) EXPECT_EQ(dst.GetPtrXY(20, 15)[c], src.GetPtrXY(20, 15)[c]);
}

TEST(WarpRadial, RefusesMismatchedImagesWithoutWriting) {
    const CImage src = noiseImage(8, 8, 8);
    CImage dst = noiseImage(8, 9, 8, 3);
    const CImage before(dst);
    EXPECT_FALSE(WarpRadial(kNoDistortion, src, dst));
    EXPECT_TRUE(samePixels(dst, before));
    CImage labels(8, 8, 16), labelsOut(8, 8, 16);
    EXPECT_FALSE(WarpRadial(kNoDistortion, labels, labelsOut));
}

TEST(WarpRadialAndScale, ZeroCoefficientsReproduceAllButTheLastColumnAndRow) {
    const CImage src = noiseImage(16, 8, 24);
    CImage dst(16, 8, 24);
    ASSERT_TRUE(WarpRadialAndScale(kNoDistortion, src, dst));
    for (int y = 0; y < 8; ++y)
        for (int x = 0; x < 16; ++x)
            for (int c = 0; c < 3; ++c) {
                const int expected = (x == 15 || y == 7) ? 255 : src.GetPtrXY(x, y)[c];
                ASSERT_EQ(dst.GetPtrXY(x, y)[c], expected) << x << "," << y;
            }
}

TEST(WarpRadialAndScale, TwiceTheSizeInterpolatesBetweenSourcePixels) {
    const CImage src = noiseImage(8, 4, 8);
    CImage dst(16, 8, 8);
    ASSERT_TRUE(WarpRadialAndScale(kNoDistortion, src, dst));
    auto s = [&](int x, int y) { return static_cast<int>(*src.GetPtrXY(x, y)); };
    for (int y = 0; y < 3; ++y)
        for (int x = 0; x < 7; ++x) {
            EXPECT_EQ(*dst.GetPtrXY(2 * x, 2 * y), s(x, y));
            EXPECT_EQ(*dst.GetPtrXY(2 * x + 1, 2 * y), (s(x, y) + s(x + 1, y) + 1) >> 1);
            EXPECT_EQ(*dst.GetPtrXY(2 * x, 2 * y + 1), (s(x, y) + s(x, y + 1) + 1) >> 1);
        }
}

TEST(WarpRadialAndScale, RefusesWrongDepthOrEmptyDestination) {
    geometry_test::TraceCapture trace;
    const CImage src = noiseImage(8, 8, 24);
    CImage grey(8, 8, 8), empty;
    empty.Reallocate(0, 5, 24, 0);
    EXPECT_FALSE(WarpRadialAndScale(kNoDistortion, src, grey));
    EXPECT_TRUE(trace.saw(L"WarpRadialAndScale - wrong dimensions\n"));
    EXPECT_FALSE(WarpRadialAndScale(kNoDistortion, src, empty));  // would divide by its width
}

// Parallel rows with per-column tables against the plain definition, including
// coefficients whose 32-bit arithmetic wraps, and src passed as dst.
TEST(WarpRadialAndScale, FastPathMatchesPlainDefinition) {
    const float cases[][5] = {
        {0.08f, -0.02f, 0.004f, 0.02f, -0.03f},
        {-0.3f, 0.1f, 0, -0.4f, 0.25f},
        {60, -40, 25, 3, -2},  // products overflow 32 bits
    };
    geometry_test::forEachVectorTarget([&](const char* target) {
        for (int bits : {8, 24}) {
            for (const auto& p : cases) {
                for (int threads : {1, 2}) {
                    imagelib::SetThreadLimit(threads);
                    const CImage src = noiseImage(33, 21, bits, 6);
                    CImage plain(45, 30, bits), fast(45, 30, bits);
                    ASSERT_TRUE(geometry::warpRadialAndScaleWith(p, src, plain, geometry::Kernel::Plain));
                    ASSERT_TRUE(WarpRadialAndScale(p, src, fast));
                    EXPECT_TRUE(samePixels(plain, fast)) << target << ", " << bits << " bits, k1 " << p[0];
                    CImage same(src), expected(src.GetWidth(), src.GetHeight(), bits);
                    ASSERT_TRUE(WarpRadialAndScale(p, src, expected));
                    ASSERT_TRUE(WarpRadialAndScale(p, same, same));
                    EXPECT_TRUE(samePixels(same, expected));
                    imagelib::SetThreadLimit(0);
                }
            }
        }
    });
}
