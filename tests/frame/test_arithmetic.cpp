#include <gtest/gtest.h>

#include <cstdint>
#include <vector>

#include "common/TestImages.h"
#include "frame/ArithmeticInternal.h"
#include "frame/ImageArithmetic.h"

using testing_images::RandomImage;

TEST(ImageArithmetic, AddIsAsymmetricAroundTheMiddle) {
    CImage a(5, 3, 24), b(5, 3, 24), out;
    a.Set(128);
    b.Set(128);
    ImageAdd(a, b, out);
    ASSERT_EQ(out.GetWidth(), 5);
    EXPECT_EQ(out.GetPtrXY(4, 2)[2], 129);
    ImageSubtract(a, a, out);
    EXPECT_EQ(out.GetPtrXY(0, 0)[0], 128);
    a.Set(10);
    ImageAdd(a, a, out);
    EXPECT_EQ(out.GetPtrXY(1, 1)[1], 0);
    a.Set(250);
    ImageAdd(a, a, out);
    EXPECT_EQ(out.GetPtrXY(1, 1)[1], 255);
}

TEST(ImageArithmetic, VectorKernelsMatchThePlainOnesByteForByte) {
    for (size_t n : {0u, 1u, 15u, 16u, 17u, 63u, 64u, 65u, 1001u}) {
        const CImage a = RandomImage(static_cast<int>(n) + 1, 1, 8, 11), b = RandomImage(static_cast<int>(n) + 1, 1, 8, 12);
        std::vector<uint8_t> plain(n + 1), fast(n + 1);
        varnoth::PlainAddBytes(a.GetBits(), b.GetBits(), plain.data(), n);
        varnoth::FastAddBytes(a.GetBits(), b.GetBits(), fast.data(), n);
        ASSERT_EQ(plain, fast) << n;
        varnoth::PlainSubtractBytes(a.GetBits(), b.GetBits(), plain.data(), n);
        varnoth::FastSubtractBytes(a.GetBits(), b.GetBits(), fast.data(), n);
        ASSERT_EQ(plain, fast) << n;
    }
    // Every pair of bytes.
    std::vector<uint8_t> a(65536), b(65536), plain(65536), fast(65536);
    for (int i = 0; i < 65536; ++i) a[i] = i & 255, b[i] = i >> 8;
    varnoth::PlainAddBytes(a.data(), b.data(), plain.data(), a.size());
    varnoth::FastAddBytes(a.data(), b.data(), fast.data(), a.size());
    EXPECT_EQ(plain, fast);
    varnoth::PlainSubtractBytes(a.data(), b.data(), plain.data(), a.size());
    varnoth::FastSubtractBytes(a.data(), b.data(), fast.data(), a.size());
    EXPECT_EQ(plain, fast);
}

TEST(ImageArithmetic, MismatchedInputsAreRefusedAndOutIsResized) {
    const CImage a = RandomImage(7, 5, 24, 1), narrow = RandomImage(6, 5, 24, 2), grey = RandomImage(7, 5, 8, 3);
    CImage out(2, 2, 8);
    out.Set(9);
    ImageAdd(a, narrow, out);
    ImageSubtract(a, grey, out);
    EXPECT_EQ(out.GetWidth(), 2);
    EXPECT_EQ(out.GetPtrXY(0, 0)[0], 9);
    ImageSubtract(a, a, out);
    EXPECT_EQ(out.GetWidth(), 7);
    EXPECT_EQ(out.GetBitCount(), 24);
    EXPECT_EQ(out.GetPtrXY(6, 4)[2], 128);
}

TEST(ImageStretch, MapsTheCentralWindowRange) {
    CImage img(8, 8, 8);
    img.Set(100);
    CImage flat = img;
    ImageStretch(flat);
    EXPECT_EQ(flat.GetPtrXY(0, 0)[0], 100);  // flat window: untouched

    img.GetPtrXY(3, 3)[0] = 50;   // window minimum
    img.GetPtrXY(4, 4)[0] = 150;  // window maximum
    img.GetPtrXY(0, 0)[0] = 200;  // outside the window, above the maximum
    img.GetPtrXY(7, 7)[0] = 20;   // outside, below the minimum
    ImageStretch(img);
    EXPECT_EQ(img.GetPtrXY(4, 4)[0], 255);
    EXPECT_EQ(img.GetPtrXY(3, 3)[0], 0);
    EXPECT_EQ(img.GetPtrXY(0, 0)[0], 255);
    EXPECT_EQ(img.GetPtrXY(7, 7)[0], 0);
    EXPECT_EQ(img.GetPtrXY(1, 1)[0], 128);  // (100 - 50) * 256 / 100

    CImage padded(2, 2, 8);  // the window takes in the row padding (0) as well
    padded.GetPtrXY(0, 0)[0] = 7;
    ImageStretch(padded);
    EXPECT_EQ(padded.GetPtrXY(0, 0)[0], 255);
}

TEST(InsertImage, StaysOnePixelInsideAndHonoursTheMask) {
    CImage src(3, 2, 24), dst(4, 3, 24);
    src.Set(200);
    CImage same(4, 3, 24);
    EXPECT_FALSE(InsertImage(same, dst, CPoint(0, 0)));
    EXPECT_FALSE(InsertImage(src, dst, CPoint(1, 0)));  // touches the right edge
    EXPECT_FALSE(InsertImage(src, dst, CPoint(-1, 0)));
    ASSERT_TRUE(InsertImage(src, dst, CPoint(0, 0)));
    EXPECT_EQ(dst.GetPtrXY(2, 1)[2], 200);
    EXPECT_EQ(dst.GetPtrXY(3, 1)[0], 0);

    CImage mask(3, 2, 24), dst2(4, 3, 24);
    mask.GetPtrXY(1, 0)[1] = 1;  // keep one byte of dst
    src.Set(50);
    EXPECT_FALSE(InsertImage(src, dst2, CPoint(0, 1), &mask));  // touches the bottom edge
    ASSERT_TRUE(InsertImage(src, dst2, CPoint(0, 0), &mask));
    EXPECT_EQ(dst2.GetPtrXY(1, 0)[0], 50);
    EXPECT_EQ(dst2.GetPtrXY(1, 0)[1], 0);
    CImage wrongMask(3, 2, 8);
    EXPECT_FALSE(InsertImage(src, dst2, CPoint(0, 0), &wrongMask));
    CImage grey(3, 2, 8);
    EXPECT_FALSE(InsertImage(grey, dst2, CPoint(0, 0)));
    // Positions so large that width + x would wrap past INT_MAX are refused, not written.
    EXPECT_FALSE(InsertImage(src, dst2, CPoint(INT32_MAX, 0)));
    EXPECT_FALSE(InsertImage(src, dst2, CPoint(0, INT32_MAX - 1)));
    EXPECT_FALSE(IsMMXSuported());
}
