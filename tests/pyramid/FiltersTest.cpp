#include <gtest/gtest.h>

#include <vector>

#include <hwy/targets.h>

#include "frame/ArithmeticInternal.h"
#include "imagelib/Parallel.h"
#include "pyramid/FiltersInternal.h"
#include "pyramid/Pyramid.h"
#include "pyramid/PyramidTestUtil.h"

#ifdef VARNOTH_HAVE_OPENCV
#include <opencv2/imgproc.hpp>
#endif

using pyramid_test::FillRowPixels;
using pyramid_test::Flat;
using pyramid_test::RandomImage;
using pyramid_test::SameBytes;

namespace {

// A pyramid whose work buffer fits images up to 512 x 512 x 3.
CPyramid& Filters() {
    static CPyramid pyramid(1, 512, 512, 3);
    return pyramid;
}

}  // namespace

TEST(PyramidFilters, ConstantImagesStayConstant) {
    for (int bits : {8, 24}) {
        CImage src = Flat(13, 10, bits, 77), small(7, 5, bits), big(13, 10, bits);
        Filters().Reduce(src, small);
        Filters().Expand(small, big);
        for (int y = 0; y < 5; ++y)
            for (int x = 0; x < 7 * bits / 8; ++x) ASSERT_EQ(small.GetPtrXY(0, y)[x], 77);
        for (int y = 0; y < 10; ++y)
            for (int x = 0; x < 13 * bits / 8; ++x) ASSERT_EQ(big.GetPtrXY(0, y)[x], 77);
    }
}

// Identical rows make the vertical pass a plain scale by 16 (reduce) or 8 (expand), so each
// output shows its horizontal formula with the final truncating shift.
TEST(PyramidFilters, ReduceWorkedRows) {
    CImage five(5, 5, 8), three(3, 3, 8);
    for (int y = 0; y < 5; ++y) FillRowPixels(five, y, {10, 20, 30, 40, 50});
    Filters().Reduce(five, three);
    const uint8_t* row = three.GetPtrXY(0, 1);
    EXPECT_EQ(row[0], (16 * (6 * 10 + 8 * 20 + 2 * 30)) >> 8);  // 17: truncated, not rounded
    EXPECT_EQ(row[1], (16 * (10 + 80 + 180 + 160 + 50)) >> 8);
    EXPECT_EQ(row[2], (16 * (6 * 50 + 8 * 40 + 2 * 30)) >> 8);

    CImage six(6, 3, 24), out(3, 2, 24);
    for (int y = 0; y < 3; ++y) FillRowPixels(six, y, {0, 0, 255, 0, 0, 0});
    Filters().Reduce(six, out);
    EXPECT_EQ(out.GetPtrXY(0, 0)[0], (16 * 2 * 255) >> 8);
    EXPECT_EQ(out.GetPtrXY(1, 0)[2], (16 * 6 * 255) >> 8);  // output 1 sits on source pixel 2
    EXPECT_EQ(out.GetPtrXY(2, 0)[1], 0);                    // output 2 sits on source pixel 5
}

TEST(PyramidFilters, ExpandWorkedRows) {
    const int p0 = 16, p1 = 80, p2 = 200;
    CImage src(3, 3, 8);
    for (int y = 0; y < 3; ++y) FillRowPixels(src, y, {p0, p1, p2});
    const std::vector<int> odd = {6 * p0 + 2 * p1, 4 * (p0 + p1), p0 + 6 * p1 + p2, 4 * (p1 + p2), 4 * (p2 + p1)};
    const std::vector<int> even = {6 * p0 + 2 * p1, 4 * (p0 + p1), p0 + 6 * p1 + p2, 4 * (p1 + p2),
                                   6 * p2 + 2 * p1, 4 * (p2 + p1)};
    for (const auto& expected : {odd, even}) {
        CImage dst(static_cast<int>(expected.size()), 5, 8);
        Filters().Expand(src, dst);
        for (size_t x = 0; x < expected.size(); ++x) EXPECT_EQ(dst.GetPtrXY(0, 2)[x], expected[x] >> 3) << x;
    }
}

