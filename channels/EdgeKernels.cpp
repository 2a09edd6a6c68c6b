// The column pass of the run-peak rule, a vector of columns at a time (Highway, chosen at run
// time). Each lane makes the choices StepRunPeak makes for its column; marks are written
// lane by lane, since each goes to the row of its own column's peak.
#undef HWY_TARGET_INCLUDE
#define HWY_TARGET_INCLUDE "channels/EdgeKernels.cpp"
#include <hwy/foreach_target.h>  // IWYU pragma: keep
#include <hwy/highway.h>

#include <cstdint>

#include "channels/CheatIRInternal.h"

HWY_BEFORE_NAMESPACE();
namespace channels {
namespace HWY_NAMESPACE {
namespace hn = hwy::HWY_NAMESPACE;

// Steps the whole vectors of columns from 0; returns the first column left for the caller.
int StepColumnPeaksLanes(ColumnPeakStates& states, const int16_t* d, int width, int32_t y, uint8_t* const* edgeRows) {
    const hn::ScalableTag<int32_t> di;
    const hn::Rebind<int16_t, decltype(di)> d16;
    const int lanes = static_cast<int>(hn::Lanes(di));
    const auto zero = hn::Zero(di);
    const auto falling = hn::Set(di, RunPeakState::kFalling);
    const auto rising = hn::Set(di, RunPeakState::kRising);
    const auto row = hn::Set(di, y);
    int32_t* state = states.state.data();
    int32_t* minimum = states.minimum.data();
    int32_t* maximum = states.maximum.data();
    int32_t* peak = states.peak.data();
    int x = 0;
    for (; x + lanes <= width; x += lanes) {
        const auto dv = hn::PromoteTo(di, hn::LoadU(d16, d + x));
        auto st = hn::LoadU(di, state + x);
        auto mn = hn::LoadU(di, minimum + x);
        auto mx = hn::LoadU(di, maximum + x);
        auto pk = hn::LoadU(di, peak + x);
        const auto negative = hn::Lt(dv, zero);
        const auto positive = hn::Gt(dv, zero);
        const auto endsRising = hn::And(negative, hn::Eq(st, rising));
        const auto endsFalling = hn::And(positive, hn::Eq(st, falling));
        const auto ends = hn::Or(endsRising, endsFalling);
        if (!hn::AllFalse(di, ends)) {
            uint8_t endBits[8] = {}, risingBits[8] = {};
            hn::StoreMaskBits(di, ends, endBits);
            hn::StoreMaskBits(di, endsRising, risingBits);
            uint64_t endMask = 0, risingMask = 0;
            for (int i = 0; i < 8; ++i) {
                endMask |= static_cast<uint64_t>(endBits[i]) << (8 * i);
                risingMask |= static_cast<uint64_t>(risingBits[i]) << (8 * i);
            }
            for (; endMask != 0; endMask &= endMask - 1) {
                const int lane = static_cast<int>(hwy::Num0BitsBelowLS1Bit_Nonzero64(endMask));
                const bool risingEnd = (risingMask >> lane) & 1;
                edgeRows[peak[x + lane]][x + lane] = risingEnd ? kRisingPeak : kFallingPeak;
            }
        }
        mx = hn::IfThenZeroElse(endsRising, mx);
        mn = hn::IfThenZeroElse(endsFalling, mn);
        st = hn::IfThenElse(negative, falling, hn::IfThenElse(positive, rising, st));
        const auto newMinimum = hn::And(negative, hn::Lt(dv, mn));
        const auto newMaximum = hn::And(positive, hn::Gt(dv, mx));
        mn = hn::IfThenElse(newMinimum, dv, mn);
        mx = hn::IfThenElse(newMaximum, dv, mx);
        pk = hn::IfThenElse(hn::Or(newMinimum, newMaximum), row, pk);
        hn::StoreU(st, di, state + x);
        hn::StoreU(mn, di, minimum + x);
        hn::StoreU(mx, di, maximum + x);
        hn::StoreU(pk, di, peak + x);
    }
    return x;
}

}  // namespace HWY_NAMESPACE
}  // namespace channels
HWY_AFTER_NAMESPACE();

#if HWY_ONCE
namespace channels {

HWY_EXPORT(StepColumnPeaksLanes);

void StepColumnPeaksPlain(ColumnPeakStates& states, const int16_t* d, int begin, int end, int32_t y,
                          uint8_t* const* edgeRows) {
    for (int x = begin; x < end; ++x) {
        RunPeakState s{states.state[x], states.minimum[x], states.maximum[x], states.peak[x]};
        int32_t marked = 0;
        const uint8_t mark = StepRunPeak(s, d[x], y, marked);
        if (mark != kNoEdge) edgeRows[marked][x] = mark;
        states.state[x] = s.state;
        states.minimum[x] = s.minimum;
        states.maximum[x] = s.maximum;
        states.peak[x] = s.peak;
    }
}

void StepColumnPeaksFast(ColumnPeakStates& states, const int16_t* d, int width, int32_t y, uint8_t* const* edgeRows) {
    const int done = HWY_DYNAMIC_DISPATCH(StepColumnPeaksLanes)(states, d, width, y, edgeRows);
    StepColumnPeaksPlain(states, d, done, width, y, edgeRows);
}

}  // namespace channels
#endif
