#include <gtest/gtest.h>

#include <atomic>
#include <string>
#include <vector>

#include "imagelib/Parallel.h"
#include "imagelib/Round.h"
#include "imagelib/Trace.h"
#include "imagelib/Types.h"

namespace {
std::wstring g_lines;
void Capture(const wchar_t* line) { g_lines += line; }
}  // namespace

TEST(Trace, SinkReceivesFormattedLinesAndCanBeRestored) {
    const TraceHandler previous = SetTraceHandler(Capture);
    Trace(L"Pyramid creation time: %f\n", 1.5);
    Trace(L"%3d-%s\n", 7, "x");
    EXPECT_EQ(g_lines, L"Pyramid creation time: 1.500000\n  7-x\n");
    EXPECT_EQ(SetTraceHandler(previous), &Capture);
}

TEST(Rect, TouchingEdgesDoNotOverlap) {
    RECT a{0, 0, 5, 5}, b{5, 0, 9, 5}, c{4, 4, 9, 9}, out{1, 1, 1, 1};
    EXPECT_FALSE(IntersectRect(&out, &a, &b));
    EXPECT_EQ(out, RECT{});
    EXPECT_TRUE(IntersectRect(&out, &a, &c));
    EXPECT_EQ(out, (RECT{4, 4, 5, 5}));
    RECT thin{2, 0, 2, 9};  // one pixel wide as a box: overlaps nothing
    EXPECT_FALSE(IntersectRect(&out, &a, &thin));
    EXPECT_TRUE(UnionRect(&out, &a, &c));
    EXPECT_EQ(out, (RECT{0, 0, 9, 9}));
    SetRectEmpty(&out);
    EXPECT_TRUE(IsRectEmpty(&out));
}

TEST(Round, HalvesGoAwayFromZero) {
    EXPECT_EQ(imagelib::round(2.5f), 3);
    EXPECT_EQ(imagelib::round(-2.5f), -3);
    EXPECT_EQ(imagelib::round(2.49f), 2);
}

TEST(Parallel, EveryIndexRunsOnceAtAnyThreadLimit) {
    for (int threads : {1, 2, 0}) {
        imagelib::SetThreadLimit(threads);
        std::vector<std::atomic<int>> hits(1001);
        imagelib::ParallelFor(0, 1001, [&](int b, int e) { for (int i = b; i < e; ++i) ++hits[i]; }, 7);
        for (auto& h : hits) ASSERT_EQ(h.load(), 1);
        std::atomic<int> done{0};
        {
            imagelib::TaskGroup group;
            for (int t = 0; t < 3; ++t) group.Run([&] { ++done; });
            group.Wait();
        }
        EXPECT_EQ(done.load(), 3);
    }
    imagelib::SetThreadLimit(0);
}
