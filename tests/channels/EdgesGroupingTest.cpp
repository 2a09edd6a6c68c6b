#include <gtest/gtest.h>

#include <random>
#include <vector>

#include <hwy/targets.h>

#include "channels/CheatIRTestAccess.h"

using namespace testpics;
using channels::kUnlabelled;

namespace {

// Dark (40) vertical bars on 200, full height; each bar is {first column, width}.
CImage Bars(int w, int h, std::vector<std::pair<int, int>> bars) {
    CImage img = Grey(w, h, 200);
    for (auto [x0, width] : bars) Fill(img, x0, 0, x0 + width - 1, h - 1, 40);
    return img;
}

struct Edges {
    CImage dr, dc, er, ec, labels;
    int n = 0;
    CCheatIR cheat;
    explicit Edges(const CImage& src)
        : dr(src.GetWidth(), src.GetHeight(), 16), dc(src.GetWidth(), src.GetHeight(), 16),
          er(src.GetWidth(), src.GetHeight(), 8), ec(src.GetWidth(), src.GetHeight(), 8),
          labels(src.GetWidth(), src.GetHeight(), 16) {
        labels.Set(255);
        CCheatIRTestAccess::EdgesFind(cheat, dr, dc, er, ec, src);
    }
    void GroupRows() { CCheatIRTestAccess::InitialGrouping(cheat, dr, er, labels, n); }
    std::deque<SLabelPair>& Pairs() { return CCheatIRTestAccess::Pairs(cheat); }
};

TEST(EdgesFind, UniformSourceMarksAndLabelsNothing) {
    Edges e(Grey(20, 15, 77));
    EXPECT_TRUE(AllBytes(e.dr, 0) && AllBytes(e.dc, 0));
    EXPECT_TRUE(AllBytes(e.er, 128) && AllBytes(e.ec, 128));
    e.n = 7;
    e.GroupRows();
    EXPECT_EQ(e.n, 7);
    EXPECT_TRUE(AllBytes(e.labels, 255));
    EXPECT_TRUE(e.Pairs().empty());
}

TEST(EdgesFind, StepEdgeHasNoPeakAndDerivativesRiseWithBrightness) {
    CImage src = Grey(20, 16, 200);
    Fill(src, 0, 0, 9, 7, 40);  // dark top-left quarter
    Edges e(src);
    EXPECT_TRUE(AllBytes(e.er, 128));
    EXPECT_TRUE(AllBytes(e.ec, 128));
    // Along a row the step at x = 10 gives 2*160 + 160 at x = 9 and 10; along a column
    // (increasing y) the step at y = 8 the same.
    EXPECT_EQ(Deriv(e.dr, 9, 3), 480);
    EXPECT_EQ(Deriv(e.dr, 8, 3), 320);
    EXPECT_EQ(Deriv(e.dc, 3, 8), 480);
    EXPECT_EQ(Deriv(e.dc, 3, 6), 320);
    EXPECT_EQ(Deriv(e.dc, 3, 14), 0);
    EXPECT_EQ(Deriv(e.dr, 1, 3), 0);  // outside the computed columns
}

TEST(EdgesFind, FastColumnPeaksEqualThePlainRule) {
    for (int64_t target : hwy::SupportedAndGeneratedTargets()) {
        hwy::SetSupportedTargetsForTest(target);
        for (int width : {1, 7, 33, 70}) {
            const int height = 60;
            CImage plain(width, height, 8), fast(width, height, 8);
            plain.Set(128);
            fast.Set(128);
            std::vector<uint8_t*> plainRows, fastRows;
            for (int y = 0; y < height; ++y) {
                plainRows.push_back(plain.GetPtrXY(0, y));
                fastRows.push_back(fast.GetPtrXY(0, y));
            }
            channels::ColumnPeakStates plainStates(width), fastStates(width);
            std::mt19937 random(static_cast<unsigned>(width));
            std::vector<int16_t> d(static_cast<size_t>(width));
            for (int y = 0; y < height; ++y) {
                for (int16_t& v : d) v = static_cast<int16_t>(random() % 3 == 0 ? 0 : int(random() % 41) - 20);
                channels::StepColumnPeaksPlain(plainStates, d.data(), 0, width, y, plainRows.data());
                channels::StepColumnPeaksFast(fastStates, d.data(), width, y, fastRows.data());
            }
            EXPECT_TRUE(SamePixels(plain, fast)) << hwy::TargetName(target) << " width " << width;
            EXPECT_EQ(plainStates.peak, fastStates.peak);
            EXPECT_EQ(plainStates.minimum, fastStates.minimum);
        }
    }
    hwy::SetSupportedTargetsForTest(0);
}

TEST(InitialGrouping, NarrowBarGetsOneLabelOnEveryRow) {
    // The first bar's rising peak is marked only because the second bar's falling run follows.
    Edges e(Bars(40, 8, {{10, 5}, {25, 5}}));
    EXPECT_EQ(At(e.er, 9, 3), 0);     // falling peak: first of the two -450s
    EXPECT_EQ(At(e.er, 14, 3), 255);  // rising peak
    EXPECT_EQ(At(e.er, 24, 3), 0);
    EXPECT_EQ(At(e.er, 29, 3), 128);  // the line's last run is never marked
    e.GroupRows();
    EXPECT_EQ(e.n, 1);
    EXPECT_TRUE(e.Pairs().empty());
    for (int y = 0; y < 8; ++y)
        for (int x = 0; x < 40; ++x) {
            const bool inside = y >= 1 && x >= 10 && x <= 13;  // strictly between the peaks
            EXPECT_EQ(Label(e.labels, x, y), inside ? 0 : kUnlabelled) << x << "," << y;
        }
}

TEST(InitialGrouping, BarsOf50OrMoreAreNoStrokes) {
    Edges wide(Bars(120, 4, {{10, 50}, {90, 5}}));
    wide.GroupRows();
    EXPECT_EQ(wide.n, 0);
    EXPECT_TRUE(AllBytes(wide.labels, 255));
    Edges narrow(Bars(120, 4, {{10, 49}, {90, 5}}));
    narrow.GroupRows();
    EXPECT_EQ(narrow.n, 1);
    EXPECT_EQ(Label(narrow.labels, 57, 2), 0);
}

// One row of hand-made peaks: {x, edge value, derivative}.
struct Peak {
    int x;
    uint8_t edge;
    int16_t d;
};

void RunOneRow(CCheatIR& cheat, CImage& labels, int& n, std::vector<Peak> peaks) {
    CImage d(40, 2, 16), e(40, 2, 8);
    e.Set(128);
    for (const Peak& p : peaks) {
        e.GetPtrXY(0, 1)[p.x] = p.edge;
        channels::Row16(d, 1)[p.x] = p.d;
    }
    CCheatIRTestAccess::InitialGrouping(cheat, d, e, labels, n);
}

TEST(InitialGrouping, RunSpansStrongestFallingToStrongestRisingPeak) {
    struct Case {
        std::vector<Peak> peaks;
        int first, last;  // labelled columns
    } cases[] = {
        {{{3, 0, -100}, {6, 0, -200}, {10, 255, 50}, {12, 255, 80}, {15, 0, -5}}, 7, 11},
        {{{3, 0, -200}, {6, 0, -200}, {10, 255, 80}, {12, 255, 80}, {15, 0, -5}}, 4, 9},
        // The walk resumes at the next falling peak, so the second run starts there.
        {{{3, 0, -9}, {5, 255, 9}, {8, 255, 1}, {20, 0, -9}, {24, 255, 9}, {30, 0, -1}}, 4, 23},
    };
    for (const Case& c : cases) {
        CCheatIR cheat;
        CImage labels(40, 2, 16);
        labels.Set(255);
        int n = 0;
        RunOneRow(cheat, labels, n, c.peaks);
        for (int x = 0; x < 40; ++x) {
            const bool inGap = (c.first == 4 && c.last == 23) && x >= 5 && x <= 20;
            const bool labelled = x >= c.first && x <= c.last && !inGap;
            EXPECT_EQ(Label(labels, x, 1) != kUnlabelled, labelled) << "x " << x;
        }
    }
}

TEST(InitialGrouping, UShapeRecordsItsTwoArmsOnce) {
    CImage src = Grey(60, 30, 200);
    Fill(src, 10, 3, 14, 25, 40);   // left arm
    Fill(src, 25, 3, 29, 25, 40);   // right arm
    Fill(src, 10, 21, 29, 25, 40);  // bottom joining them
    Fill(src, 45, 0, 49, 29, 40);   // makes the right arm's rising peak count
    Edges e(src);
    e.GroupRows();
    EXPECT_EQ(e.n, 2);  // the right-hand bar never closes its run
    ASSERT_EQ(e.Pairs().size(), 1u);
    EXPECT_EQ(e.Pairs()[0], (SLabelPair{0, 1}));
    EXPECT_EQ(Label(e.labels, 20, 23), 0);
}

TEST(InitialGrouping, NeverHandsOutTheUnlabelledValue) {
    Edges last(Bars(40, 6, {{10, 5}, {25, 5}}));
    last.n = 65534;
    last.GroupRows();
    EXPECT_EQ(last.n, 65535);
    EXPECT_EQ(Label(last.labels, 11, 5), 65534);  // later rows join the label above

    Edges exhausted(Bars(40, 6, {{10, 5}, {25, 5}}));
    exhausted.n = 65535;
    exhausted.GroupRows();
    EXPECT_EQ(exhausted.n, 65535);
    EXPECT_TRUE(AllBytes(exhausted.labels, 255));
    EXPECT_TRUE(exhausted.Pairs().empty());
}

}  // namespace
