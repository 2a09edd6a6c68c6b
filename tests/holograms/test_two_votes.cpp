#include <gtest/gtest.h>

#include <vector>

#include "test_two_support.h"

using namespace two_test;

TEST(TwoVotes, IdenticalShotsMarkNothing) {
    CHologramsRemove remover;
    CImage image = RandomImage(40, 40, 8, 21, 90, 250), average, image2 = image, average2, map1, map2;
    remover.CalcAvImg_8(image, average, 7);
    average2 = average;
    int count1 = -1, count2 = -1;
    remover.FindHologramsPixels_8(image, average, image2, average2, map1, map2, 4, 0, 40, count1, count2);
    EXPECT_EQ(CountMarked(map1) + CountMarked(map2), 0);
    EXPECT_EQ(count1 + count2, 0);
}

TEST(TwoVotes, BrightRuleMarksWithoutVotesAndStrongRuleCounts) {
    CHologramsRemove remover;
    CImage i1 = Grey(20, 20, 150), i2 = Grey(20, 20, 150), a1 = Grey(20, 20, 245), a2 = Grey(20, 20, 150);
    i1.GetPtrXY(8, 8)[0] = 250;  // neighbours 150 > 121: no abort
    i2.GetPtrXY(8, 8)[0] = 200;
    a1.GetPtrXY(8, 8)[0] = 230;  // candidate; neighbours' averages of 245 give no votes
    CImage m1, m2;
    int c1 = -1, c2 = -1;
    remover.FindHologramsPixels_8(i1, a1, i2, a2, m1, m2, 2, 0, 20, c1, c2);
    EXPECT_EQ(m1.GetPtrXY(8, 8)[0], 250);
    EXPECT_EQ(CountMarked(m1), 1);
    EXPECT_EQ(c1, 0);  // bright, not strong: not counted

    CImage j1 = Grey(20, 20, 100), j2 = Grey(20, 20, 100), b = Grey(20, 20, 100);
    j1.GetPtrXY(5, 9)[0] = 180;  // twelve votes, no similar neighbour
    remover.FindHologramsPixels_8(j1, b, j2, b, m1, m2, 2, 0, 20, c1, c2);
    EXPECT_EQ(m1.GetPtrXY(5, 9)[0], 250);
    EXPECT_EQ(c1, 1);
    remover.FindHologramsPixels_8(j1, b, j2, b, m1, m2, 2, 9, 20, c1, c2);  // top < y fails at y = 9
    EXPECT_EQ(m1.GetPtrXY(5, 9)[0], 250);
    EXPECT_EQ(c1, 0);
}

TEST(TwoVotes, NegativeRadiusIsRefusedWithClearMaps) {
    CHologramsRemove remover;
    CImage j1 = Grey(20, 20, 100), j2 = Grey(20, 20, 100), b = Grey(20, 20, 100), m1, m2;
    j1.GetPtrXY(5, 9)[0] = 180;
    int c1 = -1, c2 = -1;
    remover.FindHologramsPixels_8(j1, b, j2, b, m1, m2, -3, 0, 20, c1, c2);
    EXPECT_EQ(c1, 0);
    EXPECT_EQ(c2, 0);
    ASSERT_EQ(m1.GetWidth(), 20);
    EXPECT_EQ(CountMarked(m1), 0);
}

TEST(TwoVotes, ColourVotesCountPerChannelAndAbortClearsThePixel) {
    CHologramsRemove remover;
    CImage i1 = Solid24(20, 20, 100, 100, 100), i2 = i1, a = i1, m1, m2;
    Put24(i1, 6, 9, 180, 180, 180);  // strong in all three channels
    int c1 = -1, c2 = -1;
    remover.FindHologramsPixels_24(i1, a, i2, a, m1, m2, 2, 0, 20, c1, c2);
    EXPECT_EQ(m1.GetPtrXY(6, 9)[0], 250);
    EXPECT_EQ(CountMarked(m1), 1);
    EXPECT_EQ(c1, 3);

    // B is strong, then G aborts: a neighbour in G is brighter by more than 64.
    CImage a1 = a;
    Put24(i1, 6, 9, 180, 120, 100);
    Put24(a1, 6, 9, 100, 50, 100);
    Put24(i1, 8, 9, 100, 200, 100);
    Put24(a1, 8, 9, 100, 200, 100);  // not a candidate itself
    remover.FindHologramsPixels_24(i1, a1, i2, a, m1, m2, 2, 0, 20, c1, c2);
    EXPECT_EQ(m1.GetPtrXY(6, 9)[0], 0);
    EXPECT_EQ(c1, 1);  // B was counted before the abort
}