// Reduce takes rows in memory order and Expand through GetPtrXY, so their border rules sit at
// opposite ends of the image.
TEST(PyramidFilters, BorderRowsFollowRowAddressing) {
    CImage src(3, 6, 8), reduced(3 - 1, 3, 8);
    for (int m = 0; m < 6; ++m) std::fill_n(src.GetBits() + m * src.GetSpan(), 3, m == 2 ? 255 : 0);
    Filters().Reduce(src, reduced);
    const int span = reduced.GetSpan();
    EXPECT_EQ(reduced.GetBits()[0], (16 * 2 * 255) >> 8);
    EXPECT_EQ(reduced.GetBits()[span], (16 * 6 * 255) >> 8);  // memory row 1 on memory row 2
    EXPECT_EQ(reduced.GetBits()[2 * span], 0);                 // memory row 2 on memory row 5

    const int r0 = 40, r1 = 100, r2 = 220;
    CImage coarse(3, 3, 8), fine(6, 6, 8);
    FillRowPixels(coarse, 0, {r0, r0, r0});
    FillRowPixels(coarse, 1, {r1, r1, r1});
    FillRowPixels(coarse, 2, {r2, r2, r2});
    Filters().Expand(coarse, fine);
    const int expected[6] = {6 * r0 + 2 * r1, 4 * (r0 + r1), r0 + 6 * r1 + r2, 4 * (r1 + r2), 4 * (r1 + r2),
                             6 * r2 + 2 * r1};
    for (int y = 0; y < 6; ++y) EXPECT_EQ(fine.GetPtrXY(3, y)[0], expected[y] >> 3) << y;
}

TEST(PyramidFilters, Impulses) {
    CImage src(9, 9, 8), dst(5, 5, 8);
    src.GetBits()[1 * src.GetSpan() + 1] = 255;
    Filters().Reduce(src, dst);
    EXPECT_EQ(dst.GetBits()[0], 63);  // mirrored borders weigh the second pixel 8

    src.Set(0);
    src.GetPtrXY(4, 4)[0] = 255;
    Filters().Reduce(src, dst);
    int peak = 0;
    for (size_t i = 0; i < dst.GetSize(); ++i) peak = std::max<int>(peak, dst.GetBits()[i]);
    EXPECT_EQ(peak, 35);
}

TEST(PyramidFilters, RefuseWhatTheyCannotFilter) {
    struct Case {
        int sw, sh, sbits, dw, dh, dbits;
        bool reduce;
    };
    const Case cases[] = {
        {2, 5, 8, 2, 3, 8, true},     // source narrower than 3
        {9, 9, 8, 4, 5, 8, true},     // destination not the next level
        {9, 9, 8, 5, 5, 24, true},    // depths differ
        {9, 9, 16, 5, 5, 16, true},   // label images
        {1, 4, 8, 1, 6, 8, false},    // expand source narrower than 2
        {5, 5, 8, 10, 8, 8, false},   // destination not the finer level
    };
    for (const Case& c : cases) {
        CImage src = RandomImage(c.sw, c.sh, c.sbits, 1), dst = RandomImage(c.dw, c.dh, c.dbits, 2);
        const CImage before = dst;
        c.reduce ? Filters().Reduce(src, dst) : Filters().Expand(src, dst);
        EXPECT_TRUE(SameBytes(dst, before)) << c.sw << "x" << c.sh << " -> " << c.dw << "x" << c.dh;
    }
    // No work buffer, or one too small for the images.
    CPyramid empty, tiny(1, 4, 4, 1);
    CImage src = RandomImage(40, 40, 8, 3), dst = RandomImage(21, 21, 8, 4);
    const CImage before = dst;
    empty.Reduce(src, dst);
    tiny.Reduce(src, dst);
    EXPECT_TRUE(SameBytes(dst, before));
    CImage self = RandomImage(4, 4, 8, 5);
    tiny.Expand(self, self);  // 4 -> 4 is not a level step, and a filter never works in place
}

