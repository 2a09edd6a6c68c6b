#include <gtest/gtest.h>

#include <cstring>

#include "common/TestImages.h"
#include "imagelib/CImage.h"

using testing_images::RandomImage;
using testing_images::SamePixels;

TEST(CImage, RowsAreBottomUpWithSpansPaddedToFourBytes) {
    struct Case { int w, bits, span; } cases[] = {{5, 8, 8}, {5, 24, 16}, {3, 16, 8}, {4, 24, 12}};
    for (const Case& c : cases) {
        CImage img(c.w, 3, c.bits);
        EXPECT_EQ(img.GetSpan(), c.span);
        EXPECT_EQ(img.GetSize(), static_cast<size_t>(c.span) * 3);
        EXPECT_EQ(img.GetPtrXY(0, 0), img.GetBits() + 2 * c.span);
        EXPECT_EQ(img.GetPtrXY(1, 2), img.GetBits() + c.bits / 8);
        EXPECT_EQ(img.GetPtrXY(0, 1) - img.GetPtrXY(0, 2), c.span);
    }
}

TEST(CImage, FreshAndReallocatedPixelsAreZero) {
    CImage img(7, 5, 24);
    for (size_t i = 0; i < img.GetSize(); ++i) ASSERT_EQ(img.GetBits()[i], 0);
    img.Set(77);
    ASSERT_TRUE(img.Reallocate(9, 4, 8, 0));
    EXPECT_EQ(img.GetWidth(), 9);
    EXPECT_EQ(img.GetBitCount(), 8);
    for (size_t i = 0; i < img.GetSize(); ++i) ASSERT_EQ(img.GetBits()[i], 0);
    EXPECT_FALSE(img.Reallocate(4, 4, 32));
    img.Set(5);
    ASSERT_TRUE(img.Reallocate(4, 9, 8));  // the same number of bytes, another shape
    EXPECT_EQ(img.GetSpan(), 4);
    for (size_t i = 0; i < img.GetSize(); ++i) ASSERT_EQ(img.GetBits()[i], 0);
}

TEST(CImage, CopiesAreDeepAndMovesTransferThePixels) {
    CImage a = RandomImage(6, 4, 24, 1);
    CImage b(a);
    CImage c;
    c = a;
    a.Set(0);
    EXPECT_EQ(b.GetPtrXY(5, 3)[2], c.GetPtrXY(5, 3)[2]);
    EXPECT_FALSE(SamePixels(a, b));
    const unsigned char* pixels = b.GetBits();
    CImage d(std::move(b));
    EXPECT_EQ(d.GetBits(), pixels);
    EXPECT_TRUE(b.IsEmpty());
    EXPECT_TRUE(SamePixels(c, d));
    const CImage empty;
    d = empty;  // assigning an empty image empties the target
    EXPECT_TRUE(d.IsEmpty());
    EXPECT_EQ(d.GetWidth(), 0);
}

TEST(CImage, QuarterTurnsMovePixelsAndTurnBack) {
    for (int bits : {8, 16, 24}) {
        const CImage original = RandomImage(5, 3, bits, 2);
        const int bpp = bits / 8;
        CImage turned = original;
        turned.Rotate90ClockWise(3);
        ASSERT_EQ(turned.GetWidth(), 3);
        ASSERT_EQ(turned.GetHeight(), 5);
        for (int y = 0; y < 3; ++y)
            for (int x = 0; x < 5; ++x)
                ASSERT_EQ(std::memcmp(turned.GetPtrXY(y, 5 - 1 - x), original.GetPtrXY(x, y), bpp), 0);
        turned.Rotate90ClockWise(1);
        EXPECT_TRUE(SamePixels(turned, original)) << bits;
        turned.Rotate90ClockWise(2);
        turned.Rotate90ClockWise(-2);
        EXPECT_TRUE(SamePixels(turned, original)) << bits;
    }
}

TEST(CImage, RotateKeepsSizeAndFillsUncoveredCorners) {
    CImage img(21, 11, 8);
    img.Set(40);
    CImage same = img;
    same.Rotate(0.0f, 255, 0.0f);
    EXPECT_TRUE(SamePixels(same, img));
    img.Rotate(45.0f, 255, 0.0f);
    EXPECT_EQ(img.GetWidth(), 21);
    EXPECT_EQ(img.GetPtrXY(0, 0)[0], 255);
    EXPECT_EQ(img.GetPtrXY(10, 5)[0], 40);
}

TEST(CImage, LineDrawsBothEndsAndClipsOutside) {
    CImage img(8, 6, 24);
    img.Line(-3, 2, 20, 2, 9);
    for (int x = 0; x < 8; ++x) EXPECT_EQ(img.GetPtrXY(x, 2)[1], 9);
    img.Line(1, 0, 1, 5, 7);
    EXPECT_EQ(img.GetPtrXY(1, 0)[0], 7);
    EXPECT_EQ(img.GetPtrXY(1, 5)[2], 7);
    EXPECT_EQ(img.GetPtrXY(0, 3)[0], 0);
}
