#include <gtest/gtest.h>

#include <algorithm>
#include <cstdlib>
#include <cstring>

#include "pyramid/Fusion.h"
#include "pyramid/PyramidTestUtil.h"

using pyramid_test::Flat;
using pyramid_test::RandomImage;
using pyramid_test::SameBytes;

class CFusionProbe {
public:
    static CPyramid& Result(CFusion& f) { return *f.m_pResult; }
};

namespace {

// Bytes of the pixels only (row padding carries no meaning).
bool SamePixels(const CImage& a, const CImage& b) {
    if (a.GetWidth() != b.GetWidth() || a.GetHeight() != b.GetHeight() || a.GetBitCount() != b.GetBitCount())
        return false;
    const int rowBytes = a.GetWidth() * a.GetBitCount() / 8;
    for (int y = 0; y < a.GetHeight(); ++y)
        if (std::memcmp(a.GetPtrXY(0, y), b.GetPtrXY(0, y), rowBytes) != 0) return false;
    return true;
}

CPyramid Laplacian(const CImage& image, int levels) {
    CPyramid p(levels, image);
    p.MakeLaplacian();
    return p;
}

}  // namespace

TEST(Fusion, IdenticalImagesGiveTheirOwnReconstruction) {
    const CImage image = RandomImage(70, 50, 8, 1);
    CFusion f(4, 2);
    EXPECT_TRUE(f.AddImage(image, CPoint()));
    EXPECT_FALSE(f.IsFuseReady());
    EXPECT_TRUE(f.AddImage(image, CPoint()));
    EXPECT_TRUE(f.IsFuseReady());
    CPyramid own = Laplacian(image, 4);
    own.ReconstructGaussian();
    EXPECT_TRUE(SamePixels(f.Fuse(), own.GetLevel(0)));
}

TEST(Fusion, RefusalsAndLifecycle) {
    CFusion f(6, 2);
    EXPECT_FALSE(f.AddImage(RandomImage(64, 64, 8, 2)));  // not larger than 2^6
    EXPECT_TRUE(f.AddImage(RandomImage(65, 65, 8, 3)));
    EXPECT_FALSE(f.AddImage(RandomImage(66, 65, 8, 4)));
    EXPECT_FALSE(f.AddImage(RandomImage(65, 65, 24, 4)));
    EXPECT_FALSE(f.IsFuseReady());
    EXPECT_TRUE(f.Fuse().IsEmpty());
    EXPECT_TRUE(f.AddImage(RandomImage(65, 65, 8, 5)));
    EXPECT_TRUE(f.IsFuseReady());
    EXPECT_EQ(f.Fuse().GetWidth(), 65);

    CFusion never;
    EXPECT_FALSE(never.IsFuseReady());
    EXPECT_TRUE(never.Fuse().IsEmpty());
    EXPECT_FALSE(never.AddImage(RandomImage(65, 65, 8, 6)));
    for (auto [levels, images] : {std::pair{0, 2}, {31, 2}, {5, 3}, {5, 1}}) {
        CFusion bad(levels, images);
        EXPECT_FALSE(bad.AddImage(RandomImage(65, 65, 8, 7))) << levels << " " << images;
        EXPECT_FALSE(bad.NegateImage(RandomImage(120, 120, 8, 7)));
        EXPECT_FALSE(bad.IsFuseReady());
    }
}

TEST(Fusion, BlendMaps) {
    const int levels = 3;
    const CImage a = RandomImage(40, 30, 24, 8), b = RandomImage(40, 30, 24, 9);
    for (int value : {0, 255}) {
        CFusion f(levels, 2);
        f.SetMap(Flat(40, 30, 8, static_cast<uint8_t>(value)));
        f.AddImage(a);
        f.AddImage(b);
        CPyramid expected = Laplacian(value == 0 ? a : b, levels);
        for (int k = 0; k < levels; ++k) {
            CImage& level = expected.GetLevel(k);
            for (size_t i = 0; i < level.GetSize(); ++i) level.GetBits()[i] = (level.GetBits()[i] * 255) >> 8;
            EXPECT_TRUE(SamePixels(CFusionProbe::Result(f).GetLevel(k), level)) << value << " level " << k;
        }
    }
}

