#include <gtest/gtest.h>

#include "pyramid/Pyramid.h"
#include "holograms/test_four_support.h"

using namespace four_test;
using Access = HologramsRemoveTestAccess;

namespace {

// Two-level pyramids (8x8 over 4x4): level 1 guides level 0.
struct LevelFixture {
    CPyramid in[4] = {CPyramid(2, 8, 8, 3), CPyramid(2, 8, 8, 3), CPyramid(2, 8, 8, 3), CPyramid(2, 8, 8, 3)};
    CPyramid result{2, 8, 8, 3};
    CHologramsRemove remover;

    void SetCandidate(int i, Bgr coarse, Bgr fine) {
        Fill(in[i].GetLevel(1), coarse);
        Fill(in[i].GetLevel(0), fine);
    }
    void Run() { Access::UpdateLevel(remover, in[0], in[1], in[2], in[3], result, 0); }
};

const Bgr kSaturated{241, 10, 10};

}  // namespace

TEST(LevelUpdate, AgreeingChoicesCopyAndSaturationStartsAbove240) {
    LevelFixture f;
    Fill(f.result.GetLevel(1), {240, 240, 240});
    f.SetCandidate(0, {240, 240, 240}, {10, 20, 30});  // 240 is still unsaturated
    for (int i = 1; i < 4; ++i) f.SetCandidate(i, kSaturated, {99, 99, 99});
    f.Run();
    EXPECT_EQ(At(f.result.GetLevel(0), 0, 0), (Bgr{10, 20, 30}));
    EXPECT_EQ(At(f.result.GetLevel(0), 7, 7), (Bgr{10, 20, 30}));

    // With every candidate above 240 the pixels come from their neighbours.
    f.SetCandidate(0, {10, 241, 10}, {10, 20, 30});
    Fill(f.result.GetLevel(0), {80, 90, 100});
    f.Run();
    EXPECT_EQ(At(f.result.GetLevel(0), 0, 0), (Bgr{80, 90, 100}));
    EXPECT_EQ(At(f.result.GetLevel(0), 7, 7), (Bgr{80, 90, 100}));
}

TEST(LevelUpdate, DirectionChoiceScaledToTheLengthChoicesSum) {
    LevelFixture f;
    Fill(f.result.GetLevel(1), {200, 100, 0});
    f.SetCandidate(0, {20, 10, 0}, {41, 20, 10});     // same direction as the reference
    f.SetCandidate(1, {100, 200, 0}, {70, 70, 70});   // same length as the reference
    f.SetCandidate(2, kSaturated, {0, 0, 0});
    f.SetCandidate(3, kSaturated, {0, 0, 0});
    f.Run();
    // 41 * 210 / 71 = 121.27, 20 * 210 / 71 = 59.15, 10 * 210 / 71 = 29.58
    EXPECT_EQ(At(f.result.GetLevel(0), 3, 5), (Bgr{121, 59, 30}));

    // A black direction pixel has no colour to scale: the length choice is copied.
    Fill(f.in[0].GetLevel(0), {0, 0, 0});
    f.Run();
    EXPECT_EQ(At(f.result.GetLevel(0), 3, 5), (Bgr{70, 70, 70}));
}

TEST(LevelUpdate, BlackReferenceCopiesTheLengthChoiceAndBadLevelsAreRefused) {
    LevelFixture f;
    Fill(f.result.GetLevel(1), {0, 0, 0});
    f.SetCandidate(0, {100, 100, 100}, {1, 2, 3});
    f.SetCandidate(1, {20, 10, 5}, {4, 5, 6});  // shortest: closest to length 0
    f.SetCandidate(2, {50, 50, 50}, {7, 8, 9});
    f.SetCandidate(3, kSaturated, {0, 0, 0});
    f.Run();
    EXPECT_EQ(At(f.result.GetLevel(0), 1, 1), (Bgr{4, 5, 6}));

    Fill(f.result.GetLevel(0), {33, 33, 33});
    Access::UpdateLevel(f.remover, f.in[0], f.in[1], f.in[2], f.in[3], f.result, 1);  // no level 2
    Access::UpdateLevel(f.remover, f.in[0], f.in[1], f.in[2], f.in[3], f.result, -1);
    CPyramid small(2, 6, 6, 3);
    Access::UpdateLevel(f.remover, f.in[0], f.in[1], f.in[2], small, f.result, 0);
    EXPECT_EQ(At(f.result.GetLevel(0), 1, 1), (Bgr{33, 33, 33}));
}

