#include <gtest/gtest.h>

#include <functional>

#include "geometry/Geometry.h"
#include "geometry/GeometryTestSupport.h"

using geometry_test::noiseImage;
using geometry_test::samePixels;

namespace {

// Every row holds the same profile.
CImage rowsOf(int width, int height, const std::function<int(int)>& profile) {
    CImage img(width, height, 8);
    for (int y = 0; y < height; ++y)
        for (int x = 0; x < width; ++x) *img.GetPtrXY(x, y) = static_cast<unsigned char>(profile(x));
    return img;
}

// Rows 2 … H-3 must equal `painted`, the two rows at each end must keep `original`.
void expectPaintedRows(const CImage& img, const CImage& original, const std::function<int(int)>& painted) {
    const int H = img.GetHeight();
    for (int y = 0; y < H; ++y)
        for (int x = 0; x < img.GetWidth(); ++x) {
            const int expected = (y >= 2 && y <= H - 3) ? painted(x) : *original.GetPtrXY(x, y);
            ASSERT_EQ(*img.GetPtrXY(x, y), expected) << x << "," << y;
        }
}

}  // namespace

TEST(HillsVallysThreshold, SingleRisingStepIsAlsoTheLastEdge) {
    const CImage original = rowsOf(20, 8, [](int x) { return x < 10 ? 0 : 200; });
    CImage img(original);
    HillsVallysThreshold(img, 100);
    expectPaintedRows(img, original, [](int) { return 100; });
}

TEST(HillsVallysThreshold, BrightBarBecomesAHillBetweenItsEdges) {
    const CImage original = rowsOf(30, 9, [](int x) { return x >= 10 && x < 20 ? 200 : 10; });
    CImage img(original);
    HillsVallysThreshold(img, 100);
    // The derivative peaks first at 9 (rising) and 19 (falling); equal neighbours are dropped.
    expectPaintedRows(img, original, [](int x) { return x >= 9 && x < 19 ? 200 : 100; });
}

TEST(HillsVallysThreshold, RowsWithoutStrongEdgesKeepTheirValues) {
    const CImage original = rowsOf(30, 9, [](int x) { return x >= 10 && x < 20 ? 200 : 10; });
    CImage img(original);
    HillsVallysThreshold(img, 1000);
    EXPECT_TRUE(samePixels(img, original));
}

// Period-4 stripes put an edge every second column, more than a third of the width.
TEST(HillsVallysThreshold, DenseEdgesArePaintedCompletely) {
    const CImage original = rowsOf(24, 7, [](int x) { return (x % 4) < 2 ? 0 : 255; });
    CImage img(original);
    HillsVallysThreshold(img, 100);
    // Edges: rising at 2, falling at 3, then alternating every two columns up to rising 21.
    expectPaintedRows(img, original, [](int x) {
        if (x < 2 || x >= 21) return 100;
        if (x == 2) return 200;
        return ((x - 3) / 2) % 2 == 0 ? 0 : 200;
    });
}

TEST(HillsVallysThreshold, LeavesOtherDepthsAndTinyImagesUnchanged) {
    const CImage colour = noiseImage(20, 10, 24);
    CImage img(colour);
    HillsVallysThreshold(img, 10);
    EXPECT_TRUE(samePixels(img, colour));
    for (const auto& [w, h] : {std::pair{4, 20}, std::pair{20, 4}, std::pair{0, 0}}) {
        const CImage tiny = noiseImage(w, h, 8);
        CImage out(tiny);
        HillsVallysThreshold(out, 0);
        EXPECT_TRUE(samePixels(out, tiny));
    }
}