// Flat images: every detail byte is 128, so only the coarsest rule shapes the result.
TEST(Fusion, MapOfWrongSizeOrLevelCountFallsBackToDetailRule) {
    const int levels = 3;
    const CImage dark = Flat(40, 30, 8, 100), bright = Flat(40, 30, 8, 200);
    CFusion plain(levels, 2);
    plain.AddImage(dark);
    plain.AddImage(bright);
    EXPECT_EQ(plain.Fuse().GetPtrXY(20, 15)[0], 150 + levels - 1);  // coarsest: the mean

    CFusion wrongSize(levels, 2), wrongCount(levels + 1, 2);
    wrongSize.SetMap(Flat(41, 30, 8, 0));
    wrongCount.SetMap(Flat(40, 30, 8, 0));
    wrongCount.Init(levels, 2);
    for (CFusion* f : {&wrongSize, &wrongCount}) {
        f->AddImage(dark);
        f->AddImage(bright);
        // Coarsest by the detail measure, in place in raster order: the first inner pixel ties
        // and takes B, which makes its right neighbour's measure on A win; the ring keeps A.
        const CImage& coarsest = CFusionProbe::Result(*f).GetLevel(levels - 1);
        EXPECT_EQ(coarsest.GetPtrXY(1, 1)[0], 200);
        EXPECT_EQ(coarsest.GetPtrXY(2, 1)[0], 100);
        EXPECT_EQ(coarsest.GetPtrXY(3, 1)[0], 200);
        EXPECT_EQ(coarsest.GetPtrXY(0, 3)[0], 100);
    }
}

TEST(Fusion, StitchesFourImagesWithOffsets) {
    const int w = 301, h = 40, levels = 2;
    CImage images[4];
    CFusion f(levels, 4);
    for (int i = 0; i < 4; ++i) {
        images[i] = RandomImage(w, h, 24, 20 + i);
        EXPECT_TRUE(f.AddImage(images[i], i == 1 ? CPoint(0, 150) : CPoint(150, 150)));
    }
    const CImage& r = CFusionProbe::Result(f).GetLevel(0);
    ASSERT_EQ(r.GetWidth(), 2 * w);
    const CPyramid p3 = Laplacian(images[3], levels), p2 = Laplacian(images[2], levels);
    const CPyramid p1 = Laplacian(images[1], levels), p0 = Laplacian(images[0], levels);
    for (int y : {0, h / 2 - 1, h / 2, h - 1}) {
        const CImage& left = y < h / 2 ? p3.GetLevel(0) : p2.GetLevel(0);
        const CImage& right = y < h / 2 ? p1.GetLevel(0) : p0.GetLevel(0);
        EXPECT_EQ(std::memcmp(r.GetPtrXY(w - 151, y), left.GetPtrXY(0, y), 151 * 3), 0) << y;
        EXPECT_EQ(r.GetPtrXY(w - 152, y)[2], 255);
        const int rightStart = y < h / 2 ? 0 : 150;  // image 1 from pixel 0, image 0 from 150
        EXPECT_EQ(std::memcmp(r.GetPtrXY(w, y), right.GetPtrXY(rightStart, y), (w - rightStart) * 3), 0) << y;
        if (rightStart == 150) {
            EXPECT_EQ(r.GetPtrXY(2 * w - 150, y)[0], 255);
        }
    }
    // Level 1 is 2 * 151 - 1 wide: image 1's run from pixel 0 is cut to the room left.
    const CImage& r1 = CFusionProbe::Result(f).GetLevel(1);
    ASSERT_EQ(r1.GetWidth(), 301);
    EXPECT_EQ(std::memcmp(r1.GetPtrXY(151, 0), p1.GetLevel(1).GetPtrXY(0, 0), 150 * 3), 0);
    EXPECT_EQ(f.Fuse().GetWidth(), 2 * w);
}

