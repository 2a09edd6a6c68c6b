#include <gtest/gtest.h>

#include <random>

#include "channels/CheatIRTestAccess.h"

using namespace testpics;
using channels::kUnlabelled;

namespace {

std::deque<SLabelPair> Grouped(std::deque<SLabelPair> pairs, bool iterative) {
    if (iterative)
        channels::GroupLabelPairsIterative(pairs);
    else
        channels::GroupLabelPairs(pairs);
    return pairs;
}

TEST(LabelGrouping, ChainsAndFansEndInOnePairPerMergedLabel) {
    for (bool iterative : {true, false}) {
        EXPECT_EQ(Grouped({{1, 3}, {2, 3}}, iterative), (std::deque<SLabelPair>{{1, 2}, {1, 3}}));
        EXPECT_EQ(Grouped({{0, 1}, {1, 2}}, iterative), (std::deque<SLabelPair>{{0, 1}, {0, 2}}));
        EXPECT_TRUE(Grouped({}, iterative).empty());
    }
}

TEST(LabelGrouping, UnionFindEndsWithTheIterationsList) {
    std::mt19937 random(7);
    for (int trial = 0; trial < 300; ++trial) {
        std::deque<SLabelPair> pairs;
        const int labels = 2 + trial % 40;
        const int count = 1 + static_cast<int>(random() % 30);
        for (int i = 0; i < count; ++i) {
            const uint16_t a = static_cast<uint16_t>(random() % labels), b = static_cast<uint16_t>(random() % labels);
            if (a != b) pairs.push_back({std::min(a, b), std::max(a, b)});
        }
        ASSERT_EQ(Grouped(pairs, true), Grouped(pairs, false)) << "trial " << trial;
    }
}

TEST(LabelGrouping, RelabellingByLookupMatchesThePairScan) {
    CImage scanned(30, 20, 16);
    std::mt19937 random(3);
    for (int y = 0; y < 20; ++y)
        for (int x = 0; x < 30; ++x)
            channels::RowU16(scanned, y)[x] = random() % 3 == 0 ? kUnlabelled : static_cast<uint16_t>(random() % 12);
    CImage looked = scanned;
    const std::deque<SLabelPair> pairs = Grouped({{1, 5}, {5, 9}, {2, 3}, {0, 11}}, false);
    channels::RelabelByPairScan(scanned, pairs);
    channels::RelabelByLookup(looked, pairs, 12);
    EXPECT_TRUE(SamePixels(scanned, looked));
    for (int y = 0; y < 20; ++y)
        for (int x = 0; x < 30; ++x) {
            const uint16_t v = Label(looked, x, y);
            EXPECT_TRUE(v != 3 && v != 5 && v != 9 && v != 11) << v;  // merged into 2, 1, 1, 0
        }
}

TEST(GroupBoxes, OnlyOverlappingBoxesMerge) {
    CSafeArray<RECT> boxes(4);
    boxes[0] = RECT{0, 0, 10, 10};
    boxes[1] = RECT{10, 0, 20, 10};  // touches box 0 only
    boxes[2] = RECT{9, 5, 20, 15};   // overlaps box 0 (after which box 0 overlaps box 1)
    channels::MergeOverlappingBoxes(boxes);
    EXPECT_EQ(boxes[0], (RECT{0, 0, 20, 15}));
    EXPECT_EQ(boxes[1], RECT{});
    EXPECT_EQ(boxes[2], RECT{});
    EXPECT_EQ(boxes[3], RECT{});

    CSafeArray<RECT> touching(2);
    touching[0] = RECT{0, 0, 10, 10};
    touching[1] = RECT{10, 0, 20, 10};
    channels::MergeOverlappingBoxes(touching);
    EXPECT_EQ(touching[1], (RECT{10, 0, 20, 10}));
}

TEST(GroupBoxes, BoxesHoldTheirLabelsExtent) {
    CImage labels(12, 10, 16);
    labels.Set(255);
    channels::RowU16(labels, 2)[7] = 1;
    channels::RowU16(labels, 6)[3] = 1;
    channels::RowU16(labels, 4)[5] = 1;
    CSafeArray<RECT> boxes(2);
    channels::BuildGroupBoxes(labels, boxes);
    EXPECT_EQ(boxes[0], RECT{});
    EXPECT_EQ(boxes[1], (RECT{3, 2, 7, 6}));
}

TEST(SegmentSelection, KeepsBoxesReachingTheMiddleHalfOrderedLeftToRight) {
    CSafeArray<RECT> boxes(6);
    boxes[0] = RECT{40, 30, 50, 60};
    boxes[1] = RECT{10, 30, 30, 60};
    boxes[2] = RECT{10, 20, 20, 60};
    boxes[3] = RECT{0, 0, 5, 25};    // wholly in the top quarter of 100
    boxes[4] = RECT{0, 75, 5, 90};   // starts in the bottom quarter
    boxes[5] = RECT{60, 24, 70, 26};  // just reaches the middle half
    std::deque<SSegment> segments;
    channels::SelectSegments(boxes, 100, segments);
    ASSERT_EQ(segments.size(), 4u);
    EXPECT_EQ(segments[0].rect, boxes[2]);
    EXPECT_EQ(segments[1].rect, boxes[1]);
    EXPECT_EQ(segments[2].rect, boxes[0]);
    EXPECT_EQ(segments[3].rect, boxes[5]);
}

TEST(OutlineSampling, SamplesEveryTenthColumnAndRowOfTheMiddle) {
    // An 80-wide segment: columns left + 10 .. left + 60; column 35 has no labels at all.
    CImage labels(100, 80, 16);
    labels.Set(255);
    for (int y = 20; y <= 60; ++y)
        for (int x = 5; x <= 85; ++x)
            if (x != 35) channels::RowU16(labels, y)[x] = 0;
    SSegment segment;
    segment.rect = RECT{5, 20, 85, 60};
    channels::SampleOutline(labels, segment);
    std::deque<CPoint> expected;
    for (int x : {15, 25, 45, 55, 65}) {
        expected.emplace_back(x, 20);
        expected.emplace_back(x, 60);
    }
    // b = min(60, 70) - max(20, 10) = 40, sy = 5: rows 25, 35, 45 (below 60 - 5).
    for (int y : {25, 35, 45}) {
        expected.emplace_back(5, y);
        expected.emplace_back(85, y);
    }
    EXPECT_EQ(segment.points, expected);
}

TEST(SegmentsFind, PlaneWithoutStrokesGivesNoSegmentsAndAWhitePicture) {
    DumpDir dumps("varnoth_channels_groups");
    CCheatIR cheat;
    CCheatIRTestAccess::SegmentsFind(cheat, Grey(40, 30, 180));
    EXPECT_TRUE(CCheatIRTestAccess::Segments(cheat).empty());
    CImage picture;
    ASSERT_TRUE(picture.ImportFile(dumps.File("groups.bmp")));
    EXPECT_EQ(picture.GetWidth(), 40);
    EXPECT_TRUE(AllBytes(picture, 255));
}

TEST(SegmentsFind, RingBecomesOneSegmentWithOutlinePoints) {
    CImage src = Grey(80, 80, 200);
    Fill(src, 20, 20, 59, 59, 30);
    Fill(src, 25, 25, 54, 54, 200);  // a ring 5 wide
    // Bars to the right and below close the ring's last runs; being last runs themselves,
    // they are never labelled.
    Fill(src, 70, 0, 72, 79, 30);
    Fill(src, 0, 70, 79, 72, 30);
    DumpDir dumps("varnoth_channels_ring");
    CCheatIR cheat;
    CCheatIRTestAccess::SegmentsFind(cheat, src);
    const std::deque<SSegment>& segments = CCheatIRTestAccess::Segments(cheat);
    ASSERT_EQ(segments.size(), 1u);
    // The picture: white paper, the group's label 0 times 240 / n, the box in red.
    CImage picture;
    ASSERT_TRUE(picture.ImportFile(dumps.File("groups.bmp")));
    ASSERT_EQ(picture.GetBitCount(), 24);  // the red palette entry makes it colour
    auto bgr = [&](int x, int y) {
        const uint8_t* p = picture.GetPtrXY(x, y);
        return (p[0] << 16) | (p[1] << 8) | p[2];
    };
    EXPECT_EQ(bgr(5, 5), 0xFFFFFF);
    EXPECT_EQ(bgr(40, 20), 0x0000FF);
    EXPECT_EQ(bgr(59, 40), 0x0000FF);
    EXPECT_EQ(bgr(22, 40), 0x000000);
    EXPECT_EQ(segments[0].rect, (RECT{20, 20, 59, 59}));
    ASSERT_FALSE(segments[0].points.empty());
    EXPECT_EQ(segments[0].points.front(), CPoint(24, 20));  // sx = 39 / 8 = 4
    for (const CPoint& p : segments[0].points) EXPECT_EQ(At(src, p.x, p.y), 30) << p.x << "," << p.y;
}

}  // namespace
