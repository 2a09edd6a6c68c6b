#include <gtest/gtest.h>

#include <memory>
#include <vector>

#include "pyramid/Pyramid.h"
#include "pyramid/PyramidTestUtil.h"

using pyramid_test::RandomImage;
using pyramid_test::SameBytes;

namespace {

std::vector<int> Widths(const CPyramid& p) {
    std::vector<int> widths;
    for (int k = 0; k < p.GetLevelsNum(); ++k) widths.push_back(p.GetLevel(k).GetWidth());
    return widths;
}

std::vector<int> Heights(const CPyramid& p) {
    std::vector<int> heights;
    for (int k = 0; k < p.GetLevelsNum(); ++k) heights.push_back(p.GetLevel(k).GetHeight());
    return heights;
}

}  // namespace

TEST(Pyramid, LevelSizes) {
    std::vector<int> widths{2480}, heights{3508};
    for (int k = 1; k < 7; ++k) {
        widths.push_back(CPyramid::NextLevelSize(widths.back()));
        heights.push_back(CPyramid::NextLevelSize(heights.back()));
    }
    EXPECT_EQ(widths, (std::vector<int>{2480, 1240, 620, 310, 155, 78, 39}));
    EXPECT_EQ(heights, (std::vector<int>{3508, 1754, 877, 439, 220, 110, 55}));

    CPyramid narrow(8, RandomImage(101, 40, 24, 1));
    EXPECT_EQ(Widths(narrow), (std::vector<int>{101, 51, 26, 13, 7, 4, 2, 2}));
    EXPECT_EQ(narrow.GetLevel(7).GetBitCount(), 24);
    narrow.MakeLaplacian();  // the 2-pixel levels are out of the reduce's range: skipped, not overrun
    narrow.ReconstructGaussian();
    EXPECT_EQ(narrow.GetStatus(), CPyramid::PyrGaussian);

    CPyramid p(5, 64, 48, 1);
    p.Init(64, 48, 1, 3);
    EXPECT_EQ(Widths(p), (std::vector<int>{64, 32, 16}));
    p.Init(64, 48, 1, 6);
    EXPECT_EQ(Heights(p), (std::vector<int>{48, 24, 12, 6, 3, 2}));
    EXPECT_EQ(p.GetLevel(5).GetBitCount(), 8);
}

TEST(Pyramid, InitKeepsPixelsWhenNothingChanges) {
    CPyramid p(3, RandomImage(40, 30, 8, 2));
    const CImage level1 = p.GetLevel(1);
    p.Init(40, 30, 1, 3);
    EXPECT_TRUE(SameBytes(p.GetLevel(1), level1));
    EXPECT_EQ(p.GetStatus(), CPyramid::PyrNone);
}

TEST(Pyramid, SetImageRefusesOtherDepthOrSize) {
    CPyramid p(3, RandomImage(40, 30, 24, 3));
    p.MakeGaussian();
    const CImage level0 = p.GetLevel(0);
    EXPECT_FALSE(p.SetImage(RandomImage(40, 30, 8, 4)));
    EXPECT_FALSE(p.SetImage(RandomImage(41, 30, 24, 4)));
    EXPECT_FALSE(p.SetImage(RandomImage(40, 29, 24, 4)));
    EXPECT_EQ(p.GetStatus(), CPyramid::PyrGaussian);
    EXPECT_TRUE(SameBytes(p.GetLevel(0), level0));
    EXPECT_FALSE(CPyramid().SetImage(level0));

    const CImage next = RandomImage(40, 30, 24, 5);
    EXPECT_TRUE(p.SetImage(next));
    EXPECT_EQ(p.GetStatus(), CPyramid::PyrNone);
    EXPECT_TRUE(SameBytes(p.GetLevel(0), next));
}

TEST(Pyramid, OperationsOutOfStateDoNothing) {
    CPyramid sized(4, 50, 50, 1);
    sized.MakeGaussian();
    EXPECT_EQ(sized.GetStatus(), CPyramid::PyrNone);
    sized.MakeLaplacian();
    EXPECT_EQ(sized.GetStatus(), CPyramid::PyrNone);

    CPyramid p(4, RandomImage(50, 50, 24, 6));
    p.MakeLaplacian();
    const CPyramid laplacian = p;
    p.MakeLaplacian();
    for (int k = 0; k < 4; ++k) EXPECT_TRUE(SameBytes(p.GetLevel(k), laplacian.GetLevel(k)));
    p.ReconstructGaussian();
    const CPyramid gaussian = p;
    p.ReconstructGaussian();
    for (int k = 0; k < 4; ++k) EXPECT_TRUE(SameBytes(p.GetLevel(k), gaussian.GetLevel(k)));

    const CImage image = RandomImage(30, 20, 8, 7);
    CPyramid single(1, image);
    single.MakeGaussian();
    EXPECT_EQ(single.GetStatus(), CPyramid::PyrGaussian);
    single.MakeLaplacian();
    EXPECT_EQ(single.GetStatus(), CPyramid::PyrLaplacian);
    single.ReconstructGaussian();
    EXPECT_EQ(single.GetStatus(), CPyramid::PyrGaussian);
    EXPECT_TRUE(SameBytes(single.GetLevel(0), image));
}