TEST(Fusion, NegationThresholds) {
    const int levels = 3;
    const CImage image = RandomImage(101, 101, 24, 30);
    CFusion f(levels, 2);
    EXPECT_FALSE(f.NegateImage(RandomImage(100, 101, 24, 31)));
    CFusion tooManyLevels(7, 2);
    EXPECT_FALSE(tooManyLevels.NegateImage(image));
    ASSERT_TRUE(f.NegateImage(image));
    ASSERT_TRUE(f.NegateImage(image));
    const CPyramid original = Laplacian(image, levels);
    const CPyramid& negated = CFusionProbe::Result(f);
    EXPECT_EQ(negated.GetLevel(levels - 1).GetBits()[0], 0);
    for (int k = 0; k < levels - 1; ++k) {
        const CImage& a = negated.GetLevel(k);
        const CImage& b = original.GetLevel(k);
        for (int y = 0; y < a.GetHeight(); ++y)
            for (int x = 0; x < a.GetWidth(); ++x) {
                const unsigned char* pb = b.GetPtrXY(x, y);
                const int peak = std::max({pb[0], pb[1], pb[2]});
                const bool ring = x == 0 || y == 0 || x == a.GetWidth() - 1 || y == a.GetHeight() - 1;
                const bool flat = ring ? false : (std::abs(peak - 127) <= 3 || std::abs(peak - 127) >= 20);
                for (int c = 0; c < 3; ++c)
                    ASSERT_EQ(a.GetPtrXY(x, y)[c], flat ? 127 : pb[c]) << k << " " << x << "," << y;
            }
    }
}

// A 24-bit row 17 pixels wide ends in one padding byte; the spread rule must not treat the
// padding and the next row's first two bytes as a pixel.
TEST(Fusion, WholePixelsOnlyAtOddWidths) {
    CImage a(17, 5, 24), b(17, 5, 24);
    for (int y = 0; y < 5; ++y) {
        unsigned char* pa = a.GetPtrXY(0, y);
        unsigned char* pb = b.GetPtrXY(0, y);
        for (int x = 0; x < 17; ++x) {
            pa[3 * x] = 50, pa[3 * x + 1] = 200, pa[3 * x + 2] = 50;  // spread 150: A wins
            pb[3 * x] = pb[3 * x + 1] = pb[3 * x + 2] = 0;
        }
        pb[51] = 255;  // B's padding would make the straddling "pixel" win
    }
    CFusion f(1, 2);
    f.AddImage(a);
    f.AddImage(b);
    EXPECT_TRUE(SamePixels(f.Fuse(), a));
}

TEST(Fusion, KeepsTheSharpHalfOfEach) {
    const int w = 128, h = 96, levels = 4;
    CImage sharp(w, h, 8), blurred(w, h, 8);
    for (int y = 0; y < h; ++y)
        for (int x = 0; x < w; ++x) sharp.GetPtrXY(x, y)[0] = ((x / 3 + y / 3) % 2) ? 170 : 80;
    for (int y = 0; y < h; ++y)
        for (int x = 0; x < w; ++x) {
            int sum = 0;
            for (int dy = -2; dy <= 2; ++dy)
                for (int dx = -2; dx <= 2; ++dx)
                    sum += sharp.GetPtrXY(std::clamp(x + dx, 0, w - 1), std::clamp(y + dy, 0, h - 1))[0];
            blurred.GetPtrXY(x, y)[0] = static_cast<unsigned char>(sum / 25);
        }
    CImage a = blurred, b = blurred;
    for (int y = 0; y < h; ++y) {
        std::memcpy(a.GetPtrXY(0, y), sharp.GetPtrXY(0, y), w / 2);
        std::memcpy(b.GetPtrXY(w / 2, y), sharp.GetPtrXY(w / 2, y), w / 2);
    }
    CFusion f(levels, 2);
    f.AddImage(a);
    f.AddImage(b);
    const CImage& result = f.Fuse();
    for (int half = 0; half < 2; ++half) {
        long fusedError = 0, blurError = 0;
        for (int y = 8; y < h - 8; ++y)
            for (int x = half * w / 2 + 8; x < (half + 1) * w / 2 - 8; ++x) {
                fusedError += std::abs(result.GetPtrXY(x, y)[0] - (levels - 1) - sharp.GetPtrXY(x, y)[0]);
                blurError += std::abs(blurred.GetPtrXY(x, y)[0] - sharp.GetPtrXY(x, y)[0]);
            }
        EXPECT_LT(fusedError * 5, blurError) << "half " << half;
    }
}
