#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>

#include "geometry/Geometry.h"
#include "geometry/GeometryInternal.h"
#include "geometry/GeometryTestSupport.h"
#include "imagelib/Parallel.h"

using geometry_test::noiseImage;
using geometry_test::samePixels;

namespace {

CImage cappedCopy(const CImage& img) {
    CImage out(img);
    for (size_t i = 0; i < out.GetSize(); ++i) out.GetBits()[i] = std::min<unsigned char>(out.GetBits()[i], 254);
    return out;
}

}  // namespace

TEST(WarpAffine, NearIdentityCopiesWithBytesCappedAt254) {
    const CImage src = noiseImage(9, 7, 24);  // noise includes 255s
    const float identity[6] = {1, 0, 0, 0, 1, 0};
    const float smallShift[6] = {1, 0, 0.1f, 0, 1, 0};  // too small to resample: still a copy
    for (const float* m : {identity, smallShift}) {
        CImage dst(3, 3, 8);
        const SPoint shift(-2.0f, 0.5f);  // ignored by the shortcut
        ASSERT_TRUE(WarpAffine(m, src, dst, false, &shift, nullptr));
        EXPECT_TRUE(samePixels(dst, cappedCopy(src)));
    }
}

TEST(WarpAffine, QuarterTurnWithFitSwapsSizeAndReportsOutputCorners) {
    const int W = 12, H = 7;
    const CImage src = noiseImage(W, H, 8);
    const float m[6] = {0, 1, 0, -1, 0, 0};  // output (X, Y) reads source (Y, -X)
    CImage dst;
    CPoint corners[4];
    ASSERT_TRUE(WarpAffine(m, src, dst, true, nullptr, corners));
    EXPECT_EQ(dst.GetWidth(), H);
    EXPECT_EQ(dst.GetHeight(), W);
    EXPECT_EQ(dst.GetBitCount(), 8);
    EXPECT_EQ(corners[0], CPoint(H - 1, 0));
    EXPECT_EQ(corners[1], CPoint(H - 1, W - 1));
    EXPECT_EQ(corners[2], CPoint(0, W - 1));
    EXPECT_EQ(corners[3], CPoint(0, 0));
    // The step -1 becomes -65535 in 16.16, so samples drift by 1/65536 per pixel: within one level.
    for (int y = 0; y < W; ++y)
        for (int x = 0; x < H; ++x)
            EXPECT_NEAR(*dst.GetPtrXY(x, y), std::min<int>(*src.GetPtrXY(y, H - 1 - x), 254), 1) << x << "," << y;
}

TEST(WarpAffine, NegativeShiftMovesContentRightAndLeavesFirstColumnsUnwritten) {
    const CImage src = noiseImage(11, 5, 24, 3);
    // Half-pixel sampling: a2 = 0.25 plus the shift's fraction 0.25 (-2.75 rounds to -3).
    const float m[6] = {1, 0, 0.25f, 0, 1, 0};
    const SPoint shift(-2.75f, 0.0f);
    CImage dst(11, 5, 24);
    dst.Set(7);
    ASSERT_TRUE(WarpAffine(m, src, dst, false, &shift, nullptr));
    EXPECT_EQ(dst.GetWidth(), 11);  // fit false keeps dst's size
    for (int y = 0; y < 5; ++y) {
        for (int x = 0; x < 3; ++x)
            for (int c = 0; c < 3; ++c) EXPECT_EQ(dst.GetPtrXY(x, y)[c], 7);
        for (int x = 3; x < 11; ++x)
            for (int c = 0; c < 3; ++c) {
                // The last source row has no row below: its pixels are copied.
                const int left = src.GetPtrXY(x - 3, y)[c], right = src.GetPtrXY(x - 2, y)[c];
                const int expected = std::min(254, y == 4 ? left : (left + right) >> 1);
                EXPECT_EQ(dst.GetPtrXY(x, y)[c], expected) << x << "," << y;
            }
    }
}

