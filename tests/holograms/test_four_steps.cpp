#include <gtest/gtest.h>

#include <random>
#include <vector>

#include "common/TestImages.h"
#include "holograms/FourImageStepsInternal.h"
#include "holograms/test_four_support.h"
#include "scene/Scene.h"

using namespace four_test;
using testing_images::RandomImage;
using testing_images::SamePixels;

namespace {

struct Stats {
    uint8_t b[9] = {0, 255, 0, 255, 0, 0, 0, 255, 0};  // the reset of step 0
    holo4::StepPixel st{b[0], b[1], b[2], b[3], b[4], b[5], b[6], b[7], b[8]};
};

void RunSteps(CHologramsRemove& r, const CImage* const images[4], CImage& result) {
    for (uint16_t s = 0; s < 4; ++s) r.HologramsRemove4ImgInSteps(*images[s], s, result);
}

Bgr Decide(Stats& s, const Bgr d[4]) {
    return ApplyPixelRule(d, [&](const unsigned char* const detail[4], unsigned char* out) {
        holo4::DecideStepPixel(s.st, detail, out);
    });
}

}  // namespace

TEST(FourImageSteps, IdenticalShotsMatchTheOneShotComposition) {
    const scene::Scene sc = scene::GenerateScene({160, 226, 11});
    const CImage& shot = sc.shots[0];  // has saturated glare
    const CImage* const same[4] = {&shot, &shot, &shot, &shot};
    CHologramsRemove r;
    CImage stepwise, oneShot;
    RunSteps(r, same, stepwise);
    r.HologramsRemove4Img(shot, shot, shot, shot, oneShot);
    EXPECT_TRUE(SamePixels(stepwise, oneShot));
    CPyramid own(7, shot);
    own.MakeLaplacian();
    own.ReconstructGaussian();
    EXPECT_TRUE(SamePixels(stepwise, own.GetLevel(0)));
}

TEST(FourImageSteps, CoarsestLevelIsTheDarkerOfStepsZeroAndOne) {
    const CImage a = RandomImage(70, 66, 24, 1), b = RandomImage(70, 66, 24, 2);
    const CImage dark = Solid(70, 66, {0, 0, 0});
    const CImage* const images[4] = {&a, &b, &dark, &dark};
    CHologramsRemove r;
    CImage result;
    RunSteps(r, images, result);
    CPyramid pa(7, a), pb(7, b);
    pa.MakeGaussian();
    pb.MakeGaussian();
    const CImage& level6 = r.m_resultPyr.GetLevel(6);
    for (int y = 0; y < level6.GetHeight(); ++y)
        for (int x = 0; x < level6.GetWidth(); ++x) {
            const unsigned char* ga = pa.GetLevel(6).GetPtrXY(x, y);
            const unsigned char* gb = pb.GetLevel(6).GetPtrXY(x, y);
            const unsigned char* want = std::max({gb[0], gb[1], gb[2]}) < std::max({ga[0], ga[1], ga[2]}) ? gb : ga;
            ASSERT_EQ(At(level6, x, y), (Bgr{want[0], want[1], want[2]})) << x << "," << y;
        }
}

TEST(FourImageSteps, SaturationCountingAndCopies) {
    Stats s;
    holo4::FoldCandidate(s.st, 0, 240, 130);
    holo4::FoldCandidate(s.st, 1, 239, 128);
    holo4::FoldCandidate(s.st, 1, 239, 128);  // repeated step: nothing counted twice
    EXPECT_EQ(s.b[0], 0x11);
    holo4::FoldCandidate(s.st, 2, 250, 140);
    holo4::FoldCandidate(s.st, 3, 255, 120);
    EXPECT_EQ(s.b[0], 0xD3);
    const Bgr d[4] = {{1, 1, 1}, {2, 2, 2}, {3, 3, 3}, {4, 4, 4}};
    EXPECT_EQ(Decide(s, d), d[1]);  // three saturated: the unsaturated (least bright) one

    Stats all;
    for (int i = 0; i < 4; ++i) holo4::FoldCandidate(all.st, i, 250 - i, 128);
    EXPECT_EQ(Decide(all, d), d[3]);  // four saturated: the least bright
}

TEST(FourImageSteps, NarrowSpreadCopiesThePeakFartherFrom127) {
    const Bgr d[4] = {{140, 140, 140}, {134, 134, 134}, {136, 136, 136}, {137, 137, 137}};
    Stats s;
    for (int i = 0; i < 4; ++i) holo4::FoldCandidate(s.st, i, 100 + i, d[i].b);
    EXPECT_EQ(Decide(s, d), d[0]);  // 140 - 127 = 13 is not <= 127 - 134
    const Bgr e[4] = {{127, 127, 127}, {130, 130, 130}, {124, 124, 124}, {125, 125, 125}};
    Stats t;
    for (int i = 0; i < 4; ++i) holo4::FoldCandidate(t.st, i, 100 + i, e[i].b);
    EXPECT_EQ(Decide(t, e), e[2]);  // 3 against 3: the smallest peak
}

