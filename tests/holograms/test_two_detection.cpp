#include <gtest/gtest.h>

#include <vector>

#include "test_two_support.h"

using namespace two_test;

TEST(TwoDetection, DifferenceTableForGainThreeQuarters) {
    CHologramsRemove remover;
    CImage a = Solid24(3, 1, 0, 0, 0), b = a, diff;
    Put24(a, 0, 0, 200, 200, 200);
    Put24(b, 0, 0, 100, 100, 100);  // +100 -> 203
    Put24(a, 1, 0, 40, 40, 40);
    Put24(b, 1, 0, 240, 240, 240);  // -200 -> -22, limited to 1
    Put24(a, 2, 0, 150, 20, 10);
    Put24(b, 2, 0, 150, 20, 10);    // equal -> 128; both dark -> 0 (not evaluated)
    remover.SubImg_24_Alg3(a, b, diff, 0, false, 0.75f, 0, 1);
    EXPECT_EQ(Px(diff, 0, 0), (std::vector<int>{203, 203, 203}));
    EXPECT_EQ(Px(diff, 1, 0), (std::vector<int>{1, 1, 1}));
    EXPECT_EQ(Px(diff, 2, 0), (std::vector<int>{128, 0, 0}));
}

TEST(TwoDetection, MeanNeedsElevenEvaluatedSubPixels) {
    CHologramsRemove remover;
    CImage a(4, 1, 24), b(4, 1, 24), diff;
    for (int i = 0; i < 10; ++i) a.GetPtrXY(0, 0)[i] = 40;
    remover.SubImg_24_Alg3(a, b, diff, 0, false, 1.0f, 0, 1);
    EXPECT_EQ(remover.m_avDifVal, 128);
    EXPECT_EQ(remover.m_avDif, 0);
    int mean = -1;
    remover.SubImg_24(a, b, diff, 0, false, mean, 1.0f, 0, 1);
    EXPECT_EQ(mean, 128);

    a.GetPtrXY(0, 0)[10] = 40;
    remover.SubImg_24_Alg3(a, b, diff, 0, false, 1.0f, 0, 1);
    EXPECT_EQ(remover.m_avDifVal, 168);
    EXPECT_EQ(remover.m_avDif, 40);

    CImage dark(4, 1, 24);
    remover.SubImg_24_Alg3(dark, dark, diff, 0, false, 1.0f, 0, 1);
    EXPECT_EQ(CountMarked(diff), 0);
    EXPECT_EQ(remover.m_avDifVal, 128);
}

TEST(TwoDetection, DifferenceRefusesShotsOfDifferentSizes) {
    CHologramsRemove remover;
    CImage a = Solid24(8, 8, 90, 90, 90), b = Solid24(8, 9, 40, 40, 40);
    CImage diff = Solid24(2, 2, 7, 7, 7);
    remover.m_avDifVal = 77;
    remover.SubImg_24_Alg3(a, b, diff, 0, false, 1.0f, 0, 8);
    EXPECT_EQ(diff.GetWidth(), 2);
    EXPECT_EQ(remover.m_avDifVal, 77);
}

namespace {

struct DetectorScene {
    CImage diff = Solid24(40, 40, 128, 128, 128);
    CImage model = Solid24(40, 40, 128, 128, 128);
    CImage image1 = Solid24(40, 40, 100, 100, 100);
    CImage image2 = Solid24(40, 40, 100, 100, 100);
    CImage map1, map2;
    int score1 = -1, score2 = -1;
    void Run(CHologramsRemove& r, int top = 0, int bottom = 40) {
        r.Find_HologramPixels_24_New_Alg3(diff, model, image1, image2, map1, map2, 3, top, bottom, score1, score2);
    }
};

}  // namespace

TEST(TwoDetection, GlareRulesOfTheDetector) {
    CHologramsRemove remover;
    DetectorScene s;
    Put24(s.diff, 10, 10, 168, 133, 133);  // excesses (40, 5, 5): one above 30
    Put24(s.diff, 12, 10, 143, 143, 143);  // (15, 15, 15): sum 45 < 60
    Put24(s.diff, 14, 10, 148, 148, 148);  // (20, 20, 20): sum 60
    Put24(s.diff, 16, 10, 144, 128, 128);  // (16, 0, 0) with image 1's B at 255: tolerance 15
    Put24(s.image1, 16, 10, 255, 100, 100);
    Put24(s.diff, 18, 10, 88, 123, 123);   // (-40, -5, -5): glare of image 2
    Put24(s.diff, 20, 10, 168, 0, 133);    // a 0 byte: not evaluated
    s.Run(remover);
    EXPECT_EQ(Px(s.map1, 10, 10), (std::vector<int>{168, 133, 133}));
    EXPECT_EQ(Px(s.map1, 12, 10), (std::vector<int>{0, 0, 0}));
    EXPECT_EQ(Px(s.map1, 14, 10), (std::vector<int>{148, 148, 148}));
    EXPECT_EQ(Px(s.map1, 16, 10), (std::vector<int>{144, 128, 128}));
    EXPECT_EQ(Px(s.map2, 18, 10), (std::vector<int>{167, 132, 132}));
    EXPECT_EQ(CountMarked(s.map1), 3);
    EXPECT_EQ(CountMarked(s.map2), 1);
    EXPECT_EQ(s.score1, (40 + 20 + 16) >> 7);
}

