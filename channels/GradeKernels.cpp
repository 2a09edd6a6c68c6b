// The window grading of one map row, several window positions per vector (Highway, chosen at
// run time). Every lane runs the float operations of channels::GradeAgainst in the same
// order, without contraction, so each grade is the same float as the plain one.
#undef HWY_TARGET_INCLUDE
#define HWY_TARGET_INCLUDE "channels/GradeKernels.cpp"
#include <hwy/foreach_target.h>  // IWYU pragma: keep
#include <hwy/highway.h>

#include <algorithm>

#include "channels/CheatIRInternal.h"

HWY_BEFORE_NAMESPACE();
namespace channels {
namespace HWY_NAMESPACE {
namespace hn = hwy::HWY_NAMESPACE;

// Grades the windows whose top-left pixels are rows[0][0 .. count - 1], a vector of
// positions at a time; a last partial vector is redone overlapping the one before (the same
// positions give the same grades). Returns how many positions it graded: all of them, or
// none when count is below one vector. Reads columns up to count + 3 only.
int GradeRowLanes(const uint8_t* const* rows, int count, const ReferenceStats& ref, float* out) {
    const hn::ScalableTag<float> df;
    const hn::Rebind<int32_t, decltype(df)> di;
    const hn::Rebind<uint8_t, decltype(df)> du8;
    const int lanes = static_cast<int>(hn::Lanes(df));
    const auto zero = hn::Zero(df);
    const auto size = hn::Set(df, 25.0f);
    const auto one = hn::Set(df, 1.0f);
    const auto refSquares = hn::Set(df, ref.sumSquares);
    auto pixels = [&](int i, int j, int first) {
        return hn::ConvertTo(df, hn::PromoteTo(di, hn::LoadU(du8, rows[i] + first + j)));
    };
    if (count < lanes) return 0;
    for (int next = 0; next < count; next += lanes) {
        const int first = std::min(next, count - lanes);
        auto sum = zero;
        for (int i = 0; i < 5; ++i)
            for (int j = 0; j < 5; ++j) sum = hn::Add(sum, pixels(i, j, first));
        const auto mean = hn::Div(sum, size);
        auto squares = zero, cross = zero;
        for (int i = 0; i < 5; ++i)
            for (int j = 0; j < 5; ++j) {
                const auto centred = hn::Sub(pixels(i, j, first), mean);
                squares = hn::Add(squares, hn::Mul(centred, centred));
                cross = hn::Add(cross, hn::Mul(centred, hn::Set(df, ref.centred[5 * i + j])));
            }
        const auto g = hn::Sub(one, hn::Div(cross, hn::Sqrt(hn::Mul(squares, refSquares))));
        // NaN from a uniform window fails the comparison and grades 0, as in the plain code.
        hn::StoreU(hn::IfThenElseZero(hn::Gt(g, zero), g), df, out + first);
    }
    return count;
}

}  // namespace HWY_NAMESPACE
}  // namespace channels
HWY_AFTER_NAMESPACE();

#if HWY_ONCE
namespace channels {

HWY_EXPORT(GradeRowLanes);

void GradeRowPlain(const uint8_t* const* rows, int count, const ReferenceStats& ref, float* out) {
    uint8_t window[25];
    for (int c = 0; c < count; ++c) {
        for (int i = 0; i < 5; ++i) std::copy(rows[i] + c, rows[i] + c + 5, window + 5 * i);
        out[c] = GradeAgainst(window, ref);
    }
}

void GradeRowFast(const uint8_t* const* rows, int count, const ReferenceStats& ref, float* out) {
    if (HWY_DYNAMIC_DISPATCH(GradeRowLanes)(rows, count, ref, out) == 0) GradeRowPlain(rows, count, ref, out);
}

}  // namespace channels
#endif
