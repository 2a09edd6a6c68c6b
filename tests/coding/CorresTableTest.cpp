#include <gtest/gtest.h>

#include <cstdint>
#include <cstring>
#include <random>
#include <vector>

#include "coding/CorresTable.h"
#include "hwy/targets.h"
#include "coding/CorresTableInternal.h"

namespace {

using varnoth::coding::SearchArea;

CImage Uniform(int w, int h, unsigned char value) {
    CImage image(w, h, 8);
    image.Set(value);
    return image;
}

CImage Noise(int w, int h, unsigned seed, int lo = 0, int hi = 255) {
    CImage image(w, h, 8);
    std::mt19937 rng(seed);
    std::uniform_int_distribution<int> value(lo, hi);
    for (int y = 0; y < h; ++y)
        for (int x = 0; x < w; ++x) *image.GetPtrXY(x, y) = static_cast<unsigned char>(value(rng));
    return image;
}

std::vector<float> Entries(const CCorresTable& table) {
    std::vector<float> out(static_cast<size_t>(table.GetEntryCount()));
    for (size_t i = 0; i < out.size(); ++i) out[i] = table.GetTable(static_cast<int>(i));
    return out;
}

TEST(CorresTable, InitAndConstruction) {
    CCorresTable table;
    EXPECT_EQ(table.GetEntryCount(), 0);
    EXPECT_EQ(table.GetTable(0), 0.0f);  // no array: nothing is read
    ASSERT_TRUE(table.Init(2, 1));
    EXPECT_EQ(table.GetEntryCount(), 25);
    EXPECT_FALSE(table.Init(-1, 1));
    EXPECT_EQ(table.GetRadius(), 2);
    EXPECT_EQ(table.GetEntryCount(), 25);
    EXPECT_EQ(table.GetTable(-1), 0.0f);
    EXPECT_EQ(table.GetTable(25), 0.0f);
    EXPECT_THROW(CCorresTable(-3, 1), CCorresTableInitErrT);
}

TEST(CorresTable, CorrelationCalcIsTheMeanProductOverTheClippedWindow) {
    CImage a = Uniform(9, 7, 10), b = Uniform(6, 8, 20);
    for (CPoint pa : {CPoint(4, 3), CPoint(0, 0), CPoint(8, 6)})
        for (int n : {0, 1, 3, 10}) {
            CPoint pb(5, 0);
            EXPECT_EQ(CCorresTable::CorrelationCalc(a, b, pa, pb, n), 200.0f);
        }
    // A window that leaves an image entirely has no terms.
    CPoint inside(2, 2), outside(-5, 2);
    EXPECT_EQ(CCorresTable::CorrelationCalc(a, b, outside, inside, 2), 0.0f);
    // Clipping keeps only the overlap: a 1-pixel window at a's corner sees one product.
    CImage c = Noise(5, 5, 1), d = Noise(5, 5, 2);
    CPoint corner(0, 0), far(4, 4);
    EXPECT_EQ(CCorresTable::CorrelationCalc(c, d, corner, far, 4),
              static_cast<float>(*c.GetPtrXY(0, 0) * *d.GetPtrXY(4, 4)));
}

TEST(CorresTable, RadiusZeroGivesOneOrZero) {
    CCorresTable table(0, 2);
    CImage bright = Uniform(10, 10, 50), black = Uniform(10, 10, 0);
    table.BuildTable(bright, bright, CPoint(5, 5), CPoint(0, 0));
    EXPECT_TRUE(table.IsBuilt());
    EXPECT_EQ(table.GetTable(0), 1.0f);
    table.BuildTable(black, bright, CPoint(5, 5), CPoint(0, 0));
    EXPECT_TRUE(table.IsBuilt());
    EXPECT_EQ(table.GetTable(0), 0.0f);
}

TEST(CorresTable, BlackImagesKeepEveryEntryZero) {
    CCorresTable table(2, 1);
    CImage black = Uniform(20, 20, 0);
    table.BuildTable(black, black, CPoint(10, 10), CPoint(1, -1));
    EXPECT_TRUE(table.IsBuilt());
    for (float e : Entries(table)) EXPECT_EQ(e, 0.0f);
}

TEST(CorresTable, RefusedBuildLeavesTheTable) {
    CImage a = Noise(20, 20, 3), b = Noise(20, 20, 4);
    CCorresTable table(2, 3);
    table.BuildTable(a, b, CPoint(10, 10), CPoint(0, 0));
    ASSERT_TRUE(table.IsBuilt());
    const std::vector<float> before = Entries(table);

    // The centre p + q is tested against a: (10 + 7) + 3 reaches a's last column.
    table.BuildTable(a, b, CPoint(10, 10), CPoint(7, 0));
    EXPECT_FALSE(table.IsBuilt());
    EXPECT_EQ(Entries(table), before);
    table.BuildTable(a, b, CPoint(2, 10), CPoint(0, 0));
    EXPECT_FALSE(table.IsBuilt());
    CImage colour(20, 20, 24);
    table.BuildTable(a, colour, CPoint(10, 10), CPoint(0, 0));
    EXPECT_FALSE(table.IsBuilt());
    EXPECT_EQ(Entries(table), before);
    // Huge shifts must not wrap around into the image.
    table.BuildTable(a, b, CPoint(10, 10), CPoint(0x7fffffff, 0x7fffffff));
    EXPECT_FALSE(table.IsBuilt());

    CCorresTable empty;
    empty.BuildTable(a, b, CPoint(10, 10), CPoint(0, 0));
    EXPECT_FALSE(empty.IsBuilt());
}

TEST(CorresTable, ClippedSearchAreaPacksEntriesAndFillsTheTail) {
    // b is narrower than a, so the area around c = (3, 8) loses a column at b's left edge
    // and columns past b's right edge; p's own window is clipped by a's top.
    CImage a = Noise(16, 16, 5), b = Noise(6, 16, 6);
    b.GetPtrXY(0, 6)[0] = 0;  // some scores may come out 0.0 and become 1.0
    const int r = 4, n = 2, s = 2 * r + 1;
    CCorresTable table(r, n);
    CPoint p(2, 1), q(1, 7);
    table.BuildTable(a, b, p, q);
    ASSERT_TRUE(table.IsBuilt());

    std::vector<float> expected;
    for (int v = 4; v <= 12; ++v)
        for (int u = 0; u <= 5; ++u) {
            CPoint pb(u, v);
            expected.push_back(CCorresTable::CorrelationCalc(a, b, p, pb, n));
        }
    float sum = 0.0f;
    for (float e : expected) sum += e;
    sum += static_cast<float>(s * s - static_cast<int>(expected.size()));
    expected.resize(s * s, 1.0f);
    for (float& e : expected) e = (e == 0.0f ? 1.0f : e) / sum;

    const std::vector<float> entries = Entries(table);
    ASSERT_EQ(entries.size(), expected.size());
    EXPECT_EQ(0, std::memcmp(entries.data(), expected.data(), entries.size() * sizeof(float)));
    EXPECT_EQ(entries.back(), 1.0f / sum);
}

TEST(CorresTable, SumTablesNeedsOneRadius) {
    CImage a = Noise(20, 20, 7), b = Noise(20, 20, 8);
    CCorresTable two(2, 1), twoB(2, 2), three(3, 1);
    two.BuildTable(a, b, CPoint(9, 9), CPoint(0, 0));
    twoB.BuildTable(a, b, CPoint(8, 9), CPoint(1, 1));
    three.BuildTable(a, b, CPoint(9, 9), CPoint(0, 0));

    const std::vector<float> threeBefore = Entries(three);
    two.SumTables(three, three);
    three.SumTables(two, three);
    EXPECT_EQ(Entries(three), threeBefore);

    CCorresTable out(2, 0);
    two.SumTables(twoB, out);
    for (int i = 0; i < 25; ++i) EXPECT_EQ(out.GetTable(i), twoB.GetTable(i) + two.GetTable(i));
    EXPECT_FALSE(out.IsBuilt());

    // A default table also has radius 0 but no array: nothing is read or written.
    CCorresTable none, zero(0, 1);
    zero.SumTables(none, zero);
    none.SumTables(zero, zero);
    EXPECT_EQ(zero.GetTable(0), 0.0f);
}

// The fast scorer must reproduce the plain score bit for bit: clipped windows on every
// side, odd and even sizes, windows wider than a vector, and bright images whose sums
// pass 2^24 (where float rounding starts).
TEST(CorresTable, FastScoresMatchPlainScores) {
    struct Case {
        int wa, ha, wb, hb, lo;
        CPoint p;
        SearchArea area;
        int n;
    };
    const Case cases[] = {
        {31, 30, 29, 32, 0, {15, 14}, {5, 25, 4, 24}, 7},
        {31, 30, 29, 32, 0, {1, 28}, {0, 28, 0, 31}, 7},
        {17, 18, 20, 19, 0, {8, 9}, {0, 19, 0, 18}, 0},
        {17, 18, 20, 19, 0, {8, 9}, {3, 16, 2, 15}, 1},
        {40, 41, 41, 40, 200, {20, 20}, {10, 30, 11, 29}, 12},  // sums past 2^24
        {40, 41, 41, 40, 250, {20, 20}, {0, 40, 0, 39}, 8},
        {24, 23, 22, 25, 0, {11, 11}, {0, 21, 0, 24}, 11},
        {12, 12, 12, 12, 0, {-3, 5}, {0, 11, 0, 11}, 2},        // p's window outside a
        {300, 8, 300, 8, 230, {150, 4}, {60, 240, 2, 5}, 91},   // beyond the fast width
    };
    for (int64_t target : hwy::SupportedAndGeneratedTargets()) {
        hwy::SetSupportedTargetsForTest(target);
        unsigned seed = 11;
        for (const Case& c : cases) {
            CImage a = Noise(c.wa, c.ha, seed++, c.lo), b = Noise(c.wb, c.hb, seed++, c.lo);
            const size_t count = static_cast<size_t>(c.area.Rows()) * c.area.Columns();
            std::vector<float> plain(count, -1.0f), fast(count, -2.0f);
            varnoth::coding::ScoreSearchAreaPlain(a, b, c.p, c.area, c.n, plain.data());
            varnoth::coding::ScoreSearchArea(a, b, c.p, c.area, c.n, fast.data());
            EXPECT_EQ(0, std::memcmp(plain.data(), fast.data(), count * sizeof(float)))
                << hwy::TargetName(target) << ", window " << c.n;
        }
    }
    hwy::SetSupportedTargetsForTest(0);
}

}  // namespace
