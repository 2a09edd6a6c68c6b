#include <gtest/gtest.h>

#include <random>
#include <vector>

#include "common/TestImages.h"
#include "holograms/FourImagePyramidInternal.h"
#include "holograms/test_four_support.h"
#include "scene/Scene.h"

using namespace four_test;

namespace {

Bgr Composed(const Bgr d[4], const int bright[4]) {
    return ApplyPixelRule(d, [&](const unsigned char* const detail[4], unsigned char* out) {
        holo4::ComposePixel(detail, bright, out);
    });
}

CImage OwnCollapse(const CImage& image) {
    CPyramid p(7, image);
    p.MakeLaplacian();
    p.ReconstructGaussian();
    return p.GetLevel(0);
}

}  // namespace

TEST(FourImagePyramid, IdenticalInputsCollapseTheirOwnPyramid) {
    const CImage img = testing_images::RandomImage(70, 67, 24, 5);
    const CImage expected = OwnCollapse(img);
    CHologramsRemove remover;
    CImage result;
    remover.HologramsRemove4Img(img, img, img, img, result);
    EXPECT_TRUE(testing_images::SamePixels(result, expected));
    remover.HologramsRemove4Img3(img, img, img, img, result);
    EXPECT_TRUE(testing_images::SamePixels(result, expected));
}

TEST(FourImagePyramid, SaturationBoundAndCopies) {
    const Bgr d[4] = {{20, 100, 130}, {64, 96, 128}, {30, 90, 140}, {10, 50, 150}};
    const int threeSaturated[4] = {240, 250, 245, 239};
    EXPECT_EQ(Composed(d, threeSaturated), d[3]);
    const int allSaturated[4] = {250, 245, 241, 245};
    EXPECT_EQ(Composed(d, allSaturated), d[2]);
    const int allSaturatedTie[4] = {245, 250, 245, 250};
    EXPECT_EQ(Composed(d, allSaturatedTie), d[0]);
    // 239 is not saturated: two unsaturated candidates are synthesised instead of copied.
    const int twoSaturated[4] = {239, 250, 245, 239};
    // P = candidate 0 (peak 130 below 150), colour of the most neutral (candidate 0 too).
    EXPECT_EQ(Composed(d, twoSaturated), (Bgr{20, 100, 130}));
}

TEST(FourImagePyramid, PeakSpreadSixCopiesSevenSynthesises) {
    const int bright[4] = {100, 50, 60, 200};  // least bright: candidate 1, second: candidate 2
    const Bgr close[4] = {{20, 100, 128}, {64, 96, 130}, {30, 90, 134}, {10, 50, 129}};
    EXPECT_EQ(Composed(close, bright), close[2]);  // largest peak, 134 - 128 = 6
    // Spread 7 is synthesised: P = candidate 1 (peak 128), Q's 135 is not within 7 of it,
    // colour of candidate 1 (the most neutral); copying the largest would give candidate 2.
    const Bgr seven[4] = {{10, 50, 130}, {64, 96, 128}, {30, 90, 135}, {10, 50, 129}};
    EXPECT_EQ(Composed(seven, bright), (Bgr{64, 96, 128}));
    // Spread 22: P = candidate 1 (peak 128), colour from the most neutral (candidate 1).
    const Bgr spread[4] = {{20, 100, 130}, {64, 96, 128}, {30, 90, 140}, {10, 50, 150}};
    EXPECT_EQ(Composed(spread, bright), (Bgr{64, 96, 128}));
    // Q's peak 133 exceeds v = 128 > 127 by less than 7: v becomes 133.
    Bgr nearQ[4] = {{20, 100, 130}, {64, 96, 128}, {30, 90, 133}, {10, 50, 150}};
    EXPECT_EQ(Composed(nearQ, bright), (Bgr{66, 99, 133}));
    // No unsaturated detail with all channels non-zero: grey v.
    const Bgr flat[4] = {{0, 100, 130}, {0, 96, 128}, {0, 90, 140}, {0, 50, 150}};
    EXPECT_EQ(Composed(flat, bright), (Bgr{128, 128, 128}));
}

TEST(FourImagePyramid, CoarsestLevelComparesTopAndBottomOnly) {
    const unsigned char top[6] = {90, 90, 90, 50, 50, 50}, bottom[6] = {80, 80, 80, 50, 50, 50};
    const unsigned char dark[6] = {0, 0, 0, 0, 0, 0};
    const unsigned char* lap[4] = {top, bottom, dark, dark};
    unsigned char out[6];
    holo4::DarkerOfFirstTwoRow(lap, out, 2);
    EXPECT_EQ(out[0], 80);  // bottom darker
    EXPECT_EQ(out[3], 50);  // tie: top
    EXPECT_EQ(out[0] + out[3], 130);
}