// Detail levels carry 128 as zero while the collapse takes away 127: every level adds one.
TEST(Pyramid, ReconstructionAddsOnePerLevel) {
    for (int bits : {8, 24}) {
        const int levels = 5;
        const CImage image = RandomImage(71, 52, bits, 8, 100, 150);
        CPyramid p(levels, image);
        CPyramid gaussian;
        p.MakeLaplacian(&gaussian);
        EXPECT_EQ(gaussian.GetStatus(), CPyramid::PyrNone);
        EXPECT_TRUE(SameBytes(gaussian.GetLevel(0), image));
        p.ReconstructGaussian();
        const int rowBytes = 71 * bits / 8;
        for (int y = 0; y < 52; ++y)
            for (int x = 0; x < rowBytes; ++x)
                ASSERT_EQ(p.GetLevel(0).GetPtrXY(0, y)[x], image.GetPtrXY(0, y)[x] + levels - 1) << x << "," << y;
        // The Gaussian copy holds what MakeGaussian gives.
        CPyramid again(levels, image);
        again.MakeGaussian();
        for (int k = 1; k < levels; ++k) EXPECT_TRUE(SameBytes(gaussian.GetLevel(k), again.GetLevel(k)));
    }
}

TEST(Pyramid, InsertPyramidHalvesThePosition) {
    CPyramid target(3, 64, 48, 1), same(3, 64, 48, 1), src(3, 20, 16, 1);
    for (int k = 0; k < 3; ++k) src.GetLevel(k).Set(static_cast<uint8_t>(10 + k));
    EXPECT_FALSE(target.InsertPyramid(same, 0, 0));
    EXPECT_FALSE(target.InsertPyramid(src, -1, 0));
    EXPECT_FALSE(target.InsertPyramid(CPyramid(2, 20, 16, 1), 5, 3));
    CPyramid shortMask(2, 20, 16, 1);
    EXPECT_FALSE(target.InsertPyramid(src, 5, 3, &shortMask));

    ASSERT_TRUE(target.InsertPyramid(src, 5, 3));
    EXPECT_EQ(target.GetLevel(0).GetPtrXY(5, 3)[0], 10);
    EXPECT_EQ(target.GetLevel(0).GetPtrXY(4, 3)[0], 0);
    EXPECT_EQ(target.GetLevel(1).GetPtrXY(2, 1)[0], 11);
    EXPECT_EQ(target.GetLevel(1).GetPtrXY(1, 1)[0], 0);
    EXPECT_EQ(target.GetLevel(1).GetPtrXY(2, 0)[0], 0);
    EXPECT_EQ(target.GetLevel(2).GetPtrXY(1, 0)[0], 12);
    EXPECT_EQ(target.GetLevel(2).GetPtrXY(0, 0)[0], 0);

    CPyramid mask(3, 20, 16, 1), masked(3, 64, 48, 1);
    for (int k = 0; k < 3; ++k) mask.GetLevel(k).GetPtrXY(0, 0)[0] = 1;
    ASSERT_TRUE(masked.InsertPyramid(src, 5, 3, &mask));
    EXPECT_EQ(masked.GetLevel(0).GetPtrXY(5, 3)[0], 0);
    EXPECT_EQ(masked.GetLevel(0).GetPtrXY(6, 3)[0], 10);
}

TEST(Pyramid, CopiesAreIndependent) {
    const CImage image = RandomImage(60, 45, 24, 9);
    auto source = std::make_unique<CPyramid>(4, image);
    source->MakeLaplacian();
    CPyramid copy(*source);
    CPyramid assigned;
    assigned = *source;
    source.reset();
    EXPECT_EQ(copy.GetStatus(), CPyramid::PyrLaplacian);
    copy.ReconstructGaussian();
    assigned.GetLevel(1).Set(0);
    assigned.ReconstructGaussian();
    CPyramid fresh(4, image);
    fresh.MakeLaplacian();
    fresh.ReconstructGaussian();
    EXPECT_TRUE(SameBytes(copy.GetLevel(0), fresh.GetLevel(0)));
    EXPECT_FALSE(SameBytes(assigned.GetLevel(0), fresh.GetLevel(0)));

    CPyramid empty;
    copy = empty;
    EXPECT_EQ(copy.GetLevelsNum(), 0);
    EXPECT_EQ(copy.GetChannels(), 3);
}

TEST(Pyramid, RefusesUnusableGeometry) {
    CPyramid p;
    p.Init(0, 10, 1, 3);
    p.Init(10, 10, 2, 3);
    p.Init(10, 10, 1, -1);
    p.Init(CImage(10, 10, 16), 3);
    EXPECT_EQ(p.GetLevelsNum(), 0);
    CPyramid own(3, RandomImage(30, 30, 8, 10));
    own.Init(own.GetLevel(1), 2);  // an image of its own, freed by the level-count change
    EXPECT_EQ(own.GetLevel(0).GetWidth(), 15);
    EXPECT_EQ(own.GetLevelsNum(), 2);
}
