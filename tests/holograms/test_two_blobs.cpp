#include <gtest/gtest.h>

#include <climits>
#include <vector>

#include "test_two_support.h"

using namespace two_test;

namespace {

// A 3 x 3 blob at (4..6, 4..6): its centre has eight glare neighbours, the other eight pixels
// form the rim.
CImage SquareMask(int w, int h) {
    CImage mask(w, h, 8);
    for (int y = 4; y <= 6; ++y)
        for (int x = 4; x <= 6; ++x) mask.GetPtrXY(x, y)[0] = 255;
    return mask;
}

}  // namespace

TEST(TwoBlobs, EqualRimsGiveTheIdentityAndPaintingCopiesImageTwo) {
    CHologramsRemove remover;
    CImage mask = SquareMask(12, 12);
    CImage i1 = RandomImage(12, 12, 24, 31), i2 = i1;
    remover.CollectHologramsBlobs_24(i1, i2, mask, 1);
    ASSERT_EQ(remover.m_holoBlobs.GetSize(), 1);
    const CHologramBlob& blob = *remover.m_holoBlobs[0];
    EXPECT_EQ(blob.m_pixelCount, 9);
    EXPECT_EQ(blob.m_rimCount, 8);
    EXPECT_EQ(blob.m_gainR, 65536);
    EXPECT_EQ(blob.m_gainB, 65536);
    EXPECT_EQ(blob.m_offsetG, 0);

    // Painted at scale 2 into images twice the size: blob pixel (x, y) covers 2x ... 2x + 1.
    CImage big1 = Solid24(24, 24, 1, 2, 3), big2 = RandomImage(24, 24, 24, 32), unused;
    remover.MergeImages_24(big1, big2, i1, unused, 2);
    EXPECT_EQ(Px(big1, 8, 8), Px(big2, 8, 8));
    EXPECT_EQ(Px(big1, 13, 13), Px(big2, 13, 13));
    EXPECT_EQ(Px(big1, 14, 13), (std::vector<int>{1, 2, 3}));
    EXPECT_EQ(Px(big1, 7, 8), (std::vector<int>{1, 2, 3}));
}

TEST(TwoBlobs, HalfRimIsRejectedByTheGreyCollectorAndKeptAsGainOneHalf) {
    CHologramsRemove remover;
    CImage mask = SquareMask(12, 12);
    CImage i2 = Grey(12, 12, 100), i1 = Grey(12, 12, 50);
    i2.GetPtrXY(4, 4)[0] = 120;  // image 2 not constant on the rim: a true fit of a = 0.5
    i1.GetPtrXY(4, 4)[0] = 60;
    remover.CollectHologramsBlobs_8(i1, i2, mask, 1);
    EXPECT_EQ(remover.m_holoBlobs.GetSize(), 0);

    CImage c1 = Solid24(12, 12, 50, 50, 50), c2 = Solid24(12, 12, 100, 100, 100);
    remover.CollectHologramsBlobs_24(c1, c2, mask, 1);  // constant on the rim: the pure gain
    ASSERT_EQ(remover.m_holoBlobs.GetSize(), 1);
    EXPECT_EQ(remover.m_holoBlobs[0]->m_gainG, 32768);
    EXPECT_EQ(remover.m_holoBlobs[0]->m_offsetG, 0);
}

TEST(TwoBlobs, ImplausibleOffsetFallsBackToTheRatio) {
    CHologramsRemove remover;
    CImage mask(12, 12, 8), i1 = Grey(12, 12, 0), i2 = Grey(12, 12, 0);
    mask.GetPtrXY(5, 5)[0] = 255;  // a two-pixel blob, both on the rim
    mask.GetPtrXY(6, 5)[0] = 255;
    i2.GetPtrXY(5, 5)[0] = 100;
    i2.GetPtrXY(6, 5)[0] = 120;
    i1.GetPtrXY(5, 5)[0] = 140;  // image 1 = 1.1 * image 2 + 30
    i1.GetPtrXY(6, 5)[0] = 162;
    remover.CollectHologramsBlobs_8(i1, i2, mask, 1);  // 302 / 220 = 1.37: rejected after the fallback
    EXPECT_EQ(remover.m_holoBlobs.GetSize(), 0);

    CImage c1 = Solid24(12, 12, 0, 0, 0), c2 = c1;
    Put24(c2, 5, 5, 100, 100, 100);
    Put24(c2, 6, 5, 120, 120, 120);
    Put24(c1, 5, 5, 140, 140, 140);
    Put24(c1, 6, 5, 162, 162, 162);
    remover.CollectHologramsBlobs_24(c1, c2, mask, 1);
    ASSERT_EQ(remover.m_holoBlobs.GetSize(), 1);
    EXPECT_EQ(remover.m_holoBlobs[0]->m_gainR, static_cast<int>(302.0f / 220.0f * 65536.0f));
    EXPECT_EQ(remover.m_holoBlobs[0]->m_offsetR, 0);
}

TEST(TwoBlobs, TinyRimsKeepTheIdentityAndCollectionsAppend) {
    CHologramsRemove remover;
    CImage mask(12, 12, 8), i1 = Solid24(12, 12, 200, 200, 200), i2 = Solid24(12, 12, 0, 0, 0);
    mask.GetPtrXY(5, 5)[0] = 255;  // one pixel: a rim of one, no fit
    mask.GetPtrXY(9, 9)[0] = 201;
    remover.CollectHologramsBlobs_24(i1, i2, mask, 1);
    ASSERT_EQ(remover.m_holoBlobs.GetSize(), 2);
    EXPECT_EQ(remover.m_holoBlobs[0]->m_gainB, 65536);
    EXPECT_EQ(remover.m_holoBlobs[0]->m_offsetB, 0);
    remover.CollectHologramsBlobs_24(i1, i2, mask, 1);
    EXPECT_EQ(remover.m_holoBlobs.GetSize(), 4);
}

TEST(TwoBlobs, PaintingSkipsForeignOffsetsAndSaturates) {
    CHologramsRemove remover;
    CImage mask = SquareMask(40, 40), i1 = Solid24(40, 40, 9, 9, 9), unused;
    remover.CollectHologramsBlobs_24(i1, i1, mask, 1);
    ASSERT_EQ(remover.m_holoBlobs.GetSize(), 1);
    remover.m_holoBlobs[0]->m_gainB = INT_MAX;  // 64-bit products: saturate, never wrap
    remover.m_holoBlobs[0]->m_offsetR = -(300 << 16);

    CImage small1 = Solid24(8, 8, 1, 1, 1), small2 = Solid24(8, 8, 200, 200, 200);
    remover.MergeImages_24(small1, small2, i1, unused, 3);  // blocks at 12 ... 20 lie outside
    EXPECT_EQ(CountMarked(small1), 64);
    EXPECT_EQ(Px(small1, 7, 7), (std::vector<int>{1, 1, 1}));

    CImage big1 = Solid24(40, 40, 1, 1, 1), big2 = Solid24(40, 40, 200, 200, 200);
    remover.MergeImages_24(big1, big2, i1, unused, 1);
    EXPECT_EQ(Px(big1, 5, 5), (std::vector<int>{255, 200, 0}));

    CImage grey(40, 40, 8);
    remover.MergeImages_24(big1, big2, grey, unused, 1);  // the reference's depth does not match
    remover.MergeImages_8(big1, big2, mask, unused, 0);   // scale 0
    EXPECT_EQ(Px(big1, 5, 5), (std::vector<int>{255, 200, 0}));
}