namespace {

void ExpectFastMatchesPlain(uint32_t seed) {
    const int widths[] = {3, 4, 5, 6, 7, 8, 9, 15, 16, 17, 31, 32, 33, 63, 64, 65, 66, 100, 129, 255, 256, 300};
    const int heights[] = {3, 4, 5, 8, 11, 37, 64, 101};
    std::vector<int16_t> work(512 * 512 * 3);
    for (int bits : {8, 24})
        for (int w : widths)
            for (int h : heights) {
                const int dw = CPyramid::NextLevelSize(w), dh = CPyramid::NextLevelSize(h);
                const CImage big = RandomImage(w, h, bits, ++seed), small = RandomImage(dw, dh, bits, ++seed);
                CImage plain = RandomImage(dw, dh, bits, ++seed), fast = plain;
                varnoth::PlainReduce(big, plain, work.data());
                varnoth::FastReduce(big, fast, work.data(), work.size());
                ASSERT_TRUE(SameBytes(plain, fast)) << "reduce " << w << "x" << h << " bits " << bits;

                plain = RandomImage(w, h, bits, ++seed);
                fast = plain;
                varnoth::PlainExpand(small, plain, work.data());
                varnoth::FastExpand(small, fast, work.data(), work.size());
                ASSERT_TRUE(SameBytes(plain, fast)) << "expand " << dw << "x" << dh << " bits " << bits;

                // Expand fused with the detail arithmetic of the Laplacian build and collapse.
                for (bool add : {false, true}) {
                    CImage target = RandomImage(w, h, bits, ++seed), expanded(w, h, bits);
                    CImage combined = target;
                    varnoth::PlainExpand(small, expanded, work.data());
                    auto bytes = add ? varnoth::PlainAddBytes : varnoth::PlainSubtractBytes;
                    bytes(target.GetBits(), expanded.GetBits(), target.GetBits(), target.GetSize());
                    ASSERT_TRUE(varnoth::FastExpandCombine(small, combined, add, work.data(), work.size()));
                    ASSERT_TRUE(SameBytes(target, combined)) << "combine " << w << "x" << h << " bits " << bits;
                }
            }
    // A 2-pixel source expands into 2, 3 or 4 pixels.
    for (int d : {2, 3, 4}) {
        const CImage small = RandomImage(2, 2, 24, ++seed);
        CImage plain = RandomImage(d, d, 24, ++seed), fast = plain;
        varnoth::PlainExpand(small, plain, work.data());
        varnoth::FastExpand(small, fast, work.data(), work.size());
        ASSERT_TRUE(SameBytes(plain, fast)) << "expand 2 -> " << d;
    }
}

}  // namespace

// The fast filters against the plain definition, byte for byte over the whole buffers (random
// row padding included), on every vector target this machine runs and at 1 and 2 threads.
TEST(PyramidFilters, FastMatchesPlain) {
    imagelib::SetThreadLimit(1);
    for (int64_t target : hwy::SupportedAndGeneratedTargets()) {
        hwy::SetSupportedTargetsForTest(target);
        hwy::GetChosenTarget().Update(hwy::SupportedTargets());
        SCOPED_TRACE(hwy::TargetName(target));
        ExpectFastMatchesPlain(static_cast<uint32_t>(target));
    }
    hwy::SetSupportedTargetsForTest(0);
    hwy::GetChosenTarget().Update(hwy::SupportedTargets());
    imagelib::SetThreadLimit(2);
    ExpectFastMatchesPlain(99);
    imagelib::SetThreadLimit(0);
}

#ifdef VARNOTH_HAVE_OPENCV
// The reference library rounds where ours truncates: interior pixels differ by at most 1.
TEST(PyramidFilters, ReduceAgreesWithOpenCvInside) {
    for (int bits : {8, 24}) {
        const int ch = bits / 8;
        CImage src = RandomImage(97, 64, bits, 11), dst(49, 32, bits);
        Filters().Reduce(src, dst);
        cv::Mat in(64, 97, ch == 1 ? CV_8UC1 : CV_8UC3, src.GetBits(), src.GetSpan());
        cv::Mat out;
        cv::pyrDown(in, out, cv::Size(49, 32));
        for (int m = 2; m < 30; ++m)
            for (int e = 2 * ch; e < 47 * ch; ++e)
                ASSERT_NEAR(dst.GetBits()[m * dst.GetSpan() + e], out.ptr<uint8_t>(m)[e], 1) << m << "," << e;
    }
}
#endif
