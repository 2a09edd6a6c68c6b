#include <gtest/gtest.h>

#include "common/TestImages.h"
#include "holograms/FourImageBrightnessMapInternal.h"
#include "holograms/test_four_support.h"

using namespace four_test;
using testing_images::RandomImage;
using testing_images::SamePixels;

namespace {

bool SameRow(const CImage& a, int ya, const CImage& b, int yb) {
    for (int i = 0; i < 3 * a.GetWidth(); ++i)
        if (a.GetPtrXY(0, ya)[i] != b.GetPtrXY(0, yb)[i]) return false;
    return true;
}

CImage Darkened(CImage img) {  // keeps every byte below the saturation bound
    for (size_t i = 0; i < img.GetSize(); ++i) img.GetBits()[i] = static_cast<unsigned char>(img.GetBits()[i] * 3 / 4);
    return img;
}

}  // namespace

TEST(FourImageBrightnessMap, BorderRowsComeFromBottomThenTop) {
    CHologramsRemove remover;
    for (int h : {9, 4, 3, 2, 1}) {
        const CImage t = RandomImage(7, h, 24, 1), b = RandomImage(7, h, 24, 2);
        const CImage l = RandomImage(7, h, 24, 3), r = RandomImage(7, h, 24, 4);
        CImage result;
        remover.HologramsRemove4Img2(t, b, l, r, result);
        ASSERT_EQ(result.GetHeight(), h);
        if (h >= 4) {
            EXPECT_TRUE(SameRow(result, 0, b, 0) && SameRow(result, 1, b, 1)) << h;
        }
        EXPECT_TRUE(SameRow(result, h - 1, t, h - 1)) << h;
        if (h >= 2) {
            EXPECT_TRUE(SameRow(result, h - 2, t, h - 2)) << h;
        }
    }
}

TEST(FourImageBrightnessMap, IdenticalUnsaturatedInputsComeBack) {
    CHologramsRemove remover;
    const CImage img = Darkened(RandomImage(11, 10, 24, 9));
    CImage result;
    remover.HologramsRemove4Img2(img, img, img, img, result);
    EXPECT_TRUE(SamePixels(result, img));
}

TEST(FourImageBrightnessMap, SaturationFlagsAndTheAllSaturatedAverage) {
    const unsigned char sat[3] = {241, 0, 0}, bound[3] = {240, 240, 240};
    const unsigned char resultLeft[3] = {10, 20, 31}, resultAbove[3] = {30, 41, 60};
    const unsigned char* allSat[4] = {sat, sat, sat, sat};
    unsigned char out[3], flags = 1;
    holo4::RebuildPixel(allSat, allSat, allSat, resultLeft, resultAbove, out, &flags);
    EXPECT_EQ(flags, 0xF0);
    EXPECT_EQ(out[0], 20);
    EXPECT_EQ(out[1], 30);
    EXPECT_EQ(out[2], 45);

    // 240 is not saturated; the one unsaturated candidate is copied.
    const unsigned char* oneClear[4] = {sat, bound, sat, sat};
    holo4::RebuildPixel(oneClear, oneClear, oneClear, resultLeft, resultAbove, out, &flags);
    EXPECT_EQ(flags, 0xD0);
    EXPECT_EQ(out[0], 240);
    const unsigned char* noneSat[4] = {bound, bound, bound, bound};
    holo4::RebuildPixel(noneSat, noneSat, noneSat, resultLeft, resultAbove, out, &flags);
    EXPECT_EQ(flags, 0);
}

TEST(FourImageBrightnessMap, ClosestProportionsWinAndBlackHasNone) {
    float p[3] = {1, 1, 1};
    const unsigned char black[3] = {0, 0, 0};
    holo4::Proportions(black, p);
    EXPECT_EQ(p[0] + p[1] + p[2], 0.0f);
    // Smooth neighbours (no differences): the rebuilt pixel is the mean of the result's
    // left and upper pixels, grey here, so the greyest candidate is copied.
    const unsigned char red[3] = {10, 10, 200}, grey[3] = {100, 100, 110}, blue[3] = {200, 10, 10};
    const unsigned char* at[4] = {red, blue, grey, black};
    const unsigned char left[3] = {90, 90, 90}, above[3] = {110, 110, 110};
    unsigned char out[3], flags;
    holo4::RebuildPixel(at, at, at, left, above, out, &flags);
    EXPECT_EQ(out[2], 110);
    EXPECT_EQ(out[0], 100);
}

TEST(FourImageBrightnessMap, NarrowOrMismatchedInputsAreRefused) {
    CHologramsRemove remover;
    const CImage narrow = RandomImage(1, 8, 24, 1), a = RandomImage(8, 8, 24, 1), b = RandomImage(8, 9, 24, 1);
    CImage result = Solid(2, 2, {5, 5, 5});
    remover.HologramsRemove4Img2(narrow, narrow, narrow, narrow, result);
    remover.HologramsRemove4Img2(a, a, b, a, result);
    EXPECT_EQ(result.GetWidth(), 2);

    // Two and three columns are only edge pairs, taken from one of the (identical) shots.
    const CImage thin = RandomImage(3, 9, 24, 2);
    remover.HologramsRemove4Img2(thin, thin, thin, thin, result);
    EXPECT_TRUE(SamePixels(result, thin));
}

TEST(FourImageBrightnessMap, BandedPassMatchesThePlainRasterPass) {
    for (int size : {2, 3, 4, 5, 37, 71}) {
        const CImage t = RandomImage(size, size + 30, 24, 11), b = Darkened(RandomImage(size, size + 30, 24, 12));
        const CImage l = Darkened(RandomImage(size, size + 30, 24, 13)), r = RandomImage(size, size + 30, 24, 14);
        const CImage* const in[4] = {&t, &b, &l, &r};
        CImage plain(size, size + 30, 24), fast(size, size + 30, 24), plainMap(size, size + 30, 8),
            fastMap(size, size + 30, 8);
        holo4::ComposeBrightnessMapPlain(in, plain, plainMap);
        holo4::ComposeBrightnessMapFast(in, fast, fastMap);
        EXPECT_TRUE(SamePixels(plain, fast)) << size;
        EXPECT_TRUE(SamePixels(plainMap, fastMap)) << size;
    }
}
