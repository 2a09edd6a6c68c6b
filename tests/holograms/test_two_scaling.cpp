#include <gtest/gtest.h>

#include <cmath>
#include <vector>

#include "holograms/BoxAverageInternal.h"
#include "test_two_support.h"

using namespace two_test;

namespace {

// The 24-bit box average at (x, y) by a direct window sum: the window starting at (s, r)
// lands at (s + h, r + h).
int DirectAverage(const CImage& src, int window, int x, int y, int channel) {
    const int half = window / 2;
    long sum = 0;
    for (int j = y - half; j < y - half + window; ++j)
        for (int i = x - half; i < x - half + window; ++i) sum += src.GetPtrXY(i, j)[channel];
    return static_cast<int>(sum / (window * window));
}

}  // namespace

TEST(TwoScaling, BlockMaximumDropsIncompleteBlocksAndKeepsChannelsApart) {
    CHologramsRemove remover;
    CImage src = Solid24(10, 7, 10, 20, 30);
    Put24(src, 9, 0, 255, 255, 255);  // column 9 and row 6 lie outside every full block
    Put24(src, 0, 6, 255, 255, 255);
    Put24(src, 4, 1, 200, 0, 0);  // block (1, 0): B from one pixel, G from another
    Put24(src, 5, 2, 0, 100, 0);
    CImage dst;
    remover.ScaleDownMaxImg_X3_24(src, dst);
    ASSERT_EQ(dst.GetWidth(), 3);
    ASSERT_EQ(dst.GetHeight(), 2);
    EXPECT_EQ(Px(dst, 1, 0), (std::vector<int>{200, 100, 30}));
    EXPECT_EQ(Px(dst, 2, 0), (std::vector<int>{10, 20, 30}));
    EXPECT_EQ(Px(dst, 0, 1), (std::vector<int>{10, 20, 30}));

    CImage general;
    remover.ScaleDownMaxImg(src, general, 3);
    EXPECT_TRUE(SamePixels(general, dst));
    CImage grey;
    remover.ScaleDownMaxImg_X3_8(src, grey);
    ASSERT_EQ(grey.GetBitCount(), 8);
    EXPECT_EQ(grey.GetPtrXY(1, 0)[0], (200 + 100 + 30) / 3);

    CImage half;
    remover.ScaleDownMaxImg_X2_24(src, half);
    EXPECT_EQ(half.GetWidth(), 5);
    EXPECT_EQ(Px(half, 2, 0), (std::vector<int>{200, 20, 30}));  // pixel (4, 1)
}

TEST(TwoScaling, DownscalingRefusesWhatItCannotRead) {
    CHologramsRemove remover;
    CImage src = Solid24(9, 9, 1, 2, 3);
    CImage dst = Solid24(2, 2, 7, 7, 7);
    remover.ScaleDownMaxImg(src, dst, 0);
    EXPECT_EQ(dst.GetWidth(), 2);
    CImage grey(9, 9, 8);
    remover.ScaleDownMaxImg_X3_24(grey, dst);  // an 8-bit source would be read past its rows
    EXPECT_EQ(dst.GetWidth(), 2);
    remover.ScaleDownMaxImg_X3_24(src, src);  // in place works from a copy
    EXPECT_EQ(src.GetWidth(), 3);
    EXPECT_EQ(Px(src, 2, 2), (std::vector<int>{1, 2, 3}));
}

TEST(TwoScaling, SlopeOfAVector) {
    CHologramsRemove remover;
    int v[] = {1, 2, 3, 10, 0, 16};
    EXPECT_FLOAT_EQ(remover.CalcVectSlope(v, 0, 2, 1), 1.0f);
    EXPECT_FLOAT_EQ(remover.CalcVectSlope(v, 0, 5, 3), 9.0f);  // 10 - 1 per step of 3 indices
    EXPECT_TRUE(std::isnan(remover.CalcVectSlope(v, 3, 2, 1)));
    EXPECT_TRUE(std::isnan(remover.CalcVectSlope(v, 1, 1, 1)));
}

