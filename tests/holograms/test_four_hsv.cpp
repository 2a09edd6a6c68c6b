#include <gtest/gtest.h>

#include <vector>

#include "holograms/FourImageHsvInternal.h"
#include "holograms/test_four_support.h"
#include "scene/Scene.h"

using namespace four_test;

namespace {

// One pixel through the remover's in-place colour conversion.
Bgr Converted(Bgr in, void (*convert)(CHologramsRemove&, unsigned char*)) {
    CHologramsRemove r;
    unsigned char p[3] = {static_cast<unsigned char>(in.b), static_cast<unsigned char>(in.g),
                          static_cast<unsigned char>(in.r)};
    convert(r, p);
    return {p[0], p[1], p[2]};
}

Bgr Hsv(Bgr rgb) { return Converted(rgb, HologramsRemoveTestAccess::Rgb2Hsv); }
Bgr Rgb(Bgr hsv) { return Converted(hsv, HologramsRemoveTestAccess::Hsv2Rgb); }  // b = H, g = S, r = V

}  // namespace

TEST(FourImageHsv, ConversionOfGreyAndPrimaries) {
    EXPECT_EQ(Hsv({100, 100, 100}), (Bgr{0, 0, 100}));
    EXPECT_EQ(Rgb({0, 0, 100}), (Bgr{100, 100, 100}));
    EXPECT_EQ(Hsv({0, 0, 255}), (Bgr{0, 255, 255}));    // red
    EXPECT_EQ(Hsv({0, 255, 0}), (Bgr{85, 255, 255}));   // green
    EXPECT_EQ(Hsv({255, 0, 0}), (Bgr{170, 255, 255}));  // blue
    // H = 255 is converted like H = 0: R = V, G = B = V - chroma (200 - 100.39, rounded).
    EXPECT_EQ(Rgb({255, 128, 200}), (Bgr{100, 100, 200}));
    EXPECT_EQ(Rgb({0, 128, 200}), (Bgr{100, 100, 200}));
    // A magenta-ish colour: negative sector position wraps around.
    const Bgr back = Rgb(Hsv({200, 40, 220}));
    EXPECT_NEAR(back.b, 200, 2);
    EXPECT_NEAR(back.g, 40, 2);
    EXPECT_NEAR(back.r, 220, 2);
}

TEST(FourImageHsv, SaturationBoundAndThresholds) {
    EXPECT_TRUE(holo4::IsHsvSaturated(246));
    EXPECT_FALSE(holo4::IsHsvSaturated(245));

    uint32_t hist[256] = {};
    hist[10] = 5;
    hist[3] = 10;
    EXPECT_EQ(holo4::SpreadThreshold(hist, 0), 0);  // a level of fewer than 7 pixels
    EXPECT_EQ(holo4::SpreadThreshold(hist, 5), 10);
    EXPECT_EQ(holo4::SpreadThreshold(hist, 6), 3);
    EXPECT_EQ(holo4::SpreadThreshold(hist, 100), 0);
}

TEST(FourImageHsv, CoarsestLevelAveragesTheLaterOfEqualCandidates) {
    const unsigned char c0[3] = {100, 10, 10}, c1[3] = {100, 20, 20}, c2[3] = {100, 30, 30}, c3[3] = {100, 41, 40};
    const unsigned char* lap[4] = {c0, c1, c2, c3};
    unsigned char out[3];
    holo4::AverageOfTwoDarkest(lap, out);
    EXPECT_EQ(out[1], 35);
    EXPECT_EQ(out[2], 35);
    const unsigned char dark[3] = {50, 0, 0};
    const unsigned char* oneDark[4] = {c0, dark, c2, c3};
    holo4::AverageOfTwoDarkest(oneDark, out);
    EXPECT_EQ(out[0], 75);  // dark with c3, the later of the equal rest
    EXPECT_EQ(out[1], 20);
}

TEST(FourImageHsv, DecisionsOfTheSecondPass) {
    const unsigned char lap0[3] = {1, 1, 1}, lap1[3] = {2, 2, 2}, lap2[3] = {3, 3, 3}, lap3[3] = {4, 4, 4};
    const unsigned char* lap[4] = {lap0, lap1, lap2, lap3};
    unsigned char out[3];
    // All four saturated: decided as if none were; equal grey candidates give their grey.
    const unsigned char grey[3] = {0, 0, 120};
    const unsigned char* greys[4] = {grey, grey, grey, grey};
    const bool all[4] = {true, true, true, true}, none[4] = {false, false, false, false};
    holo4::DecidePixel(lap, greys, all, 0, 0, out);
    EXPECT_EQ(out[0], 120);
    EXPECT_EQ(out[2], 120);
    // Value spread dominates and exceeds its threshold: the darkest candidate's detail.
    const unsigned char v90[3] = {10, 50, 90}, v60[3] = {10, 52, 60}, v200[3] = {10, 51, 200}, v61[3] = {10, 50, 61};
    const unsigned char* values[4] = {v90, v60, v200, v61};
    holo4::DecidePixel(lap, values, none, 0, 0, out);
    EXPECT_EQ(out[0], 2);
    // Both spreads within their thresholds: lowest S (candidate 0, 50) with H and V of the
    // darkest similar-S candidate, since that darkest V (60) is not above 127.
    holo4::DecidePixel(lap, values, none, 255, 255, out);
    unsigned char expected[3] = {10, 50, 60};
    holo4::HsvToRgb(expected);
    EXPECT_EQ(out[0], expected[0]);
    EXPECT_EQ(out[1], expected[1]);
    EXPECT_EQ(out[2], expected[2]);
}

TEST(FourImageHsv, RemovesGlareOnAGeneratedCard) {
    const scene::Scene s = scene::GenerateScene({310, 438, 5});
    CHologramsRemove remover;
    CImage result;
    remover.HologramsRemove4Img4(s.shots[0], s.shots[1], s.shots[2], s.shots[3], result);
    EXPECT_LT(scene::GlareShare(s, result), scene::GlareShare(s, s.shots[0]) / 4);
}

TEST(FourImageHsv, VectorConversionMatchesThePlainOne) {
    // Every green and red value for a spread of blue values, in rows of odd length.
    std::vector<unsigned char> rgb, plain, fast;
    for (int b : {0, 1, 2, 63, 64, 127, 128, 129, 191, 200, 240, 245, 246, 250, 254, 255})
        for (int g = 0; g < 256; ++g)
            for (int r = 0; r < 256; ++r) rgb.insert(rgb.end(), {static_cast<unsigned char>(b),
                                                                 static_cast<unsigned char>(g),
                                                                 static_cast<unsigned char>(r)});
    const int n = static_cast<int>(rgb.size() / 3) - 1;  // odd
    plain.assign(rgb.begin(), rgb.begin() + 3 * n);
    for (int i = 0; i < n; ++i) holo4::RgbToHsv(&plain[3 * i]);
    fast.resize(3 * n);
    holo4::RgbToHsvRowFast(rgb.data(), fast.data(), n);
    EXPECT_EQ(plain, fast);
}