TEST(LevelUpdate, FullResolutionUpdateTakesDirectionAndLength) {
    CHologramsRemove remover;
    const CImage top = Solid(5, 3, {20, 10, 0}), bottom = Solid(5, 3, {100, 200, 0});
    const CImage left = Solid(5, 3, kSaturated), right = Solid(5, 3, kSaturated);
    CImage coarse = Solid(3, 2, {200, 100, 0});
    CImage result(5, 3, 24);
    Access::UpdateLevel2(remover, top, bottom, left, right, coarse, result);
    EXPECT_EQ(At(result, 4, 2), (Bgr{200, 100, 0}));

    Fill(coarse, {0, 0, 0});  // no direction: the length choice (top, the shortest) is copied
    Access::UpdateLevel2(remover, top, bottom, left, right, coarse, result);
    EXPECT_EQ(At(result, 4, 2), (Bgr{20, 10, 0}));

    const CImage sat = Solid(5, 3, kSaturated);
    Fill(result, {60, 70, 80});
    Access::UpdateLevel2(remover, sat, sat, sat, sat, coarse, result);
    EXPECT_EQ(At(result, 0, 0), (Bgr{60, 70, 80}));
    EXPECT_EQ(At(result, 4, 2), (Bgr{60, 70, 80}));

    CImage tooSmallCoarse = Solid(2, 2, {1, 1, 1}), wrongResult(4, 3, 24);
    Access::UpdateLevel2(remover, top, bottom, left, right, tooSmallCoarse, result);
    Access::UpdateLevel2(remover, top, bottom, left, right, coarse, wrongResult);
    EXPECT_EQ(At(result, 0, 0), (Bgr{60, 70, 80}));
    EXPECT_EQ(At(wrongResult, 0, 0), (Bgr{0, 0, 0}));
}

TEST(LevelUpdate, ColorMapTakesTheDarkestEarliestOnTies) {
    CHologramsRemove remover;
    CImage top = Solid(4, 2, {50, 60, 70}), bottom = Solid(4, 2, {10, 80, 20});
    const CImage left = Solid(4, 2, {70, 0, 0}), right = Solid(4, 2, {90, 90, 90});
    CImage map(4, 2, 24);
    Access::ColorMapCreate(remover, top, top, top, top, map);
    EXPECT_EQ(At(map, 3, 1), (Bgr{50, 60, 70}));
    Access::ColorMapCreate(remover, top, bottom, left, right, map);
    EXPECT_EQ(At(map, 0, 0), (Bgr{50, 60, 70}));  // 70 ties with left's 70: top is earlier
    Put(top, 2, 1, {200, 0, 0});
    Access::ColorMapCreate(remover, top, bottom, left, right, map);
    EXPECT_EQ(At(map, 2, 1), (Bgr{70, 0, 0}));
}

TEST(LevelUpdate, CleanMaskTopRemovesThinLinesOnly) {
    CHologramsRemove remover;
    CImage mask(8, 8, 8);
    mask.GetPtrXY(2, 2)[0] = 255;  // isolated
    for (int y = 4; y <= 5; ++y)
        for (int x = 4; x <= 5; ++x) mask.GetPtrXY(x, y)[0] = 200;  // 2x2 block
    for (int x = 1; x <= 6; ++x) mask.GetPtrXY(x, 7)[0] = 9;  // last row is never touched
    Access::CleanMaskTop(remover, mask);
    EXPECT_EQ(mask.GetPtrXY(2, 2)[0], 0);
    EXPECT_EQ(mask.GetPtrXY(4, 4)[0], 200);
    EXPECT_EQ(mask.GetPtrXY(5, 5)[0], 200);
    EXPECT_EQ(mask.GetPtrXY(3, 7)[0], 9);

    CImage line(6, 3, 8);  // a one-pixel horizontal line goes row by row
    for (int x = 0; x < 6; ++x) line.GetPtrXY(x, 1)[0] = 255;
    Access::CleanMaskTop(remover, line);
    for (int x = 1; x < 5; ++x) EXPECT_EQ(line.GetPtrXY(x, 1)[0], 0) << x;

    CImage colour = Solid(4, 4, {255, 0, 0}), low(4, 2, 8);
    low.Set(255);
    Access::CleanMaskTop(remover, colour);
    Access::CleanMaskTop(remover, low);
    EXPECT_EQ(At(colour, 1, 1), (Bgr{255, 0, 0}));
    EXPECT_EQ(low.GetPtrXY(1, 1)[0], 255);
}

TEST(LevelUpdate, NeighbourAverageReadsLeftAndPreviousRow) {
    CHologramsRemove remover;
    CImage img(4, 2, 24);
    // Row 0 (previous) and row 1 (current), channel 1.
    const int above[4] = {10, 20, 31, 40}, current[4] = {5, 6, 7, 8};
    for (int x = 0; x < 4; ++x) {
        img.GetPtrXY(x, 0)[1] = static_cast<unsigned char>(above[x]);
        img.GetPtrXY(x, 1)[1] = static_cast<unsigned char>(current[x]);
    }
    unsigned char* row = img.GetPtrXY(0, 1);
    const int span = img.GetSpan();
    EXPECT_EQ(Access::AvarageNeighbours(remover, row, 6, 1, span), (6 + 20 + 31 + 40) >> 2);
    // The first pixel is its own left neighbour.
    EXPECT_EQ(Access::AvarageNeighbours(remover, row, 0, 1, span), (5 + 10 + 10 + 20) >> 2);
}