TEST(TwoScaling, ProfileSmoothingAveragesTheMiddleAndExtendsTheEndsAboveZero) {
    CHologramsRemove remover;
    const int n = 200, window = 63, half = 31;
    std::vector<int> profile(3 * n), original;
    for (int i = 0; i < n; ++i) {
        profile[3 * i] = (200 - i) * (200 - i) / 10 + 1;  // convex: the right extension would go negative
        profile[3 * i + 1] = i * i / 10 + 1;              // and the left one here
        profile[3 * i + 2] = (i % 7 == 0) ? 0 : 100;  // holes, filled from the neighbours
    }
    original = profile;
    remover.CalcAvRGBVect(profile.data(), n, window);
    for (int e = half; e <= 167; ++e) {
        long sumB = 0, sumG = 0;
        for (int k = e - half; k < e - half + window; ++k) {
            sumB += original[3 * k];
            sumG += original[3 * k + 1];
        }
        ASSERT_EQ(profile[3 * e], sumB / window) << e;
        ASSERT_EQ(profile[3 * e + 1], sumG / window) << e;
        ASSERT_EQ(profile[3 * e + 2], 100) << e;
    }
    for (int i = 0; i < 3 * n; ++i) EXPECT_GE(profile[i], 0) << i;
    EXPECT_EQ(profile[0 + 1], 0);    // G clamped at the start
    EXPECT_EQ(profile[3 * 199], 0);  // B clamped at the end
    EXPECT_LT(profile[3 * 30 + 1], profile[3 * 31 + 1]);

    std::vector<int> tooShort(3 * 77, 5);
    remover.CalcAvRGBVect(tooShort.data(), 77, 63);  // refused: fewer than window + 15
    EXPECT_EQ(tooShort, std::vector<int>(3 * 77, 5));
    std::vector<int> evenWindow(3 * 79, 5);
    remover.CalcAvRGBVect(evenWindow.data(), 79, 64);  // even: the end slope would need element h - 1
    EXPECT_EQ(evenWindow, std::vector<int>(3 * 79, 5));
    std::vector<int> longEnough(3 * 80, 5);
    remover.CalcAvRGBVect(longEnough.data(), 80, 64);  // accepted: a flat profile stays flat
    EXPECT_EQ(longEnough, std::vector<int>(3 * 80, 5));
}

TEST(TwoScaling, BoxAverageOfWindow28CopiesTheBorder) {
    CHologramsRemove remover;
    const CImage src = RandomImage(100, 100, 24, 3);
    CImage avg;
    remover.CalcAvImg_24(const_cast<CImage&>(src), avg, 28);
    for (int y = 0; y < 100; ++y)
        for (int x = 0; x < 100; ++x) {
            const bool border = x < 14 || x >= 86 || y < 14 || y >= 86;
            for (int c = 0; c < 3; ++c) {
                const int expected = border ? src.GetPtrXY(x, y)[c] : DirectAverage(src, 28, x, y, c);
                ASSERT_EQ(avg.GetPtrXY(x, y)[c], expected) << x << "," << y << "," << c;
            }
        }
}

TEST(TwoScaling, OddWindowLeavesTheUnproducedRowAndColumnZero) {
    CHologramsRemove remover;
    CImage src = RandomImage(23, 19, 24, 4, 1, 255);
    CImage avg;
    remover.CalcAvImg_24(src, avg, 5);  // h = 2: row 16 and column 20 lie between averages and border
    EXPECT_EQ(Px(avg, 10, 16), (std::vector<int>{0, 0, 0}));
    EXPECT_EQ(Px(avg, 20, 9), (std::vector<int>{0, 0, 0}));
    EXPECT_EQ(Px(avg, 21, 9), Px(src, 21, 9));
    EXPECT_NE(Px(avg, 19, 9), (std::vector<int>{0, 0, 0}));

    CImage tall = RandomImage(30, 5, 24, 5, 1, 255);  // no window fits: border rules only
    remover.CalcAvImg_24(tall, avg, 6);
    EXPECT_TRUE(SamePixels(avg, tall));
}

// The running sums against direct window sums, both depths, odd and even sizes and windows.
TEST(TwoScaling, RunningSumBoxAveragesMatchDirectSums) {
    CHologramsRemove remover;
    Random rnd(11);
    for (int round = 0; round < 12; ++round) {
        const int w = 8 + rnd.Below(60), h = 8 + rnd.Below(60);
        const int window = 1 + rnd.Below(std::min(w, h) - 1);
        const int bits = round % 2 ? 8 : 24;
        const int bpp = bits / 8;
        CImage src = RandomImage(w, h, bits, 100 + round), avg;
        if (bits == 8)
            remover.CalcAvImg_8(src, avg, window);
        else
            remover.CalcAvImg_24(src, avg, window);
        const int half = window / 2;
        for (int r = 0; r + window <= h - 1; ++r)
            for (int s = 0; s + window <= w - 1; ++s)
                for (int c = 0; c < bpp; ++c) {
                    long sum = 0;
                    for (int j = r; j < r + window; ++j)
                        for (int i = s; i < s + window; ++i) sum += src.GetPtrXY(i, j)[c];
                    ASSERT_EQ(avg.GetPtrXY(s + half, r + half)[c], sum / (window * window))
                        << w << "x" << h << " W=" << window << " bits=" << bits;
                }
    }
}

