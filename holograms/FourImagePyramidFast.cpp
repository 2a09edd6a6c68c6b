// Vector row rules of the two pyramid compositions. The plain rules in FourImagePyramid.cpp
// are the definition; these give the same bytes. HologramsRemove4Img's rule is vectorised
// for its most common case only (no candidate saturated and all detail peaks within 6 of
// each other: the largest peak is copied); every other pixel of a block is redone by the
// plain per-pixel rule.
#undef HWY_TARGET_INCLUDE
#define HWY_TARGET_INCLUDE "holograms/FourImagePyramidFast.cpp"
#include <hwy/foreach_target.h>  // IWYU pragma: keep
#include <hwy/highway.h>

#include "holograms/FourImageInternal.h"
#include "holograms/FourImagePyramidInternal.h"
#include "holograms/FourImageVectorInternal.h"

HWY_BEFORE_NAMESPACE();
namespace holo4 {
namespace HWY_NAMESPACE {

struct Candidates {
    V8 b[4], g[4], r[4];
    V8 peak[4];    // largest detail channel
    V8 bright[4];  // largest Gaussian channel
};

Candidates Load(const D8 d, const unsigned char* const lap[4], const unsigned char* const bright[4], int x) {
    Candidates c;
    for (int i = 0; i < 4; ++i) {
        hn::LoadInterleaved3(d, lap[i] + 3 * x, c.b[i], c.g[i], c.r[i]);
        c.peak[i] = hn::Max(hn::Max(c.b[i], c.g[i]), c.r[i]);
        c.bright[i] = hn::LoadU(d, bright[i] + x);
    }
    return c;
}

void BrightnessRowVector(const unsigned char* pixels, unsigned char* out, int width) {
    const D8 d;
    const int lanes = static_cast<int>(hn::Lanes(d));
    int x = 0;
    for (; x + lanes <= width; x += lanes) hn::StoreU(LargestChannel(d, pixels + 3 * x), d, out + x);
    BrightnessRow(pixels, out, x, width);
}

void ComposeRowVector(const unsigned char* const lap[4], const unsigned char* const bright[4], unsigned char* out,
                      int width) {
    const D8 d;
    const int lanes = static_cast<int>(hn::Lanes(d));
    int x = 0;
    for (; x + lanes <= width; x += lanes) {
        const Candidates c = Load(d, lap, bright, x);
        auto anySaturated = AtLeast(d, c.bright[0], kSaturatedBrightness);
        for (int i = 1; i < 4; ++i) anySaturated = hn::Or(anySaturated, AtLeast(d, c.bright[i], kSaturatedBrightness));
        const V8 largest = hn::Max(hn::Max(c.peak[0], c.peak[1]), hn::Max(c.peak[2], c.peak[3]));
        const V8 smallest = hn::Min(hn::Min(c.peak[0], c.peak[1]), hn::Min(c.peak[2], c.peak[3]));
        const auto wideSpread = AtLeast(d, hn::Sub(largest, smallest), kPeakSpread);
        const auto copyLargest = hn::Not(hn::Or(anySaturated, wideSpread));
        if (!hn::AllFalse(d, copyLargest)) {
            // The earliest candidate holding the largest peak.
            StorePicked(d, hn::Eq(c.peak[0], largest), hn::Eq(c.peak[1], largest), hn::Eq(c.peak[2], largest), c.b,
                        c.g, c.r, out + 3 * x);
        }
        RedoUnhandledLanes(d, copyLargest, x,
                           [&](int begin, int end) { ComposePixels(lap, bright, out, begin, end); });
    }
    ComposePixels(lap, bright, out, x, width);
}

void FlattestUnsaturatedRowVector(const unsigned char* const lap[4], const unsigned char* const bright[4],
                                  unsigned char* out, int width) {
    const D8 d;
    const int lanes = static_cast<int>(hn::Lanes(d));
    int x = 0;
    for (; x + lanes <= width; x += lanes) {
        const Candidates c = Load(d, lap, bright, x);
        // The best value starts above every byte, so the first qualifying candidate always
        // takes it; later ones need a strictly smaller peak.
        auto found = hn::FirstN(d, 0);
        V8 best = hn::Zero(d), b = c.b[0], g = c.g[0], r = c.r[0];
        for (int i = 0; i < 4; ++i) {
            const auto qualifies = hn::Not(AtLeast(d, c.bright[i], kBrightLimit3));
            const auto flatter = hn::Or(hn::Not(found), hn::Lt(c.peak[i], best));
            const auto take = hn::And(qualifies, flatter);
            best = hn::IfThenElse(take, c.peak[i], best);
            b = hn::IfThenElse(take, c.b[i], b);
            g = hn::IfThenElse(take, c.g[i], g);
            r = hn::IfThenElse(take, c.r[i], r);
            found = hn::Or(found, qualifies);
        }
        hn::StoreInterleaved3(b, g, r, d, out + 3 * x);
    }
    FlattestUnsaturatedPixels(lap, bright, out, x, width);
}

}  // namespace HWY_NAMESPACE
}  // namespace holo4
HWY_AFTER_NAMESPACE();

#if HWY_ONCE
namespace holo4 {

HWY_EXPORT(ComposeRowVector);
HWY_EXPORT(FlattestUnsaturatedRowVector);
HWY_EXPORT(BrightnessRowVector);

void BrightnessRowFast(const unsigned char* pixels, unsigned char* out, int width) {
    HWY_DYNAMIC_DISPATCH(BrightnessRowVector)(pixels, out, width);
}

void ComposeRowFast(const unsigned char* const lap[4], const unsigned char* const bright[4], unsigned char* out,
                    int width) {
    HWY_DYNAMIC_DISPATCH(ComposeRowVector)(lap, bright, out, width);
}

void FlattestUnsaturatedRowFast(const unsigned char* const lap[4], const unsigned char* const bright[4],
                                unsigned char* out, int width) {
    HWY_DYNAMIC_DISPATCH(FlattestUnsaturatedRowVector)(lap, bright, out, width);
}

}  // namespace holo4
#endif  // HWY_ONCE