TEST(WarpAffine, FitFalseKeepsDestinationSize) {
    const CImage src = noiseImage(20, 30, 8);
    const float m[6] = {0.9f, 0.1f, 2, -0.1f, 0.9f, 3};
    CImage dst(10, 7, 8);
    ASSERT_TRUE(WarpAffine(m, src, dst, false, nullptr, nullptr));
    EXPECT_EQ(dst.GetWidth(), 10);
    EXPECT_EQ(dst.GetHeight(), 7);
}

TEST(WarpAffine, RefusesWhatCannotBeWarped) {
    const CImage src = noiseImage(8, 8, 24);
    const float rotate[6] = {0.8f, -0.6f, 0, 0.6f, 0.8f, 0};

    const float singular[6] = {1, 1, 0, 1, 1, 0};
    CImage dst = noiseImage(4, 4, 24, 9);
    const CImage before(dst);
    EXPECT_FALSE(WarpAffine(singular, src, dst, true, nullptr, nullptr));
    EXPECT_TRUE(samePixels(dst, before));

    CImage labels(8, 8, 16), out;
    EXPECT_FALSE(WarpAffine(rotate, labels, out, true, nullptr, nullptr));

    // A destination of another depth would be written past its rows.
    CImage grey(8, 8, 8);
    EXPECT_FALSE(WarpAffine(rotate, src, grey, false, nullptr, nullptr));

    geometry_test::TraceCapture trace;
    CImage small(8, 8, 24);
    const SPoint farLeft(-100.0f, 0.0f);
    EXPECT_FALSE(WarpAffine(rotate, src, small, false, &farLeft, nullptr));
    EXPECT_TRUE(trace.saw(L"WarpAffine: out of range\n"));
}

// The fast path (parallel rows, vector groups) against the plain definition, on odd and
// even sizes, maps reaching outside the source, shifts, and src passed as dst.
TEST(WarpAffine, FastPathMatchesPlainDefinition) {
    struct Case {
        float m[6];
        bool fit;
        SPoint shift;
    };
    const Case cases[] = {
        {{0.9994f, -0.0349f, 3.3f, 0.0349f, 0.9994f, -2.1f}, true, {0.3f, -0.4f}},
        {{0.7071f, 0.7071f, -5, -0.7071f, 0.7071f, 20}, false, {-2.6f, -1.2f}},
        {{1.37f, 0.02f, -0.5f, -0.03f, 0.61f, 1.5f}, true, {0, 0}},
        {{-1, 0, 40, 0, 1, 0.5f}, false, {0, 0}},
        {{30000, 0, 0, 0, 30000, 0}, false, {0, 0}},  // 16.16 positions wrap
    };
    geometry_test::forEachVectorTarget([&](const char* target) {
        for (int bits : {8, 24}) {
            for (int size : {37, 64}) {
                for (const Case& c : cases) {
                    for (int threads : {1, 2}) {
                        imagelib::SetThreadLimit(threads);
                        const CImage src = noiseImage(size, size + 3, bits, static_cast<uint32_t>(size + bits));
                        CImage plain = noiseImage(size + 5, size - 4, bits, 5), fast(plain);
                        CPoint plainCorners[4], fastCorners[4];
                        const bool a = geometry::warpAffineWith(c.m, src, plain, c.fit, &c.shift, plainCorners,
                                                                geometry::Kernel::Plain);
                        const bool b = WarpAffine(c.m, src, fast, c.fit, &c.shift, fastCorners);
                        imagelib::SetThreadLimit(0);
                        ASSERT_EQ(a, b);
                        ASSERT_TRUE(samePixels(plain, fast))
                            << target << ", " << bits << " bits, size " << size << ", map " << c.m[0];
                        if (c.fit) {
                            ASSERT_TRUE(std::equal(plainCorners, plainCorners + 4, fastCorners));
                        }
                    }
                }
            }
        }
    });
}

TEST(WarpAffine, SourceMayBeTheDestination) {
    const CImage original = noiseImage(23, 17, 24, 4);
    const float m[6] = {0.96f, -0.28f, 4, 0.28f, 0.96f, -3};
    CImage expected;
    ASSERT_TRUE(WarpAffine(m, original, expected, true, nullptr, nullptr));
    CImage img(original);
    ASSERT_TRUE(WarpAffine(m, img, img, true, nullptr, nullptr));
    EXPECT_TRUE(samePixels(img, expected));
}