TEST(TwoScaling, IlluminationModelOfAFlatProfileIsFlat) {
    CHologramsRemove remover;
    CImage profile = Solid24(40, 90, 128, 128, 128), model;
    remover.m_avDifVal = 128;
    remover.CalcAvImg_24_By_XY(profile, model, 1, 0, 90);
    EXPECT_TRUE(SamePixels(model, Solid24(40, 90, 128, 128, 128)));
    remover.m_avDifVal = 100;  // the mean is moved by wrapping byte arithmetic
    remover.CalcAvImg_24_By_XY(profile, model, 1, 0, 90);
    EXPECT_EQ(Px(model, 7, 7), (std::vector<int>{100, 100, 100}));
}

TEST(TwoScaling, MaskedAverageRecomputesOnlyAroundMaskedPixels) {
    CHologramsRemove remover;
    CImage image = Solid24(12, 12, 50, 50, 50);
    Put24(image, 6, 6, 250, 50, 50);
    CImage average;
    remover.CalcAvImg_24(image, average, 3);
    const CImage before = average;
    CImage mask(12, 12, 24);
    remover.FixAvMap_24(image, average, mask, 3, 20);
    EXPECT_TRUE(SamePixels(average, before));  // empty mask: unchanged

    mask.GetPtrXY(6, 6)[0] = 200;  // B of the bright pixel is masked
    remover.FixAvMap_24(image, average, mask, 3, 20);
    // Around it: (72 * 9 - 250 + 4) / 8 = 50 (the average was 72).
    EXPECT_EQ(before.GetPtrXY(5, 5)[0], (8 * 50 + 250) / 9);
    EXPECT_EQ(average.GetPtrXY(5, 5)[0], (72 * 9 - 250 + 4) / 8);
    EXPECT_EQ(average.GetPtrXY(5, 5)[1], 50);
    EXPECT_EQ(average.GetPtrXY(2, 2)[0], 50);

    const CImage kept = average;
    remover.FixAvMap_24(image, average, mask, 4, 20);  // even window: refused
    CImage small(6, 6, 24);
    remover.FixAvMap_24(image, average, small, 3, 20);  // mask of another size: refused
    EXPECT_TRUE(SamePixels(average, kept));
}

TEST(TwoScaling, ProfilesGoToRowAndColumnZero) {
    CHologramsRemove remover;
    CImage image = Solid24(90, 80, 100, 60, 20);  // R = 20 lies below the counted range
    remover.CalcImg_HV_Av_24(image, 2, 0, 80);
    EXPECT_EQ(Px(image, 50, 0), (std::vector<int>{100, 60, 0}));
    EXPECT_EQ(Px(image, 0, 40), (std::vector<int>{100, 60, 0}));
    EXPECT_EQ(Px(image, 50, 40), (std::vector<int>{100, 60, 20}));
}

// The vectorised division against the plain one at the quotient boundaries, odd and even lengths.
TEST(TwoScaling, VectorDivisionOfWindowSumsMatchesThePlainOne) {
    for (uint32_t area : {1u, 9u, 784u, 4096u, 65025u, 65536u, 70000u}) {
        std::vector<uint32_t> sums;
        for (uint32_t q = 0; q <= 255; ++q)
            for (uint32_t delta : {0u, 1u, area / 2, area - 1})
                if (q * area + delta <= 255 * area) sums.push_back(q * area + delta);
        Random rnd(area);
        for (int i = 0; i < 37; ++i) sums.push_back(static_cast<uint32_t>(rnd.Next() % (255 * area + 1)));
        for (size_t n : {sums.size(), sums.size() - 1}) {
            std::vector<uint8_t> plain(n), fast(n);
            holo::PlainDivideSums(sums.data(), plain.data(), n, area);
            holo::FastDivideSums(sums.data(), fast.data(), n, area);
            ASSERT_EQ(plain, fast) << "area " << area << " n " << n;
        }
    }
}
