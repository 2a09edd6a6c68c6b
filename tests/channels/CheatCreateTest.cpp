#include <gtest/gtest.h>

#include "channels/CheatIRTestAccess.h"
#include "frame/Errors.h"

using namespace testpics;

namespace {

struct Planes {
    CImage p[3];
    Planes(int w, int h, uint8_t v) {
        for (CImage& plane : p) plane = Grey(w, h, v);
    }
};

// A dark pixel p in plane 0 and q in plane 1, both on a background of 200.
Planes DarkDot(uint8_t p, uint8_t q) {
    Planes planes(21, 21, 200);
    planes.p[0].GetPtrXY(0, 10)[10] = p;
    planes.p[1].GetPtrXY(0, 10)[10] = q;
    return planes;
}

TEST(CheatCreate, SmallOrUniformPlanesComeOutAsPlane0) {
    Planes small(10, 10, 0);
    for (int y = 0; y < 10; ++y)
        for (int x = 0; x < 10; ++x) small.p[0].GetPtrXY(0, y)[x] = static_cast<uint8_t>(x * 25 + y * 3);
    CCheatIR cheat;
    ASSERT_TRUE(cheat.CheatCreate(small.p));
    EXPECT_TRUE(SamePixels(cheat.GetCheat(), small.p[0]));

    Planes uniform(30, 25, 90);
    Fill(uniform.p[1], 10, 10, 12, 12, 0);  // plane 1 alone cannot make a candidate
    ASSERT_TRUE(cheat.CheatCreate(uniform.p));
    EXPECT_TRUE(SamePixels(cheat.GetCheat(), uniform.p[0]));
}

TEST(CheatCreate, RefusesPlanesOfWrongDepthOrSize) {
    const Planes good = DarkDot(100, 100);
    CCheatIR cheat;
    ASSERT_TRUE(cheat.CheatCreate(good.p));
    const CImage before = cheat.GetCheat();
    for (int bad = 0; bad < 3; ++bad) {
        Planes planes = DarkDot(100, 100);
        planes.p[bad].Reallocate(21, 21, 24);
        EXPECT_FALSE(cheat.CheatCreate(planes.p)) << "plane " << bad;
        EXPECT_THROW(CCheatIR{planes.p}, CCheatIRCreateErrT);
    }
    for (int bad = 1; bad < 3; ++bad) {
        Planes planes = DarkDot(100, 100);
        planes.p[bad] = Grey(21, 20, 200);  // would be read outside its rows
        EXPECT_FALSE(cheat.CheatCreate(planes.p));
        CImage empty[3];
        EXPECT_FALSE(cheat.MatchChannels(empty));
        EXPECT_FALSE(cheat.MatchChannels(planes.p));
    }
    EXPECT_FALSE(cheat.CheatCreate(nullptr));
    EXPECT_TRUE(SamePixels(cheat.GetCheat(), before));
}

TEST(CheatCreate, SingleDarkPixelIsDarkenedByTheResponse) {
    const Planes planes = DarkDot(100, 100);
    CCheatIR cheat(planes.p);  // S = -40 * (100 - 200) = 4000, d = 4000 / 184 = 21
    CImage expected = planes.p[0];
    expected.GetPtrXY(0, 10)[10] = 79;
    EXPECT_TRUE(SamePixels(cheat.GetCheat(), expected));

    CCheatIR copy(cheat), assigned;
    assigned = cheat;
    EXPECT_TRUE(SamePixels(copy.GetCheat(), expected));
    EXPECT_TRUE(SamePixels(static_cast<const CCheatIR&>(assigned).GetCheat(), expected));
}

TEST(CheatCreate, MarksOnlyDarkCandidatesWithinBounds) {
    struct Case {
        uint8_t p, q, expected;
    } cases[] = {
        {149, 150, 139},  // S = 2000, d = 10
        {100, 151, 100},  // plane 1 too bright
        {150, 100, 150},  // plane 0 too bright
        {180, 100, 180},  // neighbours only 20 brighter: no candidate
    };
    for (const Case& c : cases) {
        const Planes planes = DarkDot(c.p, c.q);
        CCheatIR cheat(planes.p);
        EXPECT_EQ(At(cheat.GetCheat(), 10, 10), c.expected) << int(c.p) << "/" << int(c.q);
    }
}

TEST(CheatCreate, BrighterCentreInPlane1LeavesPlane0) {
    Planes planes(21, 21, 200);
    planes.p[1].Set(50);
    planes.p[0].GetPtrXY(0, 10)[10] = 100;
    planes.p[1].GetPtrXY(0, 10)[10] = 150;  // S = -40 * 100 < 0: d raised to 0
    CCheatIR cheat(planes.p);
    EXPECT_TRUE(SamePixels(cheat.GetCheat(), planes.p[0]));
}

TEST(CheatCreate, DarkensEachMarkedPixelFromThePlane1Neighbourhood) {
    Planes planes(25, 25, 200);
    Fill(planes.p[0], 11, 11, 13, 13, 60);
    Fill(planes.p[1], 11, 11, 13, 13, 150);
    CCheatIR cheat(planes.p);
    // Centre: the inner 3 x 3 weights sum to -184, so S = -184 * (150 - 200) = 9200, d = 50.
    EXPECT_EQ(At(cheat.GetCheat(), 12, 12), 10);
    // Corner: the square covers weights -40, -24, 0, -24, -12, 3, 0, 3, 5 = -89; S = 4450, d = 24.
    EXPECT_EQ(At(cheat.GetCheat(), 11, 11), 36);
    // Edge middle: -24-40-24 -12-24-12 +3+0+3 = -130; S = 6500, d = 35.
    EXPECT_EQ(At(cheat.GetCheat(), 12, 11), 25);
    EXPECT_EQ(At(cheat.GetCheat(), 10, 10), 200);
}

}  // namespace