TEST(TwoDetection, ScoresAreExcessSumsOver128AndRowsFollowTheDocument) {
    CHologramsRemove remover;
    DetectorScene s;
    for (int x = 3; x < 35; ++x)
        for (int y = 15; y < 19; ++y) Put24(s.diff, x, y, 168, 133, 133);  // 128 pixels of excess 40
    s.Run(remover);
    EXPECT_EQ(s.score1, 128 * 40 / 128);
    EXPECT_EQ(s.score2, 0);
    s.Run(remover, 30, 35);  // rows 20 ... 36: none of the glare
    EXPECT_EQ(s.score1, 0);
    EXPECT_EQ(CountMarked(s.map1), 0);
}

TEST(TwoDetection, SaturatedPixelsJoinTheMaskOfTheOnlySaturatedShot) {
    CHologramsRemove remover;
    CImage a = Solid24(6, 1, 100, 100, 100), b = a;
    CImage m1(6, 1, 24), m2(6, 1, 24);
    Put24(a, 1, 0, 10, 254, 10);   // only image 1
    Put24(b, 2, 0, 255, 10, 10);   // only image 2
    Put24(a, 3, 0, 255, 255, 255); // both
    Put24(b, 3, 0, 255, 255, 255);
    Put24(a, 4, 0, 255, 0, 0);     // only image 1, but already marked in map 2
    Put24(m2, 4, 0, 9, 9, 9);
    int unused1 = 0, unused2 = 0;
    remover.Add_Saturated_Pixels(a, b, m1, m2, unused1, unused2, 0);
    EXPECT_EQ(Px(m1, 1, 0), (std::vector<int>{10, 254, 10}));
    EXPECT_EQ(Px(m2, 2, 0), (std::vector<int>{255, 10, 10}));
    EXPECT_EQ(Px(m1, 3, 0), (std::vector<int>{0, 0, 0}));
    EXPECT_EQ(Px(m2, 3, 0), (std::vector<int>{0, 0, 0}));
    EXPECT_EQ(Px(m1, 4, 0), (std::vector<int>{0, 0, 0}));
}

// Image 1 is brighter on its left half; one pixel there stands 40 above its own average.
TEST(TwoDetection, AverageBasedDetectorMarksWhereImageOneIsBrighterThanItsAverage) {
    CHologramsRemove remover;
    CImage i1 = Solid24(20, 20, 100, 100, 100), i2 = i1, a2 = i1, map1, map2, diff;
    for (int y = 0; y < 20; ++y)
        for (int x = 0; x < 10; ++x) Put24(i1, x, y, 150, 150, 150);
    CImage a1 = i1;
    Put24(i1, 5, 10, 190, 190, 190);
    int count1 = -1, count2 = -1;
    remover.FindHologramsPixels_24_New_Alg2(i1, a1, i2, a2, map1, map2, diff, 3, 0, 0, count1, count2);
    // The masked average there: (150 * 9 - 190 + 4) / 8 = 145, so the excess is 45.
    EXPECT_EQ(Px(a1, 5, 10), (std::vector<int>{145, 145, 145}));
    EXPECT_EQ(Px(map1, 5, 10), (std::vector<int>{45, 45, 45}));
    EXPECT_EQ(count1, 3);  // one per channel
    EXPECT_EQ(count2, 0);
    EXPECT_EQ(CountMarked(map1), 1);
}

TEST(TwoDetection, AverageBasedDetectorFindsNothingOnIdenticalShots) {
    CHologramsRemove remover;
    CImage image = RandomImage(40, 30, 24, 9, 60, 200), average, image2 = image, average2, map1, map2, diff;
    remover.CalcAvImg_24(image, average, 9);
    average2 = average;
    int count1 = -1, count2 = -1;
    remover.FindHologramsPixels_24_New_Alg2(image, average, image2, average2, map1, map2, diff, 9, 0, 0, count1,
                                            count2);
    EXPECT_EQ(count1, 0);
    EXPECT_EQ(count2, 0);
    EXPECT_EQ(remover.m_avDifVal, 128);

    count1 = -1;
    remover.FindHologramsPixels_24_New_Alg2(image, average, image2, average2, map1, map2, diff, 28, 0, 0, count1,
                                            count2);  // beyond the masked-average limit: refused
    EXPECT_EQ(count1, -1);
}