TEST(FourImagePyramid, Variant3BrightnessBoundAndAllSaturatedTakesTop) {
    const unsigned char lap0[3] = {100, 100, 100}, lap1[3] = {90, 90, 90}, lap2[3] = {80, 80, 80},
                        lap3[3] = {70, 70, 70};
    const unsigned char* lap[4] = {lap0, lap1, lap2, lap3};
    const unsigned char b249[1] = {249}, b250[1] = {250};
    const unsigned char* bright[4] = {b250, b250, b249, b250};
    unsigned char out[3];
    holo4::FlattestUnsaturatedPixels(lap, bright, out, 0, 1);
    EXPECT_EQ(out[0], 80);
    const unsigned char* allBright[4] = {b250, b250, b250, b250};
    holo4::FlattestUnsaturatedPixels(lap, allBright, out, 0, 1);
    EXPECT_EQ(out[0], 100);
}

TEST(FourImagePyramid, MismatchedOrTinyInputsLeaveTheResultAlone) {
    CHologramsRemove remover;
    const CImage a = Solid(70, 70, {1, 2, 3}), narrow = Solid(69, 70, {1, 2, 3});
    CImage grey(70, 70, 8), tiny = Solid(64, 70, {1, 2, 3});
    CImage result = Solid(3, 3, {9, 9, 9});
    remover.HologramsRemove4Img(a, a, narrow, a, result);
    remover.HologramsRemove4Img(a, grey, a, a, result);
    remover.HologramsRemove4Img3(tiny, tiny, tiny, tiny, result);
    remover.HologramsRemove4Img3(a, a, a, narrow, result);
    ASSERT_EQ(result.GetWidth(), 3);
    EXPECT_EQ(At(result, 1, 1), (Bgr{9, 9, 9}));
    remover.HologramsRemove4Img(a, a, a, a, result);  // 70 x 70 is enough for seven levels
    EXPECT_EQ(result.GetWidth(), 70);
}

TEST(FourImagePyramid, GlareLargelyGoneOnAGeneratedCard) {
    const scene::Scene s = scene::GenerateScene({310, 438, 3});
    double worstShot = 1.0;
    for (const CImage& shot : s.shots) worstShot = std::min(worstShot, scene::GlareShare(s, shot));
    CHologramsRemove remover;
    CImage result;
    remover.HologramsRemove4Img(s.shots[0], s.shots[1], s.shots[2], s.shots[3], result);
    EXPECT_LT(scene::GlareShare(s, result), worstShot / 4);
    remover.HologramsRemove4Img3(s.shots[0], s.shots[1], s.shots[2], s.shots[3], result);
    EXPECT_LT(scene::GlareShare(s, result), worstShot / 4);
}

TEST(FourImagePyramid, VectorRowRulesMatchThePlainOnes) {
    std::mt19937 rng(17);
    for (int width : {1, 15, 16, 31, 64, 97, 130}) {
        std::vector<unsigned char> lapBytes[4], brightBytes[4];
        const unsigned char* lap[4];
        const unsigned char* bright[4];
        for (int i = 0; i < 4; ++i) {
            lapBytes[i].resize(3 * width);
            brightBytes[i].resize(width);
            // Mostly quiet detail near 128 (the vector case), sometimes strong detail;
            // brightness around the 240 and 250 bounds.
            for (auto& b : lapBytes[i]) b = static_cast<unsigned char>(rng() % 8 ? 125 + rng() % 7 : rng() % 256);
            for (auto& b : brightBytes[i]) b = static_cast<unsigned char>(rng() % 6 ? rng() % 240 : 236 + rng() % 20);
            lap[i] = lapBytes[i].data();
            bright[i] = brightBytes[i].data();
        }
        std::vector<unsigned char> plain(3 * width), fast(3 * width);
        holo4::ComposePixels(lap, bright, plain.data(), 0, width);
        holo4::ComposeRowFast(lap, bright, fast.data(), width);
        EXPECT_EQ(plain, fast) << width;
        holo4::FlattestUnsaturatedPixels(lap, bright, plain.data(), 0, width);
        holo4::FlattestUnsaturatedRowFast(lap, bright, fast.data(), width);
        EXPECT_EQ(plain, fast) << width;
        std::vector<unsigned char> plainBright(width), fastBright(width);
        holo4::BrightnessRow(lap[0], plainBright.data(), 0, width);
        holo4::BrightnessRowFast(lap[0], fastBright.data(), width);
        EXPECT_EQ(plainBright, fastBright) << width;
    }
}
