// Vector rows of the stepwise composition. The plain FoldPixels / DecidePixels are the
// definition. Folding is vectorised whole (byte compares and selects); the decision only
// for its commonest case (nothing saturated, peaks within 6: copy the peak farther from
// 127), other lanes are redone by the plain rule.
#undef HWY_TARGET_INCLUDE
#define HWY_TARGET_INCLUDE "holograms/FourImageStepsFast.cpp"
#include <hwy/foreach_target.h>  // IWYU pragma: keep
#include <hwy/highway.h>

#include "holograms/FourImagePyramidInternal.h"
#include "holograms/FourImageStepsInternal.h"
#include "holograms/FourImageVectorInternal.h"

HWY_BEFORE_NAMESPACE();
namespace holo4 {
namespace HWY_NAMESPACE {

void FoldRowVector(uint8_t* const map[9], int step, const unsigned char* bright, const unsigned char* detail,
                   int width) {
    const D8 d;
    const int lanes = static_cast<int>(hn::Lanes(d));
    const V8 flag = hn::Set(d, static_cast<uint8_t>(1u << (4 + step)));
    const V8 stepValue = hn::Set(d, static_cast<uint8_t>(step));
    int x = 0;
    for (; x + lanes <= width; x += lanes) {
        const V8 g = LargestChannel(d, bright + 3 * x);
        const V8 p = LargestChannel(d, detail + 3 * x);

        V8 sat = hn::LoadU(d, map[0] + x);
        const auto saturated = AtLeast(d, g, kSaturatedBrightness);
        const auto count = hn::And(saturated, hn::Eq(hn::And(sat, flag), hn::Zero(d)));
        sat = hn::IfThenElse(count, hn::Or(hn::Add(sat, hn::Set(d, 1)), flag), sat);
        hn::StoreU(sat, d, map[0] + x);

        const V8 minB = hn::LoadU(d, map[1] + x), minBI = hn::LoadU(d, map[2] + x);
        const V8 secB = hn::LoadU(d, map[3] + x), secBI = hn::LoadU(d, map[4] + x);
        const auto newLeast = hn::Lt(g, minB);
        const auto newSecond = hn::AndNot(newLeast, hn::Lt(g, secB));
        hn::StoreU(hn::IfThenElse(newLeast, minB, hn::IfThenElse(newSecond, g, secB)), d, map[3] + x);
        hn::StoreU(hn::IfThenElse(newLeast, minBI, hn::IfThenElse(newSecond, stepValue, secBI)), d, map[4] + x);
        hn::StoreU(hn::IfThenElse(newLeast, g, minB), d, map[1] + x);
        hn::StoreU(hn::IfThenElse(newLeast, stepValue, minBI), d, map[2] + x);

        const V8 maxP = hn::LoadU(d, map[5] + x), minP = hn::LoadU(d, map[7] + x);
        const auto above = hn::Gt(p, maxP), below = hn::Lt(p, minP);
        hn::StoreU(hn::IfThenElse(above, p, maxP), d, map[5] + x);
        hn::StoreU(hn::IfThenElse(above, stepValue, hn::LoadU(d, map[6] + x)), d, map[6] + x);
        hn::StoreU(hn::IfThenElse(below, p, minP), d, map[7] + x);
        hn::StoreU(hn::IfThenElse(below, stepValue, hn::LoadU(d, map[8] + x)), d, map[8] + x);
    }
    FoldPixels(map, step, bright, detail, x, width);
}

void DecideRowVector(uint8_t* const map[9], const unsigned char* const detail[4], unsigned char* out, int width) {
    const D8 d;
    const int lanes = static_cast<int>(hn::Lanes(d));
    int x = 0;
    for (; x + lanes <= width; x += lanes) {
        const V8 sat = hn::LoadU(d, map[0] + x);
        const V8 maxP = hn::LoadU(d, map[5] + x), minP = hn::LoadU(d, map[7] + x);
        const auto noneSaturated = hn::Eq(hn::And(sat, hn::Set(d, 0x0F)), hn::Zero(d));
        const auto narrow = hn::Lt(hn::SaturatedSub(maxP, minP), hn::Set(d, kPeakSpread));
        const auto copyPeak = hn::And(noneSaturated, narrow);
        if (!hn::AllFalse(d, copyPeak)) {
            // (max - 127) <= (127 - min) exactly when max + min <= 254.
            const auto minFarther = hn::Lt(hn::SaturatedAdd(maxP, minP), hn::Set(d, 255));
            const V8 index = hn::And(
                hn::IfThenElse(minFarther, hn::LoadU(d, map[8] + x), hn::LoadU(d, map[6] + x)), hn::Set(d, 3));
            V8 b[4], g[4], r[4];
            for (int i = 0; i < 4; ++i) hn::LoadInterleaved3(d, detail[i] + 3 * x, b[i], g[i], r[i]);
            StorePicked(d, hn::Eq(index, hn::Zero(d)), hn::Eq(index, hn::Set(d, 1)), hn::Eq(index, hn::Set(d, 2)), b,
                        g, r, out + 3 * x);
        }
        RedoUnhandledLanes(d, copyPeak, x, [&](int begin, int end) { DecidePixels(map, detail, out, begin, end); });
    }
    DecidePixels(map, detail, out, x, width);
}

}  // namespace HWY_NAMESPACE
}  // namespace holo4
HWY_AFTER_NAMESPACE();

#if HWY_ONCE
namespace holo4 {

HWY_EXPORT(FoldRowVector);
HWY_EXPORT(DecideRowVector);

void FoldRowFast(uint8_t* const map[9], int step, const unsigned char* bright, const unsigned char* detail,
                 int width) {
    HWY_DYNAMIC_DISPATCH(FoldRowVector)(map, step, bright, detail, width);
}

void DecideRowFast(uint8_t* const map[9], const unsigned char* const detail[4], unsigned char* out, int width) {
    HWY_DYNAMIC_DISPATCH(DecideRowVector)(map, detail, out, width);
}

}  // namespace holo4
#endif  // HWY_ONCE