TEST(TwoVotes, GradientsOfConstantAndRampImages) {
    CHologramsRemove remover;
    CImage flat = Solid24(20, 20, 77, 77, 77), h, v;
    remover.GradImg_24(flat, h, v, 6);
    EXPECT_EQ(Px(h, 10, 10), (std::vector<int>{128, 128, 128}));
    EXPECT_EQ(Px(v, 6, 13), (std::vector<int>{128, 128, 128}));
    EXPECT_EQ(Px(h, 5, 10), (std::vector<int>{0, 0, 0}));
    EXPECT_EQ(Px(v, 10, 14), (std::vector<int>{0, 0, 0}));

    CImage ramp(20, 20, 24);
    for (int y = 0; y < 20; ++y)
        for (int x = 0; x < 20; ++x) Put24(ramp, x, y, 10 * x, 5 * y, 0);
    remover.GradImg_24(ramp, h, v, 6);
    EXPECT_EQ(Px(h, 10, 10)[0], (((40) >> 1) + 20) / 3 + 128);
    EXPECT_EQ(Px(v, 10, 10)[1], ((60 >> 1) + 30) / 3 + 128);  // rows 3 and 6 away, downward positive
    EXPECT_EQ(Px(v, 10, 10)[0], 128);

    CImage kept = h;
    remover.GradImg_24(ramp, h, v, 5);  // the vertical taps would leave the image
    EXPECT_TRUE(SamePixels(h, kept));
}

TEST(TwoVotes, EdgesPresentInOneShotOnly) {
    CHologramsRemove remover;
    CImage g1 = Solid24(10, 10, 128, 128, 128), g2 = g1, e1(10, 10, 24), e2(10, 10, 24);
    Put24(g1, 3, 3, 128 + 25, 128 + 25, 128 - 25);
    Put24(g2, 3, 3, 128 + 5, 128 + 15, 128 - 5);
    Put24(g1, 5, 5, 128 + 5, 128, 128);
    Put24(g2, 5, 5, 128 + 25, 128, 128);
    remover.MapHologramsEdges_24(g1, g2, e1, e2, 1, 10);
    EXPECT_EQ(Px(e1, 3, 3), (std::vector<int>{250, 0, 200}));
    EXPECT_EQ(Px(e2, 5, 5), (std::vector<int>{250, 0, 0}));
    EXPECT_EQ(CountMarked(e2), 1);

    CImage small(4, 4, 24);
    remover.MapHologramsEdges_24(g1, g2, small, e2, 1, 10);  // a mask of another size: refused
    EXPECT_EQ(CountMarked(small), 0);
}

TEST(TwoVotes, GreyDifferenceAndMaskClearing) {
    CHologramsRemove remover;
    CImage a = Grey(6, 6, 100), b = Grey(6, 6, 100), out;
    a.GetPtrXY(2, 2)[0] = 111;
    a.GetPtrXY(3, 3)[0] = 110;
    a.GetPtrXY(0, 0)[0] = 200;  // in the border
    remover.SubImg_8(a, b, out, 1);
    EXPECT_EQ(out.GetPtrXY(2, 2)[0], 111);
    EXPECT_EQ(out.GetPtrXY(3, 3)[0], 0);
    EXPECT_EQ(out.GetPtrXY(0, 0)[0], 0);

    CImage mask = Grey(6, 6, 250), reference = Grey(6, 6, 128);
    reference.GetPtrXY(2, 3)[0] = 129;
    reference.GetPtrXY(0, 3)[0] = 255;  // border
    remover.ClearMapByMap(mask, reference, 1);
    EXPECT_EQ(mask.GetPtrXY(2, 3)[0], 0);
    EXPECT_EQ(mask.GetPtrXY(3, 3)[0], 250);
    EXPECT_EQ(mask.GetPtrXY(0, 3)[0], 250);
}