TEST(FourImageSteps, SynthesisedPixel) {
    // Least bright 1, second 0; candidate 1 has the smaller peak, so P = 1, Q = 0.
    const Bgr d[4] = {{64, 96, 134}, {64, 96, 128}, {10, 50, 150}, {0, 0, 0}};
    Stats s;
    const int bright[4] = {60, 50, 200, 210};
    for (int i = 0; i < 4; ++i) holo4::FoldCandidate(s.st, i, bright[i], std::max({d[i].b, d[i].g, d[i].r}));
    // v = 128 > 127 and 134 - 128 < 7: v = 134; colour from candidate 1 (neutrality 0.5).
    EXPECT_EQ(Decide(s, d), (Bgr{67, 100, 134}));

    // The colour candidate without detail writes 0.
    const Bgr z[4] = {{0, 0, 0}, {0, 0, 0}, {0, 0, 0}, {0, 0, 0}};
    Stats t;
    holo4::FoldCandidate(t.st, 0, 245, 200);  // one saturated: synthesis
    for (int i = 1; i < 4; ++i) holo4::FoldCandidate(t.st, i, 10 * i, 0);
    EXPECT_EQ(Decide(t, z), (Bgr{0, 0, 0}));
}

TEST(FourImageSteps, OutOfOrderAndMismatchedStepsAreIgnored) {
    const CImage a = RandomImage(70, 66, 24, 3), small = RandomImage(69, 66, 24, 3);
    CHologramsRemove r;
    CImage result = Solid(2, 2, {7, 7, 7});
    r.HologramsRemove4ImgInSteps(a, 3, result);  // before any step 0
    r.HologramsRemove4ImgInSteps(a, 1, result);
    r.HologramsRemove4ImgInSteps(a, 4, result);
    r.HologramsRemove4ImgInSteps(a, 0, result);
    r.HologramsRemove4ImgInSteps(a, 3, result);  // skips 1 and 2
    r.HologramsRemove4ImgInSteps(small, 1, result);
    r.HologramsRemove4ImgInSteps(a, 2, result);  // still waiting for step 1
    EXPECT_EQ(result.GetWidth(), 2);

    r.HologramsRemove4ImgInSteps(a, 1, result);
    r.HologramsRemove4ImgInSteps(a, 2, result);
    r.HologramsRemove4ImgInSteps(a, 3, result);
    ASSERT_EQ(result.GetWidth(), 70);
    const CImage first = result;
    r.HologramsRemove4ImgInSteps(a, 3, result);  // repeated: the same image again
    EXPECT_TRUE(SamePixels(result, first));
}

TEST(FourImageSteps, VectorRowsMatchThePlainOnes) {
    std::mt19937 rng(23);
    auto byte = [&](int lo, int hi) { return static_cast<unsigned char>(lo + static_cast<int>(rng() % (hi - lo + 1))); };
    for (int width : {1, 17, 64, 99, 200}) {
        std::vector<unsigned char> rows[4], bright(3 * width);
        const unsigned char* detail[4];
        for (int i = 0; i < 4; ++i) {
            rows[i].resize(3 * width);
            for (auto& b : rows[i]) b = rng() % 6 ? byte(124, 131) : byte(0, 255);  // mostly quiet detail
            detail[i] = rows[i].data();
        }
        std::vector<uint8_t> plainMaps(9 * width), fastMaps;
        for (int x = 0; x < width; ++x) {  // the reset of step 0
            plainMaps[1 * width + x] = plainMaps[3 * width + x] = plainMaps[7 * width + x] = 255;
        }
        fastMaps = plainMaps;
        uint8_t* plainRows[9];
        uint8_t* fastRows[9];
        for (int m = 0; m < 9; ++m) {
            plainRows[m] = &plainMaps[m * width];
            fastRows[m] = &fastMaps[m * width];
        }
        for (int step = 0; step < 4; ++step) {
            for (auto& b : bright) b = rng() % 5 ? byte(0, 239) : byte(238, 255);
            holo4::FoldPixels(plainRows, step, bright.data(), detail[step], 0, width);
            holo4::FoldRowFast(fastRows, step, bright.data(), detail[step], width);
            ASSERT_EQ(plainMaps, fastMaps) << width << " step " << step;
        }
        std::vector<unsigned char> plainOut(3 * width), fastOut(3 * width);
        holo4::DecidePixels(plainRows, detail, plainOut.data(), 0, width);
        holo4::DecideRowFast(fastRows, detail, fastOut.data(), width);
        EXPECT_EQ(plainOut, fastOut) << width;
        EXPECT_EQ(plainMaps, fastMaps) << width;
    }
}
