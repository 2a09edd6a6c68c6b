#include <gtest/gtest.h>

#include <vector>

#include "test_two_support.h"

using namespace two_test;

TEST(TwoRepair, SmallBlobsGoDiagonalNeighboursConnect) {
    CHologramsRemove remover;
    CImage mask(12, 12, 8);
    mask.GetPtrXY(2, 2)[0] = 255;  // single pixel
    mask.GetPtrXY(6, 6)[0] = 230;  // three pixels touching only diagonally
    mask.GetPtrXY(7, 7)[0] = 230;
    mask.GetPtrXY(8, 6)[0] = 230;
    mask.GetPtrXY(10, 2)[0] = 200;  // not above 200: not a blob at all
    remover.ClearHologramsDirth(mask, 3, 1);
    EXPECT_EQ(mask.GetPtrXY(2, 2)[0], 0);
    EXPECT_EQ(mask.GetPtrXY(6, 6)[0], 230);
    EXPECT_EQ(mask.GetPtrXY(7, 7)[0], 230);
    EXPECT_EQ(mask.GetPtrXY(8, 6)[0], 230);
    EXPECT_EQ(mask.GetPtrXY(10, 2)[0], 200);
}

TEST(TwoRepair, ColourMaskBlobRemovalCountsRemovedPixels) {
    CHologramsRemove remover;
    CImage mask(12, 12, 24);
    Put24(mask, 2, 2, 5, 6, 7);
    Put24(mask, 5, 5, 1, 0, 0);
    Put24(mask, 6, 5, 1, 0, 0);
    for (int x = 8; x < 11; ++x) Put24(mask, x, 9, 9, 9, 9);
    Put24(mask, 0, 0, 0, 50, 50);  // first byte 0: not marked
    int count = 100;
    remover.ClearHologramsDirth_24(mask, 3, 1, count);
    EXPECT_EQ(count, 97);
    EXPECT_EQ(Px(mask, 2, 2), (std::vector<int>{0, 0, 0}));
    EXPECT_EQ(Px(mask, 9, 9), (std::vector<int>{9, 9, 9}));
    EXPECT_EQ(Px(mask, 0, 0), (std::vector<int>{0, 50, 50}));
}

TEST(TwoRepair, GrowthByOneAndByIterations) {
    CHologramsRemove remover;
    CImage mask(9, 9, 8);
    mask.GetPtrXY(4, 4)[0] = 250;
    remover.ExpandHologramsBolbs(mask, 250, 0);  // border 0: edge neighbours are simply absent
    EXPECT_EQ(mask.GetPtrXY(5, 4)[0], 249);
    EXPECT_EQ(mask.GetPtrXY(4, 5)[0], 249);
    EXPECT_EQ(mask.GetPtrXY(6, 4)[0], 0);  // grown pixels do not grow again
    EXPECT_EQ(mask.GetPtrXY(5, 5)[0], 0);

    CImage colour(11, 11, 24);
    Put24(colour, 5, 5, 0, 90, 30);  // normalised: first byte 3
    remover.ExpandHologramsBolbsN(colour, 1, 2);
    EXPECT_EQ(CountMarked(colour), 13);
    EXPECT_EQ(Px(colour, 5, 3), (std::vector<int>{3, 90, 30}));
    EXPECT_EQ(Px(colour, 6, 6), (std::vector<int>{3, 90, 30}));
    EXPECT_EQ(Px(colour, 6, 7)[0], 0);
}

TEST(TwoRepair, RecordsListMarkedPixelsWithTheirColours) {
    CHologramsRemove remover;
    CImage i1 = Solid24(10, 10, 1, 2, 3), a1 = Solid24(10, 10, 4, 5, 6), i2 = Solid24(10, 10, 7, 8, 9),
           a2 = Solid24(10, 10, 10, 11, 12), diff = Solid24(10, 10, 13, 14, 15), m1(10, 10, 24), m2(10, 10, 24);
    Put24(m1, 4, 5, 1, 0, 0);
    Put24(m2, 4, 5, 1, 0, 0);
    Put24(m2, 6, 5, 1, 0, 0);
    Put24(m1, 7, 5, 0, 1, 1);  // first byte 0: not marked
    remover.CollectHologramsPixels_New(i1, a1, i2, a2, m1, m2, diff, 3);
    ASSERT_EQ(remover.m_holoPixels.GetSize(), 2);
    const HOLOGRAM_PIXEL& both = remover.m_holoPixels[0];
    EXPECT_EQ(both.byteColumn, 12);
    EXPECT_EQ(both.row, 5);
    EXPECT_EQ(both.flags, 3);
    EXPECT_EQ(both.average1[0], 6);  // R first
    EXPECT_EQ(both.image2[2], 7);    // B last
    EXPECT_EQ(both.difference[0], 13);  // B first
    EXPECT_EQ(remover.m_holoPixels[1].flags, 2);
}

