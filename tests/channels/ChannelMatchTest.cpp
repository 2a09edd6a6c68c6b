#include <gtest/gtest.h>

#include <cstring>
#include <random>

#include <hwy/targets.h>

#include "channels/CheatIRTestAccess.h"

using namespace testpics;
using Access = CCheatIRTestAccess;

namespace {

TEST(Grade, MatchesIdenticalNegativeAndUniformWindows) {
    CCheatIR cheat;
    Access::Window a(25), negative(25), uniform(25);
    for (int i = 0; i < 25; ++i) {
        a[i] = static_cast<uint8_t>(i * 9 + (i % 3) * 20);
        negative[i] = static_cast<uint8_t>(255 - a[i]);
        uniform[i] = 77;
    }
    EXPECT_NEAR(Access::Grade(cheat, a, a), 0.0f, 1e-6f);
    EXPECT_NEAR(Access::Grade(cheat, a, negative), 2.0f, 1e-6f);
    EXPECT_EQ(Access::Grade(cheat, uniform, a), 0.0f);
    EXPECT_EQ(Access::Grade(cheat, a, uniform), 0.0f);
}

TEST(BuildBaseWin, PacksTheInsidePartAtTheBorder) {
    CCheatIR cheat;
    const CImage img = Noise(100, 100, 1);
    Access::Window w(25);
    for (int i = 0; i < 25; ++i) w[i] = 99;
    Access::BuildBaseWin(cheat, CPoint(0, 0), img, w);
    for (int i = 0; i < 5; ++i)
        for (int j = 0; j < 5; ++j) EXPECT_EQ(w[5 * i + j], i < 3 && j < 3 ? At(img, j, i) : 0) << i << "," << j;
    Access::BuildBaseWin(cheat, CPoint(50, 40), img, w);
    EXPECT_EQ(w[0], At(img, 48, 38));
    EXPECT_EQ(w[24], At(img, 52, 42));
}

TEST(BuildLocalMap, PlacesOffsetsInsideAndPacksThemAtTheBorder) {
    CCheatIR cheat;
    const CImage img = Noise(100, 100, 2);
    Access::Window ref(25), win(25);
    Access::GradeMap map(441);
    Access::BuildBaseWin(cheat, CPoint(50, 50), img, ref);
    Access::BuildLocalMap(cheat, CPoint(50, 50), img, ref, map);
    EXPECT_NEAR(map[220], 0.0f, 1e-6f);
    Access::BuildBaseWin(cheat, CPoint(47, 58), img, win);  // dx = -3, dy = 8
    EXPECT_EQ(map[18 * 21 + 7], Access::Grade(cheat, win, ref));
    EXPECT_GT(map[0], 0.0f);
    EXPECT_GT(map[440], 0.0f);

    // At x = 5 the columns run from 2 to 15: 14 entries a row, packed.
    Access::GradeMap packed(441);
    Access::BuildBaseWin(cheat, CPoint(5, 50), img, ref);
    Access::BuildLocalMap(cheat, CPoint(5, 50), img, ref, packed);
    Access::BuildBaseWin(cheat, CPoint(2, 41), img, win);
    EXPECT_EQ(packed[14], Access::Grade(cheat, win, ref));
    Access::BuildBaseWin(cheat, CPoint(15, 60), img, win);
    EXPECT_EQ(packed[21 * 14 - 1], Access::Grade(cheat, win, ref));
    for (int k = 21 * 14; k < 441; ++k) EXPECT_EQ(packed[k], 0.0f);
}

TEST(BuildLocalMap, FastGradingEqualsThePlainDefinitionBitForBit) {
    CCheatIR cheat;
    for (int64_t target : hwy::SupportedAndGeneratedTargets()) {
    hwy::SetSupportedTargetsForTest(target);
    for (auto [w, h] : {std::pair{37, 29}, std::pair{64, 50}, std::pair{23, 9}}) {
        CImage img = Noise(w, h, static_cast<unsigned>(w));
        Fill(img, 3, 3, 12, 8, 90);  // flat windows grade NaN -> 0 on both paths
        for (int y = 0; y < h; y += 3)
            for (int x = 0; x < w; x += 2) {
                Access::Window ref(25);
                Access::GradeMap fast(441), plain(441);
                Access::BuildBaseWin(cheat, CPoint(x, y), img, ref);
                Access::BuildLocalMap(cheat, CPoint(x, y), img, ref, fast);
                channels::BuildLocalMapPlain(CPoint(x, y), img, ref.data(), plain.data());
                ASSERT_EQ(std::memcmp(fast.data(), plain.data(), 441 * sizeof(float)), 0)
                    << hwy::TargetName(target) << " " << w << " " << x << "," << y;
            }
    }
    }
    hwy::SetSupportedTargetsForTest(0);
}

TEST(ChannelMatchAndWarp, WritesNothingWithoutSegmentsAndWhiteForPointlessOnes) {
    DumpDir dumps("varnoth_channels_maps");
    CCheatIR cheat;
    CImage channel = Grey(40, 40, 100);
    const CImage reference = Grey(40, 40, 100);
    EXPECT_TRUE(Access::ChannelMatchAndWarp(cheat, channel, reference));
    EXPECT_FALSE(std::filesystem::exists(dumps.File("acumMap.bmp")));

    Access::Segments(cheat).push_back(SSegment{RECT{5, 5, 10, 10}, {}});
    EXPECT_TRUE(Access::ChannelMatchAndWarp(cheat, channel, reference));
    EXPECT_FALSE(std::filesystem::exists(dumps.File("localMap.bmp")));
    CImage picture;
    ASSERT_TRUE(picture.ImportFile(dumps.File("acumMap.bmp")));
    ASSERT_EQ(picture.GetWidth(), 21);
    for (int y = 0; y < 21; ++y)
        for (int i = 0; i < 21 * picture.GetBitCount() / 8; ++i) ASSERT_EQ(picture.GetPtrXY(0, y)[i], 255);
}

TEST(ChannelMatchAndWarp, DumpsTheLastPointsMapsAndTheSegmentsSum) {
    DumpDir dumps("varnoth_channels_point");
    CCheatIR cheat;
    CImage channel = Noise(60, 60, 4);
    const CImage reference = channel;
    Access::Segments(cheat).push_back(SSegment{RECT{20, 20, 40, 40}, {CPoint(30, 30)}});
    EXPECT_TRUE(Access::ChannelMatchAndWarp(cheat, channel, reference));
    EXPECT_TRUE(SamePixels(channel, reference));
    CImage local, base, sum;
    ASSERT_TRUE(local.ImportFile(dumps.File("localMap.bmp")));
    ASSERT_TRUE(base.ImportFile(dumps.File("baseMap.bmp")));
    ASSERT_TRUE(sum.ImportFile(dumps.File("acumMap.bmp")));
    EXPECT_EQ(At(local, 10, 10), 0);  // offset (0, 0) matches exactly
    EXPECT_GT(At(local, 0, 0), 0);
    for (int i = 0; i < 5; ++i)
        for (int j = 0; j < 5; ++j) EXPECT_EQ(At(base, j, i), At(reference, 28 + j, 28 + i));
    EXPECT_EQ(At(sum, 10, 10), 0);
    int brightest = 0;
    for (int y = 0; y < 21; ++y)
        for (int x = 0; x < 21; ++x) brightest = std::max<int>(brightest, At(sum, x, y));
    EXPECT_EQ(brightest, 255);  // the largest sum scales to 255
}

TEST(MatchChannels, TinyPlanesGiveNoSegments) {
    for (auto [w, h] : {std::pair{1, 1}, std::pair{4, 3}, std::pair{12, 2}, std::pair{0, 0}}) {
        CImage planes[3];
        for (CImage& plane : planes) plane.Reallocate(w, h, 8);  // 0 x 0 is an empty 8-bit image
        CCheatIR cheat;
        std::vector<SSegmentGrades> grades(3);
        EXPECT_TRUE(cheat.MatchChannels(planes, &grades)) << w << "x" << h;
        EXPECT_TRUE(grades.empty());
        EXPECT_TRUE(cheat.CheatCreate(planes));
    }
}

// Strokes of several directions, so that every offset but the true one grades worse, on a
// slightly noisy paper: a flat window would grade 0 (a perfect match) at any offset.
CImage StrokePage(int w, int h) {
    CImage img = Grey(w, h, 210);
    Fill(img, 40, 60, 44, 140, 30);    // vertical
    Fill(img, 40, 100, 110, 104, 30);  // horizontal, joins it
    Fill(img, 90, 70, 130, 110, 40);   // block...
    Fill(img, 96, 76, 124, 104, 210);  // ...made a ring
    for (int i = 0; i < 50; ++i) Fill(img, 150 + i, 60 + i, 153 + i, 61 + i, 50);  // diagonal
    Fill(img, 230, 0, 232, h - 1, 40);  // closes the last runs of each row
    Fill(img, 0, 180, w - 1, 182, 40);
    std::mt19937 random(5);
    for (int y = 0; y < h; ++y)
        for (int x = 0; x < w; ++x) img.GetPtrXY(0, y)[x] = static_cast<uint8_t>(At(img, x, y) + random() % 9 - 4);
    return img;
}

CImage Shifted(const CImage& src, int dx, int dy) {  // result(x, y) = src(x - dx, y - dy)
    CImage out = Grey(src.GetWidth(), src.GetHeight(), 210);
    for (int y = 0; y < src.GetHeight(); ++y)
        for (int x = 0; x < src.GetWidth(); ++x) {
            const int sx = x - dx, sy = y - dy;
            if (sx >= 0 && sy >= 0 && sx < src.GetWidth() && sy < src.GetHeight())
                out.GetPtrXY(0, y)[x] = At(src, sx, sy);
        }
    return out;
}

TEST(MatchChannels, ReportsTheShiftOfEachPlaneAgainstPlane1) {
    const CImage reference = StrokePage(240, 200);
    CImage planes[3] = {Shifted(reference, 3, -2), reference, Shifted(reference, -4, 1)};
    const CImage before0 = planes[0], before2 = planes[2];
    CCheatIR cheat;
    std::vector<SSegmentGrades> grades;
    ASSERT_TRUE(cheat.MatchChannels(planes, &grades));
    EXPECT_TRUE(SamePixels(planes[0], before0) && SamePixels(planes[2], before2));
    ASSERT_EQ(grades.size(), Access::Segments(cheat).size());
    int reported = 0;
    for (const SSegmentGrades& g : grades) {
        if (g.clipped || g.pointCount == 0) {
            EXPECT_FALSE(g.BestOffset(0).has_value());
            continue;
        }
        ++reported;
        EXPECT_EQ(g.BestOffset(0), CPoint(3, -2));
        EXPECT_EQ(g.BestOffset(1), CPoint(-4, 1));
    }
    EXPECT_GE(reported, 1);

    // A second call starts afresh: the same planes give the same segments.
    std::vector<SSegmentGrades> again;
    ASSERT_TRUE(cheat.MatchChannels(planes, &again));
    ASSERT_EQ(again.size(), grades.size());
    for (size_t i = 0; i < grades.size(); ++i) EXPECT_EQ(again[i].accumulated[1], grades[i].accumulated[1]);
}

}  // namespace