namespace {

HOLOGRAM_PIXEL Record(int x, int y, int flags, int average1, int average2, int difference) {
    HOLOGRAM_PIXEL r{};
    r.byteColumn = 3 * x;
    r.row = y;
    r.flags = static_cast<uint8_t>(flags);
    for (int c = 0; c < 3; ++c) {
        r.average1[c] = static_cast<uint8_t>(average1);
        r.average2[c] = static_cast<uint8_t>(average2);
        r.difference[c] = static_cast<uint8_t>(difference);
    }
    return r;
}

}  // namespace

TEST(TwoRepair, FullResolutionRepairByMode) {
    CHologramsRemove remover;
    remover.m_avDifVal = 128;
    CImage i1 = Solid24(12, 12, 160, 160, 160), i2 = Solid24(12, 12, 110, 110, 110);
    remover.m_holoPixels.Add(Record(1, 1, 2, 100, 100, 200));  // skipped in mode 1
    remover.m_holoPixels.Add(Record(2, 2, 1, 100, 100, 0));    // difference 0: no correction
    remover.m_holoPixels.Add(Record(3, 2, 1, 100, 100, 168));  // correction (168 - 128) >> 1 = 20
    remover.m_holoPixels.Add(Record(3, 3, 3, 100, 100, 128));  // both: e1 = 60, e2 = 10
    remover.m_holoPixels.Add(Record(9, 9, 1, 100, 100, 0));    // block outside the image
    remover.FixRealImages_24_New(i1, i2, 3, 1);
    // Record (x, y) covers columns 3x - 1 ... 3x + 1 and rows 3y - 3 ... 3y - 1.
    EXPECT_EQ(Px(i1, 2, 0), (std::vector<int>{160, 160, 160}));
    EXPECT_EQ(Px(i1, 5, 3), (std::vector<int>{110, 110, 110}));
    EXPECT_EQ(Px(i1, 7, 5), (std::vector<int>{110, 110, 110}));
    EXPECT_EQ(Px(i1, 10, 5), (std::vector<int>{90, 90, 90}));
    EXPECT_EQ(Px(i1, 8, 3), (std::vector<int>{90, 90, 90}));
    EXPECT_EQ(Px(i1, 10, 8), (std::vector<int>{110, 110, 110}));
    EXPECT_EQ(Px(i1, 11, 5), (std::vector<int>{160, 160, 160}));

    // Mode 2: image 1's detail moves onto image 2; a negative excess is halved toward -inf.
    CImage j1 = Solid24(12, 12, 105, 105, 105), j2 = Solid24(12, 12, 220, 220, 220);
    remover.m_holoPixels.RemoveAll();
    remover.m_holoPixels.Add(Record(2, 2, 2, 100, 200, 97));  // t = -31 -> -16
    remover.FixRealImages_24_New(j1, j2, 3, 2);
    EXPECT_EQ(Px(j2, 5, 5), (std::vector<int>{200 + 5 - 16, 189, 189}));
}

TEST(TwoRepair, DownscaledRepairAndItsBothMarkedRule) {
    CHologramsRemove remover;
    remover.m_avDifVal = 128;
    CImage s1 = Solid24(8, 8, 160, 160, 160), a1 = Solid24(8, 8, 100, 100, 100);
    CImage s2 = Solid24(8, 8, 110, 110, 110), a2 = Solid24(8, 8, 100, 100, 100);
    CImage m1(8, 8, 24), m2(8, 8, 24), diff = Solid24(8, 8, 128, 128, 128);
    Put24(m1, 3, 3, 1, 0, 0);
    Put24(m2, 3, 3, 1, 0, 0);  // e1 = 60, e2 = 10: image 1 is replaced by 100 + 10
    Put24(m1, 4, 4, 1, 0, 0);  // only image 1
    Put24(s1, 5, 5, 100, 100, 100);
    Put24(s2, 5, 5, 170, 170, 170);
    Put24(m1, 5, 5, 1, 0, 0);
    Put24(m2, 5, 5, 1, 0, 0);  // e1 = 0, e2 = 70: image 1 keeps, image 2 is replaced
    remover.FixSmlImages_24_New(s1, a1, s2, a2, m1, m2, diff, 3);
    EXPECT_EQ(Px(s1, 3, 3), (std::vector<int>{110, 110, 110}));
    EXPECT_EQ(Px(s1, 4, 4), (std::vector<int>{110, 110, 110}));
    EXPECT_EQ(Px(s1, 5, 5), (std::vector<int>{100, 100, 100}));
    EXPECT_EQ(Px(s2, 5, 5), (std::vector<int>{100, 100, 100}));
    EXPECT_EQ(Px(s1, 2, 2), (std::vector<int>{160, 160, 160}));
}
